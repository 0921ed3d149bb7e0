// SPDX-License-Identifier: MIT
#include "plugin_file.h"

#include <algorithm>
#include <cstdint>
#include <fstream>
#include <string>
#include <system_error>

#include <link.h>

#include "netfloor-host/plugin_library.h"

namespace netfloor {
namespace {

void checkKind(const std::filesystem::path &path) {
    std::error_code error;
    const std::filesystem::file_status status = std::filesystem::status(path, error);
    if (!std::filesystem::exists(status)) {
        refusePlugin(path,
                     error && error != std::errc::no_such_file_or_directory ? error.message() + "." : "no such file.",
                     pluginAdvice);
    }
    if (std::filesystem::is_directory(status)) {
        refusePlugin(path, "it is a directory.", pluginAdvice);
    }
    if (!std::filesystem::is_regular_file(status)) { // to open a FIFO may take for ever
        refusePlugin(path, "it is a pipe or a device.", pluginAdvice);
    }
}

template <typename Record>
bool readAt(std::ifstream &file, std::uint64_t position, Record &record) {
    file.seekg(static_cast<std::streamoff>(position));
    file.read(reinterpret_cast<char *>(&record), sizeof record);
    return static_cast<bool>(file);
}

// Whether the file has all octets that the loader maps. The loader does not ask: it accesses pages past the end, and
// the process ends with a signal. A library for another machine is left to the loader.
bool isWhole(std::ifstream &file, std::uint64_t fileOctets) {
    ElfW(Ehdr) header = {};
    if (!readAt(file, 0, header)) {
        return false;
    }
    constexpr unsigned char ownClass = sizeof(void *) == 8 ? ELFCLASS64 : ELFCLASS32;
    if (header.e_ident[EI_CLASS] != ownClass || header.e_phentsize != sizeof(ElfW(Phdr))) {
        return true;
    }
    for (std::uint64_t i = 0; i < header.e_phnum; ++i) {
        ElfW(Phdr) part = {};
        if (!readAt(file, header.e_phoff + i * sizeof part, part)) {
            return false;
        }
        if (part.p_offset > fileOctets || part.p_filesz > fileOctets - part.p_offset) {
            return false;
        }
    }
    return true;
}

} // namespace

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
    std::string magic(SELFMAG, '\0');
    file.seekg(0);
    file.read(magic.data(), SELFMAG);
    if (!file || magic != ELFMAG) {
        refusePlugin(path, "it is not a shared library.", pluginAdvice);
    }
    if (!isWhole(file, octets)) {
        refusePlugin(path, "it is cut short, after " + std::to_string(octets) + " octets.",
                     " Copy or build it once more.");
    }
}

} // namespace netfloor
