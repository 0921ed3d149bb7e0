// SPDX-License-Identifier: MIT
#include "plugin.h"

#include <filesystem>
#include <stdexcept>

#include <dlfcn.h>

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

} // namespace

// A name without a folder would be looked for among the libraries of the system.
Plugin::Plugin(const std::string &name) : path(std::filesystem::absolute(name)) {
    load();
}

void Plugin::load() {
    handle = dlopen(path.c_str(), RTLD_NOW | RTLD_LOCAL);
    check(handle != nullptr);
    resolve(handle, "vex_PreDecodeTO", passes[NETFLOOR_MODE_TO]);
    resolve(handle, "vex_PreDecodeMD", passes[NETFLOOR_MODE_MD]);
    resolve(handle, "vex_PreDecodeMV", passes[NETFLOOR_MODE_MV]);
    resolve(handle, "XTR_netfloor", extract);
    resolve(handle, "date_conv", dateConv);
    resolve(handle, "vx_DLLGetPtr", getPtr);
    resolve(handle, "vx_DLLGetTable", getTable);
}

void Plugin::loadAnew() {
    check(dlclose(handle) == 0);
    if (dlopen(path.c_str(), RTLD_NOW | RTLD_NOLOAD) != nullptr) {
        throw std::runtime_error(path + " cannot be unloaded");
    }
    load();
}

} // namespace netfloor::compare
