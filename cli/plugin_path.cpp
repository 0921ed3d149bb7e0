// SPDX-License-Identifier: MIT
#include "plugin_path.h"

#include <array>
#include <system_error>

#include "netfloor-host/plugin_library.h"

namespace netfloor::cli {

std::filesystem::path findPlugin(const std::filesystem::path &asked) {
    if (!asked.empty()) {
        return asked;
    }
    std::error_code ignored;
    const auto folder = std::filesystem::read_symlink("/proc/self/exe", ignored).parent_path();
    const std::array<std::filesystem::path, 2> places = {folder / NETFLOOR_BUILT_PLUGIN,
                                                         folder / NETFLOOR_INSTALLED_PLUGIN};
    for (const auto &place : places) {
        if (std::filesystem::exists(place, ignored)) {
            return place.lexically_normal();
        }
    }
    throw PluginError("the plug-in was found neither at " + places[0].lexically_normal().string() + " nor at " +
                      places[1].lexically_normal().string() + ". Build it, or name it with --plugin PATH.");
}

} // namespace netfloor::cli
