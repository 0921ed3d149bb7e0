// SPDX-License-Identifier: MIT
#include "key_types.h"

#include <string_view>
#include <unordered_map>

#include "netfloor-host/field_knowledge.h"

namespace netfloor {
namespace {

KeyType typeOf(const FieldDescriptor &field) {
    if (const auto known = knownKeyType(field.name)) {
        return *known;
    }
    const bool isListedAddress = (field.flags >> 8 & 0xff) != 0;
    switch (field.flags & 0xff) {
    case 1: return KeyType::number8;
    case 2: return KeyType::number16;
    case 3: return isListedAddress ? KeyType::ipv4Address : KeyType::number32;
    default: return KeyType::ipv6Address;
    }
}

} // namespace

std::vector<KeyType> keyTypesOf(std::span<const KeyFieldRow> rows, NetfloorGetTable getTable) {
    std::unordered_map<std::string_view, KeyType> types;
    const void *table = nullptr;
    if (getTable(NETFLOOR_TABLE_FIELDS, &table) == NETFLOOR_TABLE_FOUND) {
        for (const auto *field = static_cast<const FieldDescriptor *>(table); field->flags != NETFLOOR_NO_FIELD;
             ++field) {
            if (field->keyIndex != 0) {
                types.try_emplace(field->name, typeOf(*field));
            }
        }
    }
    std::vector<KeyType> found;
    for (const KeyFieldRow &row : rows) {
        const auto type = types.find(row.fieldName);
        found.push_back(type == types.end() ? KeyType::number32 : type->second);
    }
    return found;
}

} // namespace netfloor
