// SPDX-License-Identifier: MIT
// The UDP ports of tunnels.
#pragma once

#include <cstdint>

namespace netfloor {

constexpr std::uint32_t gtpUPort = 2152;
constexpr std::uint32_t gtpCPort = 2123;
constexpr std::uint32_t vxlanPort = 4789;

[[nodiscard]] constexpr bool isGtpPort(std::uint32_t port) {
    return port == gtpUPort || port == gtpCPort;
}

} // namespace netfloor
