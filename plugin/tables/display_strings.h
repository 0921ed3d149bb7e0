// SPDX-License-Identifier: MIT
// The published texts and value names: the display line of each field, followed by the names of its list, each
// distinct text once.
#pragma once

#include <algorithm>
#include <array>
#include <cstddef>
#include <cstdint>
#include <string_view>

#include "netfloor/descriptors.h"
#include "tables/catalogue.h"
#include "tables/text_numbers.h"

namespace netfloor::plugin {

// The numbers that value rows refer to, each once, in the order of first use; a range has two of its own.
template <std::size_t most>
class ValuePool {
public:
    constexpr std::uint32_t indexOf(std::uint32_t value) {
        for (std::uint32_t index = 0; index < count_; ++index) {
            if (numbers_[index] == static_cast<std::int32_t>(value)) {
                return index;
            }
        }
        return append(value);
    }

    constexpr std::uint32_t indexOfRange(std::uint32_t from, std::uint32_t to) {
        for (std::uint32_t index = 0; index + 1 < count_; ++index) {
            if (numbers_[index] == static_cast<std::int32_t>(from) &&
                numbers_[index + 1] == static_cast<std::int32_t>(to)) {
                return index;
            }
        }
        const std::uint32_t index = append(from);
        append(to);
        return index;
    }

    [[nodiscard]] constexpr std::uint32_t count() const { return count_; }

    [[nodiscard]] constexpr std::int32_t operator[](std::size_t index) const { return numbers_[index]; }

private:
    constexpr std::uint32_t append(std::uint32_t value) {
        numbers_[count_] = static_cast<std::int32_t>(value);
        return count_++;
    }

    std::array<std::int32_t, most> numbers_{};
    std::uint32_t count_ = 0;
};

// The empty range, which means any value without a row of its own.
inline constexpr std::uint32_t anyFrom = 50;
inline constexpr std::uint32_t anyTo = 0;

// The rows of a field's list of names.
[[nodiscard]] constexpr std::size_t valueRowCount(const Field &field) {
    const bool hasDefault = !field.names->otherwise.empty();
    return field.hasNames() ? field.names->rows.size() + (hasDefault ? 1 : 0) : 0;
}

inline constexpr std::size_t allValueRows = [] {
    std::size_t rows = 0;
    for (const Field *const field : catalogue) {
        rows += valueRowCount(*field);
    }
    return rows;
}();

// The display line of each field.
inline constexpr auto displayLines = []<const Field &...fields>(FieldList<fields...>) {
    return std::array{longText<fields>...};
}
(CatalogueFields{});

// Texts and value names, computed together since both have the order of the fields.
struct TextTables {
    TextNumbers<2048> texts;
    ValuePool<1024> pool;
    std::array<ValueMapRow, allValueRows + 1> values{};      // ended by a row of zeros
    std::array<std::uint32_t, catalogue.size()> lines{};     // of each field: number of its display line
    std::array<std::int32_t, catalogue.size()> valueStart{}; // of each field: its first value row, or -1
};

// The field before `index` that has the same list of names; `index` itself where there is none.
[[nodiscard]] constexpr std::size_t firstWithNamesOf(std::size_t index) {
    for (std::size_t other = 0; other < index; ++other) {
        if (catalogue[other]->names == catalogue[index]->names) {
            return other;
        }
    }
    return index;
}

constexpr void addValueRows(TextTables &tables, std::size_t row, const ValueNames &names) {
    if (!names.otherwise.empty()) {
        const std::uint32_t index = tables.pool.indexOfRange(anyFrom, anyTo);
        tables.values[row++] = {NETFLOOR_VALUE_RANGE, index, tables.texts.numberOf(names.otherwise)};
    }
    for (const ValueName &name : names.rows) {
        const bool one = name.from == name.to;
        const std::uint32_t index = one ? tables.pool.indexOf(name.from) : tables.pool.indexOfRange(name.from, name.to);
        const std::uint32_t kind = one ? NETFLOOR_VALUE_ONE : NETFLOOR_VALUE_RANGE;
        tables.values[row++] = {kind, index, tables.texts.numberOf(name.text)};
    }
}

inline constexpr TextTables textTables = [] {
    TextTables tables;
    std::size_t row = 0;
    for (std::size_t i = 0; i < catalogue.size(); ++i) {
        const Field &field = *catalogue[i];
        tables.lines[i] = tables.texts.numberOf(displayLines[i]);
        tables.valueStart[i] = field.hasNames() ? static_cast<std::int32_t>(row) : -1;
        if (!field.hasNames()) {
            continue;
        }
        // A list that is used again has the same rows again.
        if (const std::size_t first = firstWithNamesOf(i); first != i) {
            std::copy_n(tables.values.begin() + tables.valueStart[first], valueRowCount(field),
                        tables.values.begin() + tables.valueStart[i]);
        } else {
            addValueRows(tables, row, *field.names);
        }
        row += valueRowCount(field);
    }
    return tables;
}();

} // namespace netfloor::plugin
