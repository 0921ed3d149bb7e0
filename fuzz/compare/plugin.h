// SPDX-License-Identifier: MIT
// A plug-in, and where asked for a copy of its variables to go back to.
#pragma once

#include <array>
#include <cstdint>
#include <span>
#include <string>
#include <vector>

#include <netfloor/descriptors.h>
#include <netfloor/host.h>

#include "trace.h"

namespace netfloor::compare {

// What the variables of a plug-in held at a moment.
using Variables = std::vector<std::vector<std::uint8_t>>;

struct Plugin {
    // Between the variables of one under a sanitizer lies what must not be read.
    enum class Start : bool { kept, lost };

    // It stays loaded. Throws std::runtime_error.
    explicit Plugin(const std::string &path, Start start = Start::kept);

    void *handle;
    std::array<NetfloorPreDecode, 3> passes; // by the modes of the boundary
    NetfloorExtract extract;
    NetfloorDateConv dateConv;
    NetfloorGetTable getPtr, getTable;
    std::vector<std::span<std::uint8_t>> writable; // where its variables are
    Variables asLoaded;

    [[nodiscard]] Variables variables() const;
    void setVariables(const Variables &values) const;
};

// All that the exports tell without a packet: the tables of both, and the formatter.
void traceExports(const Plugin &plugin, Trace &trace);

} // namespace netfloor::compare
