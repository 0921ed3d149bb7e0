// SPDX-License-Identifier: MIT
#include "netfloor-host/field_tables.h"

#include <algorithm>
#include <array>
#include <charconv>
#include <cstddef>
#include <string>
#include <utility>

#include <netfloor/descriptors.h>

namespace netfloor {
namespace {

constexpr std::uint32_t widthMask = 0xffff;

template <typename Row>
const Row *tableOf(const PluginLibrary &library, std::int32_t number) {
    const void *table = nullptr;
    if (library.getTable()(number, &table) != NETFLOOR_TABLE_FOUND || table == nullptr) {
        throw PluginError("the plug-in " + library.path().string() + " does not give its table " +
                          std::to_string(number) + ". Build it again for this host.");
    }
    return static_cast<const Row *>(table);
}

// Reads a layout in the code that netfloor/descriptors.h describes.
class LayoutReader {
public:
    explicit LayoutReader(const std::uint8_t *record) : at_(record) {}

    FieldLayout read() {
        constexpr std::uint32_t lengthOctets = 2;
        constexpr std::uint32_t shortestLength = 8;
        constexpr std::uint32_t headOctets = 5;
        FieldLayout layout;
        const std::uint32_t length = at_[0] | static_cast<std::uint32_t>(at_[1]) << 8;
        if (length < shortestLength) {
            return layout;
        }
        at_ += lengthOctets + headOctets;
        layout.pieces.reserve(*at_);
        for (std::uint32_t pieces = *at_++; pieces > 0; --pieces) {
            layout.pieces.push_back(readSpan());
        }
        layout.kind = *at_ == constantTag ? FieldLayout::Kind::fixed : FieldLayout::Kind::variable;
        const BitSpan count = readSpan();
        layout.leastCount = count.first;
        layout.mostCount = count.last;
        layout.step = readSpan().first;
        return layout;
    }

private:
    static constexpr std::uint8_t rangeTag = 0x05;
    static constexpr std::uint8_t referenceTag = 0x08;
    static constexpr std::uint8_t constantTag = 0x10;

    // An operand. A constant is a span of one number; a reference, which has no number here, is 0 to 0.
    BitSpan readSpan() {
        constexpr std::uint32_t referenceOctets = 3;
        switch (*at_) {
        case rangeTag: {
            ++at_;
            const std::uint32_t first = readConstant();
            return {first, readConstant()};
        }
        case referenceTag: at_ += referenceOctets; return {};
        default: {
            const std::uint32_t number = readConstant();
            return {number, number};
        }
        }
    }

    std::uint32_t readConstant() {
        constexpr std::uint32_t constantOctets = 5;
        at_ += constantOctets;
        return at_[-1];
    }

    const std::uint8_t *at_;
};

struct Tables {
    explicit Tables(const PluginLibrary &library)
        : rows(tableOf<FieldDescriptor>(library, NETFLOOR_TABLE_FIELDS)),
          values(tableOf<ValueMapRow>(library, NETFLOOR_TABLE_VALUES)),
          pool(tableOf<std::int32_t>(library, NETFLOOR_TABLE_POOL)),
          texts(tableOf<const char *>(library, NETFLOOR_TABLE_TEXTS)),
          layouts(tableOf<std::uint8_t>(library, NETFLOOR_TABLE_LAYOUTS)) {}

