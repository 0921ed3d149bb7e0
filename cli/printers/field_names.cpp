// SPDX-License-Identifier: MIT
#include "printers/field_names.h"

#include <set>
#include <string_view>

#include "netfloor-host/field_tables.h"

namespace netfloor::cli {

FieldNames::FieldNames(const PluginLibrary &library) {
    const FieldTables tables(library);
    // A display id stands for all fields of one name, and any of them may be the one with the key.
    std::set<std::string_view> keyNames;
    for (const FieldDescription &field : tables.fields()) {
        if (field.keyIndex != 0) {
            keyNames.insert(field.name);
        }
    }
    for (const FieldDescription &field : tables.fields()) {
        names_.try_emplace(field.id, DisplayName{std::string(field.shortName), keyNames.contains(field.name)});
    }
}

const DisplayName &FieldNames::find(std::uint32_t displayId) const {
    static const DisplayName unknown;
    const auto found = names_.find(displayId);
    return found == names_.end() ? unknown : found->second;
}

} // namespace netfloor::cli
