// SPDX-License-Identifier: MIT
// What is refused before the loader sees it.
#pragma once

#include <filesystem>
#include <string>
#include <string_view>

namespace netfloor {

// What to do about a file that is no plug-in: a sentence with a blank in front.
[[nodiscard]] std::string pluginAdvice();

// Throws PluginError: what is wrong with a file, and what to do.
[[noreturn]] void refusePlugin(const std::filesystem::path &path, std::string_view reason, std::string_view whatToDo);

// Throws PluginError for what is no whole shared library. The loader's own messages for these cases are obscure, and
// some of them end or block the process.
void checkPluginFile(const std::filesystem::path &path);

} // namespace netfloor
