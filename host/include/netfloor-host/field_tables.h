// SPDX-License-Identifier: MIT
// The fields of a plug-in as its own tables describe them, without any packet.
//
//     const netfloor::FieldTables tables(netfloor::PluginLibrary::open("build/plugin/libnetfloor.so"));
//     const netfloor::FieldDescription *protocol = tables.find("Protocol");
//     std::cout << protocol->valueName(6) << '\n';    // TCP
//     std::cout << protocol->display(6) << '\n';      // Protocol=TCP
#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <span>
#include <string>
#include <string_view>
#include <unordered_map>
#include <vector>

#include "netfloor-host/plugin_library.h"

namespace netfloor {

// The name of one value, or of all values from `from` to `to`.
struct NamedValue {
    std::uint32_t from = 0;
    std::uint32_t to = 0;
    std::string_view name; // may be a format for the value, such as "%u"

    // The row for every value that has no other one.
    [[nodiscard]] bool isDefault() const { return from > to; }
    [[nodiscard]] bool isRange() const { return from < to; }
    [[nodiscard]] bool holds(std::uint32_t value) const { return from <= value && value <= to; }

    friend bool operator==(const NamedValue &, const NamedValue &) = default;
};

// Bits from `first` to `last`, both included. What bit 1 is, each use says.
struct BitSpan {
    std::uint32_t first = 0;
    std::uint32_t last = 0;

    friend bool operator==(const BitSpan &, const BitSpan &) = default;
};

// Where the bits of a field lie.
struct FieldLayout {
    enum class Kind : std::uint8_t {
        fixed,
        variable, // as long as the packet says
        none,     // not in the tables: the field is read ahead of its turn, or by groups
    };

    Kind kind = Kind::none;
    std::vector<BitSpan> pieces;  // counted from 1 at the cursor; first above last: read with the bits reversed
    std::uint32_t leastCount = 0; // how often the pieces repeat; the same number twice for a fixed field
    std::uint32_t mostCount = 0;  // 0: no bound
    std::uint32_t step = 0;       // bits from one repeat to the next, and from the last one to where the cursor goes

    // Bits by which `count` repeats move the cursor, as the tables have it. In fact id 168, which is shown ahead, does
    // not move it.
    [[nodiscard]] std::uint32_t advance(std::uint32_t count) const { return count * step; }
};

struct FieldDescription {
    std::uint32_t id = 0;
    std::string_view name;              // without leading blanks
    std::string_view shortName;         // without trailing blanks, too, or shorter
    std::uint32_t keyIndex = 0;         // number among the key fields, from 1; 0: none
    std::uint32_t flags = 0;            // FieldDescriptor::flags
    std::optional<std::uint32_t> width; // bits; none: variable
    std::string_view format;            // of the display line: %u %x %c, %-S the name of the value, %-["%x":"."] a list
    std::vector<NamedValue> values;
    FieldLayout layout;
    std::uint32_t layoutOffset = 0; // of the layout's record; fields of one layout share it

    // The row that names `value`: the one for this value, else the range that holds it, else the default.
    [[nodiscard]] const NamedValue *findValue(std::uint32_t value) const;

    // The name of `value`, with a format in it filled in; empty if it has none.
    [[nodiscard]] std::string valueName(std::uint32_t value) const;

    // The display line for `value`, and for `elements` where the format is that of a list.
    [[nodiscard]] std::string display(std::uint32_t value, std::span<const std::uint32_t> elements = {}) const;

    // The bits of a field that starts at bit `cursor`, piece by piece in the order of the table, the lower bit
    // first. A variable field is laid out for `count` repeats. Empty where the tables have no layout.
    [[nodiscard]] std::vector<BitSpan> layOut(std::uint32_t cursor, std::optional<std::uint32_t> count = {}) const;
};

// The descriptions belong to the tables of the plug-in, which stays loaded as long as this lives.
class FieldTables {
public:
    // Throws PluginError when the plug-in does not give its tables.
    explicit FieldTables(PluginLibrary library);

    // In the order of the plug-in's grammar.
    [[nodiscard]] const std::vector<FieldDescription> &fields() const { return fields_; }

    // The field of that id, or null. It is a hash lookup, cheap enough for each field of a report.
    [[nodiscard]] const FieldDescription *find(std::uint32_t id) const;

    // The first field of that name or short name, or null; `named` gives all.
    [[nodiscard]] const FieldDescription *find(std::string_view name) const;
    [[nodiscard]] std::vector<const FieldDescription *> named(std::string_view name) const;

private:
    PluginLibrary library_;
    std::vector<FieldDescription> fields_;
    std::unordered_map<std::uint32_t, std::size_t> places_; // in fields_, by id
};

} // namespace netfloor
