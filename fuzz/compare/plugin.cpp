// SPDX-License-Identifier: MIT
#include "plugin.h"

#include <algorithm>
#include <filesystem>
#include <stdexcept>

#include <dlfcn.h>
#include <link.h>
#include <unistd.h>

namespace netfloor::compare {
namespace {

void check(bool done) {
    if (!done) {
        throw std::runtime_error(dlerror());
    }
}

template <class Function>
void resolve(void *handle, const char *name, Function &function) {
    function = reinterpret_cast<Function>(dlsym(handle, name));
    check(function != nullptr);
}

struct Search {
    ElfW(Addr) base;
    std::vector<std::span<std::uint8_t>> &found;
};

// Writable segments, without what the loader makes read-only when it is done with it.
int findWritable(dl_phdr_info *object, std::size_t, void *argument) {
    const auto &search = *static_cast<Search *>(argument);
    if (object->dlpi_addr != search.base) {
        return 0;
    }
    const std::span headers(object->dlpi_phdr, object->dlpi_phnum);
    const auto page = static_cast<ElfW(Addr)>(sysconf(_SC_PAGESIZE));
    ElfW(Addr) readOnlyEnd = 0;
    for (const auto &header : headers) {
        readOnlyEnd = header.p_type == PT_GNU_RELRO ? (header.p_vaddr + header.p_memsz) / page * page : readOnlyEnd;
    }
    for (const auto &header : headers) {
        const ElfW(Addr) start = std::max(header.p_vaddr, readOnlyEnd);
        const ElfW(Addr) end = header.p_vaddr + header.p_memsz;
        if (header.p_type == PT_LOAD && (header.p_flags & PF_W) != 0 && start < end) {
            search.found.emplace_back(reinterpret_cast<std::uint8_t *>(search.base + start), end - start);
        }
    }
    return 1;
}

} // namespace

// A name without a folder would be looked for among the libraries of the system.
Plugin::Plugin(const std::string &path, Start start)
    : handle(dlopen(std::filesystem::absolute(path).c_str(), RTLD_NOW | RTLD_LOCAL)) {
    check(handle != nullptr);
    resolve(handle, "vex_PreDecodeTO", passes[NETFLOOR_MODE_TO]);
    resolve(handle, "vex_PreDecodeMD", passes[NETFLOOR_MODE_MD]);
    resolve(handle, "vex_PreDecodeMV", passes[NETFLOOR_MODE_MV]);
    resolve(handle, "XTR_netfloor", extract);
    resolve(handle, "date_conv", dateConv);
    resolve(handle, "vx_DLLGetPtr", getPtr);
    resolve(handle, "vx_DLLGetTable", getTable);
    link_map *map = nullptr;
    check(dlinfo(handle, RTLD_DI_LINKMAP, &map) == 0);
    Search search{map->l_addr, writable};
    dl_iterate_phdr(findWritable, &search);
    if (start == Start::kept) {
        asLoaded = variables();
    }
}

Variables Plugin::variables() const {
    Variables values;
    for (const auto part : writable) {
        values.emplace_back(part.begin(), part.end());
    }
    return values;
}

void Plugin::setVariables(const Variables &values) const {
    for (std::size_t i = 0; i < writable.size(); ++i) {
        std::ranges::copy(values[i], writable[i].begin());
    }
}

} // namespace netfloor::compare
