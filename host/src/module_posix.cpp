// SPDX-License-Identifier: MIT
#include "module.h"

#include <cerrno>
#include <cstdint>
#include <cstring>
#include <fstream>
#include <sstream>
#include <string>

#include <dlfcn.h>
#include <link.h>
#include <sys/mman.h>
#include <unistd.h>

#include "plugin_file.h"

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
    std::ostringstream content;
    content << source.rdbuf();
    const int copy = ::memfd_create(path.filename().c_str(), MFD_CLOEXEC);
    if (copy < 0) {
        fail(copy);
    }
    std::string_view rest = content.view();
    while (!rest.empty()) {
        const ssize_t written = ::write(copy, rest.data(), rest.size());
        if (written < 0) {
            fail(copy);
        }
        rest.remove_prefix(static_cast<std::size_t>(written));
    }
    return copy;
}

template <typename Record>
bool readAt(std::istream &file, std::uint64_t position, Record &record) {
    file.seekg(static_cast<std::streamoff>(position));
    file.read(reinterpret_cast<char *>(&record), sizeof record);
    return static_cast<bool>(file);
}

} // namespace

const std::string_view Module::magic(ELFMAG, SELFMAG);
const std::string_view Module::usualPath = "build/plugin/libnetfloor.so";

// The loader accesses pages past the end of a file that is cut short, and the process ends with a signal. A library for
// another machine is left to the loader.
bool Module::isWhole(std::istream &file, std::uint64_t fileOctets) {
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
