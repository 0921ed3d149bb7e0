// SPDX-License-Identifier: MIT
// The rows of the published tables, put together from the catalogue.
#pragma once

#include <algorithm>
#include <array>
#include <cstddef>
#include <cstdint>
#include <string_view>
#include <utility>

#include "netfloor/descriptors.h"
#include "tables/catalogue.h"
#include "tables/display_strings.h"
#include "tables/field_layouts.h"
#include "tables/key_fields.h"

namespace netfloor::plugin {

// Checked here, as this file is compiled once.
static_assert(CheckedCatalogue<CatalogueFields, CatalogueKeys>::holds);

// The highest octet of a field's flags.
inline constexpr std::uint32_t usualTopOctet = 5;
inline constexpr std::uint32_t otherTopOctet = 6;

inline constexpr std::uint32_t widthHead = 0xffff0000;

// An address that is read as groups or as nibbles counts as variable, like a run.
[[nodiscard]] constexpr bool hasFixedWidth(const Place &place) {
    return !place.isRun() && place.shape != Shape::groups && place.shape != Shape::addressNibbles;
}

[[nodiscard]] constexpr std::uint32_t sizeClass(const Place &place) {
    const std::uint32_t width = place.width();
    if (!hasFixedWidth(place) || width > 32) {
        return 4;
    }
    return width <= 8 ? 1 : width <= 16 ? 2 : 3;
}

// An address of fixed width, shown as elements with something between them.
template <const Field &field>
inline constexpr bool isListedAddress = hasFixedWidth(field.place) && !parseFormat(longText<field>).separator.empty();

template <const Field &field>
inline constexpr std::uint32_t flagsOf = sizeClass(field.place) | (isListedAddress<field> ? 3u : 0u) << 8 |
                                         (isKeyField(field) ? 1u : 0u) << 16 |
                                         (isListed<CatalogueOfTopOctet6, field> ? otherTopOctet : usualTopOctet) << 24;

// The zero-terminated name without trailing blanks. A name without any is the field's own literal.
template <std::size_t index>
inline constexpr auto bareNameText = [] {
    constexpr std::string_view name = catalogue[index]->bareName();
    std::array<char, name.size() + 1> text{};
    std::ranges::copy(name, text.begin());
    return text;
}();

template <std::size_t index>
[[nodiscard]] constexpr const char *shortNameOf() {
    constexpr const Field &field = *catalogue[index];
    if constexpr (field.bareName().size() == field.tableName().size()) {
        return field.tableName().data();
    } else {
        return bareNameText<index>.data();
    }
}

// Rows of one type and the row that ends them.
struct FieldTable {
    std::array<FieldDescriptor, catalogue.size()> rows;
    FieldTableEnd end;
};

template <std::size_t index>
[[nodiscard]] constexpr FieldDescriptor descriptorOf() {
    constexpr const Field &field = *catalogue[index];
    return {
        .flags = flagsOf<field>,
        .fieldId = field.id,
        .keyIndex = 0, // counted over all rows
        .name = field.title.empty() ? field.tableName().data() : field.title.data(),
        .shortName = shortNameOf<index>(),
        .valueCount = static_cast<std::int32_t>(valueRowCount(field)),
        .valueStart = textTables.valueStart[index],
        .width = hasFixedWidth(field.place) ? widthHead + field.place.width() : NETFLOOR_WIDTH_VARIABLE,
        .displayIndex = textTables.lines[index],
        .unused1 = {-1, -1, -1, -1, -1, -1},
        .templateOffset = layoutTable.offsets[index],
        .unused2 = {-1, -1, -1},
    };
}

inline constexpr FieldTable fieldTable = []<std::size_t... index>(std::index_sequence<index...>) {
    FieldTable table{.rows = {descriptorOf<index>()...},
                     .end = {.flags = NETFLOOR_NO_FIELD,
                             .fieldId = 0xffff,
                             .marker = NETFLOOR_LAST_FIELD,
                             .words = {0, 0xffff},
                             .counts = {0xffff, 0xffff},
                             .width = 0xffffffff,
                             .zero = {}}};
    std::uintptr_t keys = 0;
    for (std::size_t row = 0; row < catalogue.size(); ++row) {
        table.rows[row].keyIndex = isKeyField(*catalogue[row]) ? ++keys : 0;
    }
    return table;
}
(std::make_index_sequence<catalogue.size()>{});

inline constexpr auto valueMap = textTables.values;

inline constexpr auto displayStrings = [] {
    std::array<const char *, textTables.texts.count() + 1> texts{};
    for (std::uint32_t text = 0; text < textTables.texts.count(); ++text) {
        texts[text] = textTables.texts[text].data();
    }
    texts.back() = NETFLOOR_LAST_TEXT;
    return texts;
}();

// The pool ends with a 0 to which no row refers.
inline constexpr auto valuePool = [] {
    std::array<std::int32_t, textTables.pool.count() + 1> numbers{};
    for (std::uint32_t index = 0; index < textTables.pool.count(); ++index) {
        numbers[index] = textTables.pool[index];
    }
    return numbers;
}();

// The layouts end with a zero length.
inline constexpr auto layouts = [] {
    std::array<std::uint8_t, layoutTable.size + 2> octets{};
    std::copy_n(layoutTable.octets.begin(), layoutTable.size, octets.begin());
    return octets;
}();

inline constexpr ProtocolIdentity identity = {
    .head = {7, 0, 0, 0},
    .slots = {{.text = "IETF"},
              {.text = "IP(Lower)"},
              {.text = "IPv4&IPv6(Lower)"},
              {.text = "RFC 791& 2460 "},
              {.text = "UMTS"},
              {.text = "IP layers below GTP"},
              {.text = ""},
              {.text = "NETFLOOR.CSF"},
              {.text = ""},
              {.text = "Release VEXTOOLS_A.02.20"},
              {.text = "Release VEXTOOLS_A.02.20"},
              {.text = "2048"},
              {.text = "Ethernet Type"},
              {.text = "RFC 791 & RFC 2460"},
              {.text = ""},
              {.text = ""},
              {.number = 0},
              {.number = 3},
              {.number = 0},
              {.text = "IP"},
              {.text = "NETFLOOR.CSF"},
              {.number = 0},
              {.number = 0xffff},
              {.number = 0xffff},
              {.number = 0}},
};

} // namespace netfloor::plugin
