// SPDX-License-Identifier: MIT
// What the display ids of the TO pass stand for, whose texts bear no names.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "netfloor-host/field_tables.h"

namespace netfloor::cli {

struct DisplayName {
    std::string name;  // of the field, without the blanks around it
    bool isKey = true; // one of the key fields, by which the plug-in itself says what matters of a packet
};

class FieldNames {
public:
    explicit FieldNames(const FieldTables &tables);

    // What an owner of a next layer says, whose id is 0, counts like a key field.
    [[nodiscard]] const DisplayName &find(std::uint32_t displayId) const {
        return names_[displayId < names_.size() ? displayId : 0];
    }

private:
    std::vector<DisplayName> names_; // by id; the first stands for all that the tables do not know
};

} // namespace netfloor::cli
