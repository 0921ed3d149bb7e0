// SPDX-License-Identifier: MIT
// What is refused before the loader sees it.
#pragma once

#include <filesystem>
#include <string_view>

namespace netfloor {

inline constexpr std::string_view pluginAdvice =
    " Give the path of a netfloor plug-in, such as build/plugin/libnetfloor.so.";

// Throws PluginError.
[[noreturn]] void refusePlugin(const std::filesystem::path &path, std::string_view reason, std::string_view whatToDo);

// Throws PluginError for what is no whole shared library. The loader's own messages for these cases are obscure, and
// some of them end or block the process.
void checkPluginFile(const std::filesystem::path &path);

} // namespace netfloor
