// SPDX-License-Identifier: MIT
#include "plugin_file.h"

#include <algorithm>
#include <cstdint>
#include <fstream>
#include <string>
#include <system_error>

#include "module.h"
#include "netfloor-host/plugin_library.h"

namespace netfloor {
namespace {

void checkKind(const std::filesystem::path &path) {
    std::error_code error;
    const std::filesystem::file_status status = std::filesystem::status(path, error);
    if (!std::filesystem::exists(status)) {
        refusePlugin(path,
                     error && error != std::errc::no_such_file_or_directory ? error.message() + "." : "no such file.",
                     pluginAdvice());
    }
    if (std::filesystem::is_directory(status)) {
        refusePlugin(path, "it is a directory.", pluginAdvice());
    }
    if (!std::filesystem::is_regular_file(status)) { // to open a FIFO may take for ever
        refusePlugin(path, "it is a pipe or a device.", pluginAdvice());
    }
}

} // namespace

std::string pluginAdvice() {
    return " Give the path of a netfloor plug-in, such as " + std::string(Module::usualPath) + '.';
}

void refusePlugin(const std::filesystem::path &path, std::string_view reason, std::string_view whatToDo) {
    throw PluginError("cannot use " + path.string() + " as a plug-in: " + std::string(reason) + std::string(whatToDo));
}

void checkPluginFile(const std::filesystem::path &path) {
    checkKind(path);
    std::ifstream file(path, std::ios::binary | std::ios::ate);
    if (!file) {
        refusePlugin(path, "it cannot be read.", " Check the permissions of the file.");
    }
    const auto octets = static_cast<std::uint64_t>(std::max<std::streamoff>(0, file.tellg()));
    std::string magic(Module::magic.size(), '\0');
    file.seekg(0);
    file.read(magic.data(), static_cast<std::streamsize>(magic.size()));
    if (magic != Module::magic) {
        refusePlugin(path, "it is not a shared library.", pluginAdvice());
    }
    if (!Module::isWhole(file, octets)) {
        refusePlugin(path, "it is cut short, after " + std::to_string(octets) + " octets.",
                     " Copy or build it once more.");
    }
}

} // namespace netfloor
