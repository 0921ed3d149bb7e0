// SPDX-License-Identifier: MIT
// The names of a field's values: one list, for the texts of the passes and for the published value map.
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <span>
#include <string_view>

#include "frame/inline.h"

namespace netfloor::plugin {

// The name of one value, or of all values from `from` to `to`.
struct ValueName {
    std::uint32_t from;
    std::uint32_t to;
    std::string_view text;
    std::string_view brief = {}; // the short form, in the lists that have short forms

    constexpr ValueName(std::uint32_t value, std::string_view name, std::string_view shortName = {})
        : from(value), to(value), text(name), brief(shortName) {}
    constexpr ValueName(std::uint32_t first, std::uint32_t last, std::string_view name, std::string_view shortName = {})
        : from(first), to(last), text(name), brief(shortName) {}
    constexpr ValueName() : ValueName(0, {}) {}
};

// A list of names in ascending order of their values, ranges among them. `otherwise` names every other
// value; it may be a format such as "%u". Without it such a value has the empty name.
struct ValueNames {
    std::span<const ValueName> rows;
    std::string_view otherwise = {};
    std::string_view otherwiseBrief = {};
    bool hasBriefs = false;
};

// Where every value below `values` stands in a list of names: row number + 1, or 0.
template <std::size_t values>
[[nodiscard]] consteval std::array<std::uint16_t, values> directIndex(const ValueNames &names) {
    std::array<std::uint16_t, values> index{};
    for (std::size_t row = 0; row < names.rows.size(); ++row) {
        for (std::size_t value = names.rows[row].from; value <= names.rows[row].to && value < values; ++value) {
            index[value] = static_cast<std::uint16_t>(row + 1);
        }
    }
    return index;
}

// Values up to here are looked up by a direct index, those above by a search.
inline constexpr std::uint32_t directIndexMost = 8191;

// How many values a list of names has in its direct index: all, or those of its first row in a sparse list.
[[nodiscard]] constexpr std::size_t indexedValues(const ValueNames &names) {
    return (names.rows.back().to <= directIndexMost ? names.rows.back().to : names.rows.front().to) + std::size_t{1};
}

template <const ValueNames &names>
inline constexpr auto valueIndex = directIndex<indexedValues(names)>(names);

// The number, from 1, of the row that names `value`; 0 where none does.
template <const ValueNames &names>
[[nodiscard]] NETFLOOR_INLINE constexpr std::uint32_t rowNumber(std::uint32_t value) {
    constexpr std::size_t indexed = indexedValues(names);
    if (value < indexed) {
        return valueIndex<names>[value];
    }
    if constexpr (names.rows.back().to >= indexed) {
        for (std::uint32_t row = 0; row < names.rows.size(); ++row) {
            if (value >= names.rows[row].from && value <= names.rows[row].to) {
                return row + 1;
            }
        }
    }
    return 0;
}

} // namespace netfloor::plugin
