// SPDX-License-Identifier: MIT
// Where the plug-in is.
#pragma once

#include <filesystem>

namespace netfloor::cli {

// The plug-in that was asked for, or else the one that belongs to this command. Throws PluginError.
[[nodiscard]] std::filesystem::path findPlugin(const std::filesystem::path &asked);

} // namespace netfloor::cli
