// SPDX-License-Identifier: MIT
#include "printers/field_names.h"

#include <algorithm>
#include <set>
#include <string_view>

namespace netfloor::cli {

namespace {

// Ids are small; a table with others would not be worth the room.
constexpr std::uint32_t mostIds = 65536;

} // namespace

FieldNames::FieldNames(const FieldTables &tables) : names_(1) {
    // A display id stands for all fields of one name, and any of them may be the one with the key.
    std::set<std::string_view> keyNames;
    std::uint32_t lastId = 0;
    for (const FieldDescription &field : tables.fields()) {
        if (field.keyIndex != 0) {
            keyNames.insert(field.name);
        }
        lastId = std::max(lastId, field.id < mostIds ? field.id : 0);
    }
    names_.resize(std::size_t{lastId} + 1);
    for (const FieldDescription &field : tables.fields()) {
        if (field.id != 0 && field.id <= lastId) {
            names_[field.id] = {std::string(field.shortName), keyNames.contains(field.name)};
        }
    }
}

} // namespace netfloor::cli
