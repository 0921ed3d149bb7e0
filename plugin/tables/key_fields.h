// SPDX-License-Identifier: MIT
// The key-field table: which fields the XTR pass can deliver.
//
// The rows have the order in which the grammar reaches its key fields, a row for each place. A field is stored in the
// last row of its name: of several rows of one name, only the last one is filled.
#pragma once

#include <array>
#include <cstdint>

#include "frame/field.h"
#include "netfloor/records.h"
#include "tables/catalogue.h"

namespace netfloor::plugin {

// The key fields, a row each, in the order in which the grammar reaches them.
inline constexpr auto &keySites = CatalogueKeys::pointers;

inline constexpr std::uint32_t noKeyRow = 0xffffffff;

// The table ends with a row without a name, which no field fills: a host can mark it present.
inline constexpr std::uint32_t keyRowCount = keySites.size() + 1;

// The id decides whether a field is a key field, as other fields may have the same name.
[[nodiscard]] constexpr bool isKeyField(const Field &field) {
    for (const Field *const key : keySites) {
        if (key->id == field.id) {
            return true;
        }
    }
    return false;
}

// The row that the XTR pass fills: fields of one name share the last one of that name.
[[nodiscard]] constexpr std::uint32_t keyRowOf(const Field &field) {
    if (!isKeyField(field)) {
        return noKeyRow;
    }
    std::uint32_t row = keySites.size();
    while (keySites[--row]->tableName() != field.tableName()) {
    }
    return row;
}

// The host fills the first three words of each row; the rest stays as it is.
inline constinit std::array<KeyFieldRow, keyRowCount> keyRows = [] {
    std::array<KeyFieldRow, keyRowCount> rows{};
    for (std::uint32_t row = 0; row < keyRowCount; ++row) {
        rows[row].protocolName = "netfloor";
        rows[row].fieldName = row < keySites.size() ? keySites[row]->tableName().data() : "";
    }
    return rows;
}();

} // namespace netfloor::plugin
