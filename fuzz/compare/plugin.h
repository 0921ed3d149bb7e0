// SPDX-License-Identifier: MIT
// A plug-in, which can be loaded anew.
#pragma once

#include <array>
#include <string>

#include <netfloor/descriptors.h>
#include <netfloor/host.h>

#include "trace.h"

namespace netfloor::compare {

struct Plugin {
    // It stays loaded. Throws std::runtime_error.
    explicit Plugin(const std::string &path);

    // Its variables hold again what they held at first.
    void loadAnew();

    std::string path;
    void *handle = nullptr;
    std::array<NetfloorPreDecode, 3> passes{}; // by the modes of the boundary
    NetfloorExtract extract = nullptr;
    NetfloorDateConv dateConv = nullptr;
    NetfloorGetTable getPtr = nullptr, getTable = nullptr;

private:
    void load();
};

// All that the exports tell without a packet: the tables of both, and the formatter.
void traceExports(const Plugin &plugin, Trace &trace);

} // namespace netfloor::compare
