// SPDX-License-Identifier: MIT
#include "plugin_path.h"

#include <system_error>

#include "netfloor-host/plugin_library.h"

namespace netfloor::cli {

std::filesystem::path findPlugin(const std::filesystem::path &asked) {
    if (!asked.empty()) {
        return asked;
    }
    std::error_code ignored;
    const auto folder = std::filesystem::read_symlink("/proc/self/exe", ignored).parent_path();
    auto place = (folder / NETFLOOR_OWN_PLUGIN).lexically_normal();
    if (!std::filesystem::exists(place, ignored)) {
        throw PluginError("the plug-in was not found at " + place.string() +
                          ". Build it, or name it with --plugin PATH.");
    }
    return place;
}

} // namespace netfloor::cli
