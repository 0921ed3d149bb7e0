// SPDX-License-Identifier: MIT
// A shared library that the system's loader has loaded: what differs from system to system.
#pragma once

#include <cstdint>
#include <filesystem>
#include <istream>
#include <string_view>

namespace netfloor {

class Module {
public:
    // The octets at the start of a shared library, and where a build leaves the plug-in.
    static const std::string_view magic, usualPath;

    // Whether the file has all octets that the loader maps, where the loader itself does not ask.
    [[nodiscard]] static bool isWhole(std::istream &file, std::uint64_t fileOctets);

    // Loads the file, or with `isCopy` a copy of it that shares nothing with other loads. Throws PluginError.
    Module(const std::filesystem::path &path, bool isCopy);
    ~Module();
    Module(const Module &) = delete;
    Module &operator=(const Module &) = delete;

    // The same for each load that is not a copy.
    [[nodiscard]] void *handle() const { return handle_; }

    // The export of that name, or null.
    [[nodiscard]] void *find(const char *exportName) const;

private:
    // The system's word for the copy: a file descriptor or a path.
#ifdef _WIN32
    std::filesystem::path copy_;
#else
    int copy_ = -1;
#endif
    void *handle_ = nullptr;
};

} // namespace netfloor
