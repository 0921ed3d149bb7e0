// SPDX-License-Identifier: MIT
// Numbers in network order out of octets. The caller has tested that they are there.
#pragma once

#include <cstddef>
#include <cstdint>
#include <span>

namespace netfloor {

[[nodiscard]] inline std::uint32_t be16(std::span<const std::uint8_t> octets, std::size_t at) {
    return std::uint32_t{octets[at]} << 8U | octets[at + 1];
}

[[nodiscard]] inline std::uint32_t be32(std::span<const std::uint8_t> octets, std::size_t at) {
    return be16(octets, at) << 16U | be16(octets, at + 2);
}

// Of four octets that begin there; compilers make one load of it.
[[nodiscard]] inline std::uint32_t loadBe32(const std::uint8_t *octets) {
    return std::uint32_t{octets[0]} << 24U | std::uint32_t{octets[1]} << 16U | std::uint32_t{octets[2]} << 8U |
           octets[3];
}

} // namespace netfloor
