// SPDX-License-Identifier: MIT
// What is behind the display ids of the TO pass, whose texts bear no names.
#pragma once

#include <cstdint>
#include <string>
#include <unordered_map>

#include "netfloor-host/plugin_library.h"

namespace netfloor::cli {

struct DisplayName {
    std::string name;  // of the field, without the blanks around it
    bool isKey = true; // one of the key fields, by which the plug-in itself says what matters of a packet
};

class FieldNames {
public:
    // Throws PluginError when the plug-in does not give its tables.
    explicit FieldNames(const PluginLibrary &library);

    // What an owner of a next layer says, whose id is 0, counts like a key field.
    [[nodiscard]] const DisplayName &find(std::uint32_t displayId) const;

private:
    std::unordered_map<std::uint32_t, DisplayName> names_;
};

} // namespace netfloor::cli
