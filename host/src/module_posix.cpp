// SPDX-License-Identifier: MIT
#include "module.h"

#include <cerrno>
#include <cstring>
#include <elf.h>
#include <fstream>
#include <iterator>
#include <string>

#include <dlfcn.h>
#include <sys/mman.h>
#include <unistd.h>

namespace netfloor {
namespace {

void *load(const std::filesystem::path &path, const std::filesystem::path &loadPath) {
    void *const handle = ::dlopen(loadPath.c_str(), RTLD_NOW | RTLD_LOCAL);
    if (handle != nullptr) {
        return handle;
    }
    const std::string message = ::dlerror();
    const bool unresolved = message.find("undefined symbol") != std::string::npos ||
                            message.find("cannot open shared object file") != std::string::npos;
    if (unresolved) {
        refusePlugin(path, "it needs something that this process does not have (" + message + ").",
                     " A plug-in may import the operations of netfloor/host.h and the C library; build it again for"
                     " this host.");
    }
    refusePlugin(path, "the loader refuses it (" + message + ").",
                 " Build the plug-in as a shared library for this machine.");
}

// A file in memory with the same content. The loader identifies a library by its file, so that a copy loads as
// another library.
int copyToMemory(const std::filesystem::path &path) {
    const auto fail = [&](int descriptor) {
        const std::string reason = std::strerror(errno);
        if (descriptor >= 0) {
            ::close(descriptor);
        }
        refusePlugin(path, "it cannot be copied (" + reason + ").",
                     " Free some memory or file descriptors and try again.");
    };
    std::ifstream source(path, std::ios::binary);
    const std::string content((std::istreambuf_iterator<char>(source)), std::istreambuf_iterator<char>());
    const int copy = ::memfd_create(path.filename().c_str(), MFD_CLOEXEC);
    if (copy < 0) {
        fail(copy);
    }
    std::string_view rest = content;
    while (!rest.empty()) {
        const ssize_t written = ::write(copy, rest.data(), rest.size());
        if (written < 0) {
            fail(copy);
        }
        rest.remove_prefix(static_cast<std::size_t>(written));
    }
    return copy;
}

} // namespace

const std::string_view Module::magic(ELFMAG, SELFMAG);
const std::string_view Module::usualPath = "build/plugin/libnetfloor.so";

// An absolute path, since the loader searches its own directories for a bare name.
Module::Module(const std::filesystem::path &path, bool isCopy) : copy_(isCopy ? copyToMemory(path) : -1) {
    const std::filesystem::path loadPath =
        isCopy ? std::filesystem::path("/proc/self/fd/" + std::to_string(copy_)) : std::filesystem::absolute(path);
    try {
        handle_ = load(path, loadPath);
    } catch (...) {
        if (isCopy) {
            ::close(copy_);
        }
        throw;
    }
}

Module::~Module() {
    ::dlclose(handle_);
    if (copy_ >= 0) {
        ::close(copy_);
    }
}

void *Module::find(const char *exportName) const {
    return ::dlsym(handle_, exportName);
}

} // namespace netfloor
