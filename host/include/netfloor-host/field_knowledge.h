// SPDX-License-Identifier: MIT
// What a host knows of particular fields and does not find in the plug-in's tables: where the fields of a protocol
// start and end, which numbers are addresses, and which flags are by design. The rows are in field_knowledge.cpp.
#pragma once

#include <cstdint>
#include <optional>
#include <span>
#include <string>
#include <string_view>
#include <unordered_map>
#include <vector>

#include "netfloor-host/field_tables.h"
#include "netfloor-host/sink.h"

namespace netfloor {

// Fields by their name. The id is given only where several fields have that name and one of them is meant.
struct FieldName {
    std::string_view name;
    std::uint32_t id = 0;

    [[nodiscard]] bool fits(const FieldDescription &field) const {
        return field.name == name && (id == 0 || id == field.id);
    }
};

// Consecutive fields in the order of the plug-in's tables. Each end is one field.
struct FieldSpan {
    std::string_view section; // "TCP options"
    FieldName first;
    FieldName last;
};

// A flag that a pass raises after a field of the span, although nothing is wrong with the packet.
struct FlagByDesign {
    std::uint32_t flag = 0; // NETFLOOR_FLAG_...
    FieldSpan after;
    std::uint32_t mostUnreadBits = 0; // by design only up to so many bits that no field covers
    std::string_view why;
};

// A length in octets, which counts from `bitsBefore` bits before its field. A row with a reason says that
// NETFLOOR_FLAG_LIMIT_TOO_LONG is by design where the packet holds all that this length and the lengths inside it
// count. A row without a reason is a length inside another.
struct LengthField {
    std::string_view section;
    FieldName field;
    std::uint32_t bitsBefore = 0;
    std::string_view why;

    // The first bit after what the length counts. The field must have a range.
    [[nodiscard]] std::uint32_t endBit(const FieldView &view) const;
};

// The type of a key field whose display hides it. A key field is known by its name alone.
[[nodiscard]] std::optional<KeyType> knownKeyType(std::string_view keyFieldName);

// The rows, matched with the fields of one plug-in. It keeps no reference to `fields`.
class FieldKnowledge {
public:
    explicit FieldKnowledge(std::span<const FieldDescription> fields);

    // The section that holds a field, such as "TCP options". Empty for a field in no section.
    [[nodiscard]] std::string_view section(std::uint32_t fieldId) const;

    // The row that explains `flag`, raised after that field with so many bits unread there, or null.
    [[nodiscard]] const FlagByDesign *flagByDesign(std::uint32_t flag, std::uint32_t fieldId,
                                                   std::uint32_t unreadBits) const;

    // The row of a length, or null.
    [[nodiscard]] const LengthField *lengthField(std::uint32_t fieldId) const;

    // A sentence for each field in no section or in two, and for each row whose field the plug-in does not have.
    // A new protocol needs rows until the list is empty.
    [[nodiscard]] const std::vector<std::string> &mismatches() const { return mismatches_; }

private:
    struct Known {
        std::string_view section;
        const LengthField *length = nullptr;
        std::vector<const FlagByDesign *> flags;
    };
    using Fields = std::span<const FieldDescription>;

    void addSections(Fields fields);
    void addFlags(Fields fields);
    void addLengths(Fields fields);
    void checkKeyTypes(Fields fields);

    // The fields from the first to the last of a span; empty, with a mismatch, where an end is not found.
    [[nodiscard]] Fields locate(Fields fields, const FieldSpan &span);
    // The only field of that name, or null with a mismatch.
    [[nodiscard]] const FieldDescription *only(Fields fields, std::string_view section, const FieldName &name);
    [[nodiscard]] Fields fieldsOf(Fields fields, std::string_view section) const;
    void miss(std::string_view section, const FieldName &name, std::string_view what);

    std::unordered_map<std::uint32_t, Known> known_; // by id
    std::vector<std::string> mismatches_;
};

} // namespace netfloor
