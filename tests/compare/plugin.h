// SPDX-License-Identifier: MIT
// One of the two plug-ins, with a copy of its variables to go back to.
#pragma once

#include <array>
#include <cstdint>
#include <span>
#include <string>
#include <vector>

#include <netfloor/descriptors.h>

namespace netfloor::compare {

// What the variables of a plug-in held at a moment.
using Variables = std::vector<std::vector<std::uint8_t>>;

class Plugin {
public:
    // Throws std::runtime_error.
    explicit Plugin(const std::string &path);

    // The modes of the boundary are the indices.
    std::array<NetfloorPreDecode, 3> passes{};
    NetfloorExtract extract = nullptr;
    NetfloorDateConv dateConv = nullptr;
    NetfloorGetTable getPtr = nullptr;
    NetfloorGetTable getTable = nullptr;

    [[nodiscard]] Variables variables() const;
    void setVariables(const Variables &values) const;

    // As if it had been loaded just now.
    void setAsLoaded() const { setVariables(asLoaded_); }

    [[nodiscard]] const void *handle() const { return handle_; }

private:
    void *handle_ = nullptr; // never unloaded: both plug-ins live as long as the program
    std::vector<std::span<std::uint8_t>> writable_;
    Variables asLoaded_;
};

} // namespace netfloor::compare