    const FieldDescriptor *rows;
    const ValueMapRow *values;
    const std::int32_t *pool;
    const char *const *texts;
    const std::uint8_t *layouts;
};

NamedValue namedValue(const Tables &tables, const ValueMapRow &row) {
    const auto from = static_cast<std::uint32_t>(tables.pool[row.poolIndex]);
    const bool one = row.kind == NETFLOOR_VALUE_ONE;
    return {from, one ? from : static_cast<std::uint32_t>(tables.pool[row.poolIndex + 1]),
            tables.texts[row.displayIndex]};
}

FieldDescription describe(const Tables &tables, const FieldDescriptor &row) {
    FieldDescription field;
    field.id = row.fieldId;
    field.name = row.name;
    field.shortName = row.shortName;
    field.keyIndex = static_cast<std::uint32_t>(row.keyIndex);
    field.flags = row.flags;
    if (row.width != NETFLOOR_WIDTH_VARIABLE) {
        field.width = row.width & widthMask;
    }
    field.format = tables.texts[row.displayIndex];
    field.values.reserve(static_cast<std::size_t>(std::max(row.valueCount, 0)));
    for (std::int32_t i = 0; i < row.valueCount; ++i) {
        field.values.push_back(namedValue(tables, tables.values[row.valueStart + i]));
    }
    field.layout = LayoutReader(tables.layouts + row.templateOffset).read();
    field.layoutOffset = row.templateOffset;
    return field;
}

// Appends `value` by the conversion `letter`: u, x or c.
void appendNumber(std::string &text, char letter, std::uint32_t value) {
    if (letter == 'c') {
        // Texts are C strings: a zero octet adds nothing to them.
        text.append((value & 0xff) == 0 ? 0 : 1, static_cast<char>(value));
        return;
    }
    std::array<char, 16> digits = {};
    constexpr int decimal = 10;
    constexpr int hexadecimal = 16;
    text.append(
        digits.data(),
        std::to_chars(digits.data(), digits.data() + digits.size(), value, letter == 'x' ? hexadecimal : decimal).ptr);
}

// Appends the elements as the text inside a list's brackets says: "%x":"."
void appendList(std::string &text, std::string_view list, std::span<const std::uint32_t> elements) {
    constexpr std::size_t letterAt = 2;
    const std::size_t colon = list.find("\":\"");
    const std::string_view separator =
        colon == std::string_view::npos ? std::string_view() : list.substr(colon + 3, list.size() - 1 - (colon + 3));
    for (std::size_t i = 0; i < elements.size(); ++i) {
        text += i == 0 ? std::string_view() : separator;
        appendNumber(text, list[letterAt], elements[i]);
    }
}

} // namespace

const NamedValue *FieldDescription::findValue(std::uint32_t value) const {
    const NamedValue *found = nullptr;
    for (const NamedValue &row : values) {
        if (row.holds(value) && !row.isRange()) {
            return &row;
        }
        if (row.holds(value) || (row.isDefault() && found == nullptr)) {
            found = &row;
        }
    }
    return found;
}

std::string FieldDescription::valueName(std::uint32_t value) const {
    const NamedValue *const row = findValue(value);
    if (row == nullptr) {
        return {};
    }
    FieldDescription line;
    line.format = row->name;
    return line.display(value);
}

std::string FieldDescription::display(std::uint32_t value, std::span<const std::uint32_t> elements) const {
    std::string text;
    std::string_view rest = format;
    for (std::size_t percent = rest.find('%'); percent != std::string_view::npos; percent = rest.find('%')) {
        text += rest.substr(0, percent);
        rest.remove_prefix(percent + 1);
        std::size_t used = 1;
        if (rest.starts_with("-S")) {
            text += valueName(value);
            used = 2;
        } else if (rest.starts_with("-[")) {
            const std::size_t end = rest.find(']');
            appendList(text, rest.substr(2, end - 2), elements);
            used = end + 1;
        } else {
            appendNumber(text, rest.front(), value);
        }
        rest.remove_prefix(used);
    }
    return text.append(rest);
}

std::vector<BitSpan> FieldDescription::layOut(std::uint32_t cursor, std::optional<std::uint32_t> count) const {
    std::vector<BitSpan> spans;
    for (std::uint32_t repeat = 0; repeat < count.value_or(layout.leastCount); ++repeat) {
        const std::uint32_t start = cursor + layout.advance(repeat) - 1;
        for (const BitSpan &piece : layout.pieces) {
            const auto [low, high] = std::minmax(piece.first, piece.last);
            spans.push_back({start + low, start + high});
        }
    }
    return spans;
}

FieldTables::FieldTables(PluginLibrary library) : library_(std::move(library)) {
    const Tables tables(library_);
    std::size_t count = 0;
    while (tables.rows[count].flags != NETFLOOR_NO_FIELD) {
        ++count;
    }
    fields_.reserve(count);
    places_.reserve(count);
    for (const FieldDescriptor *row = tables.rows; row->flags != NETFLOOR_NO_FIELD; ++row) {
        places_.try_emplace(row->fieldId, fields_.size());
        fields_.push_back(describe(tables, *row));
    }
}

const FieldDescription *FieldTables::find(std::uint32_t id) const {
    const auto found = places_.find(id);
    return found == places_.end() ? nullptr : &fields_[found->second];
}

const FieldDescription *FieldTables::find(std::string_view name) const {
    const std::vector<const FieldDescription *> found = named(name);
    return found.empty() ? nullptr : found.front();
}

std::vector<const FieldDescription *> FieldTables::named(std::string_view name) const {
    std::vector<const FieldDescription *> found;
    for (const FieldDescription &field : fields_) {
        if (field.name == name || field.shortName == name) {
            found.push_back(&field);
        }
    }
    return found;
}

} // namespace netfloor
