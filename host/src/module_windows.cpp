// SPDX-License-Identifier: MIT
#include "module.h"

#include <array>
#include <string>
#include <system_error>

#define WIN32_LEAN_AND_MEAN
#include <windows.h>

#include "plugin_file.h"

namespace netfloor {
namespace {

std::string messageOf(DWORD error) {
    return std::system_category().message(static_cast<int>(error));
}

// With an altered search path, the libraries that the file needs are also looked for in the file's own folder.
void *load(const std::filesystem::path &path, const std::filesystem::path &loadPath) {
    HMODULE const handle = LoadLibraryExW(loadPath.c_str(), nullptr, LOAD_WITH_ALTERED_SEARCH_PATH);
    if (handle != nullptr) {
        return handle;
    }
    const DWORD error = GetLastError();
    if (error == ERROR_MOD_NOT_FOUND || error == ERROR_PROC_NOT_FOUND) {
        refusePlugin(path, "it needs something that this process does not have (" + messageOf(error) + ").",
                     " A plug-in may import the operations of netfloor/host.h and the C library; build it again for"
                     " this host.");
    }
    refusePlugin(path, "the loader refuses it (" + messageOf(error) + ").",
                 " Build the plug-in as a shared library for this machine.");
}

// A file of a new name with the same content. The loader identifies a library by its path, so that a copy loads as
// another library.
std::filesystem::path copyToFile(const std::filesystem::path &path) {
    std::array<wchar_t, MAX_PATH> name = {};
    const bool copied = GetTempFileNameW(std::filesystem::temp_directory_path().c_str(), L"net", 0, name.data()) != 0 &&
                        CopyFileW(path.c_str(), name.data(), FALSE) != 0;
    if (!copied) {
        refusePlugin(path, "it cannot be copied (" + messageOf(GetLastError()) + ").",
                     " Free some room in the folder of temporary files and try again.");
    }
    return name.data();
}

} // namespace

const std::string_view Module::magic = "MZ";
const std::string_view Module::usualPath = "build/plugin/netfloor.dll";

// The loader asks by itself.
bool Module::isWhole(std::istream & /*file*/, std::uint64_t /*fileOctets*/) {
    return true;
}

Module::Module(const std::filesystem::path &path, bool isCopy)
    : copy_(isCopy ? copyToFile(path) : std::filesystem::path()) {
    try {
        handle_ = load(path, isCopy ? copy_ : std::filesystem::absolute(path));
    } catch (...) {
        if (isCopy) {
            DeleteFileW(copy_.c_str());
        }
        throw;
    }
}

Module::~Module() {
    FreeLibrary(static_cast<HMODULE>(handle_));
    if (!copy_.empty()) {
        DeleteFileW(copy_.c_str());
    }
}

void *Module::find(const char *exportName) const {
    return reinterpret_cast<void *>(GetProcAddress(static_cast<HMODULE>(handle_), exportName));
}

} // namespace netfloor
