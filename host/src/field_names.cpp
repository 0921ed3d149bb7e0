// SPDX-License-Identifier: MIT
#include "field_names.h"

#include <algorithm>

namespace netfloor {
namespace {

// Ids are small. Larger ones count as unknown, so that the vector of names stays small.
constexpr std::uint32_t mostIds = 65536;

} // namespace

FieldNames::FieldNames(NetfloorGetTable getTable) : fields_(1) {
    readTable(getTable);
    count_ = static_cast<std::uint32_t>(fields_.size());
}

void FieldNames::readTable(NetfloorGetTable getTable) {
    const void *table = nullptr;
    if (getTable(NETFLOOR_TABLE_FIELDS, &table) != NETFLOOR_TABLE_FOUND || table == nullptr) {
        return;
    }
    for (const auto *row = static_cast<const FieldDescriptor *>(table); row->flags != NETFLOOR_NO_FIELD; ++row) {
        if (row->fieldId == 0 || row->fieldId >= mostIds) {
            continue;
        }
        fields_.resize(std::max<std::size_t>(fields_.size(), row->fieldId + 1));
        fields_[row->fieldId] = {row->name, "", 0, row->keyIndex != 0, true};
    }
}

std::string_view FieldNames::findBlockName(NamedField &field, std::string_view name) {
    auto found = blockNames_.find(name);
    if (found == blockNames_.end()) {
        found = blockNames_.emplace(name).first;
    }
    field.lastBlock = found->c_str();
    field.lastBlockSize = static_cast<std::uint32_t>(found->size());
    return *found;
}

} // namespace netfloor
