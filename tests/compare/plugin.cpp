// SPDX-License-Identifier: MIT
#include "plugin.h"

#include <algorithm>
#include <cstring>
#include <stdexcept>

#include <dlfcn.h>
#include <link.h>
#include <unistd.h>

#include "netfloor/host.h"

namespace netfloor::compare {
namespace {

struct Search {
    ElfW(Addr) base;
    std::vector<std::span<std::uint8_t>> writable;
};

// Writable segments, without what the loader made read-only when it was done with it.
int collectWritable(dl_phdr_info *object, std::size_t, void *argument) {
    auto &search = *static_cast<Search *>(argument);
    if (object->dlpi_addr != search.base) {
        return 0;
    }
    const std::span headers(object->dlpi_phdr, object->dlpi_phnum);
    ElfW(Addr) readOnlyEnd = 0;
    for (const auto &header : headers) {
        if (header.p_type == PT_GNU_RELRO) {
            const auto page = static_cast<ElfW(Addr)>(sysconf(_SC_PAGESIZE));
            readOnlyEnd = (header.p_vaddr + header.p_memsz) / page * page;
        }
    }
    for (const auto &header : headers) {
        const ElfW(Addr) start = std::max(header.p_vaddr, readOnlyEnd);
        const ElfW(Addr) end = header.p_vaddr + header.p_memsz;
        if (header.p_type == PT_LOAD && (header.p_flags & PF_W) != 0 && start < end) {
            search.writable.emplace_back(reinterpret_cast<std::uint8_t *>(search.base + start), end - start);
        }
    }
    return 1;
}

template <class Function>
void resolve(void *handle, const char *name, Function &function) {
    void *const symbol = dlsym(handle, name);
    if (symbol == nullptr) {
        throw std::runtime_error(dlerror());
    }
    std::memcpy(&function, &symbol, sizeof function);
}

} // namespace

Plugin::Plugin(const std::string &path) : handle_(dlopen(path.c_str(), RTLD_NOW | RTLD_LOCAL)) {
    if (handle_ == nullptr) {
        throw std::runtime_error(dlerror());
    }
    resolve(handle_, "vex_PreDecodeTO", passes[NETFLOOR_MODE_TO]);
    resolve(handle_, "vex_PreDecodeMD", passes[NETFLOOR_MODE_MD]);
    resolve(handle_, "vex_PreDecodeMV", passes[NETFLOOR_MODE_MV]);
    resolve(handle_, "XTR_netfloor", extract);
    resolve(handle_, "date_conv", dateConv);
    resolve(handle_, "vx_DLLGetPtr", getPtr);
    resolve(handle_, "vx_DLLGetTable", getTable);
    link_map *map = nullptr;
    if (dlinfo(handle_, RTLD_DI_LINKMAP, &map) != 0) {
        throw std::runtime_error(dlerror());
    }
    Search search{map->l_addr, {}};
    dl_iterate_phdr(collectWritable, &search);
    writable_ = std::move(search.writable);
    asLoaded_ = variables();
}

Variables Plugin::variables() const {
    Variables values;
    for (const auto part : writable_) {
        values.emplace_back(part.begin(), part.end());
    }
    return values;
}

void Plugin::setVariables(const Variables &values) const {
    for (std::size_t i = 0; i < writable_.size(); ++i) {
        std::memcpy(writable_[i].data(), values[i].data(), writable_[i].size());
    }
}

} // namespace netfloor::compare
