// SPDX-License-Identifier: MIT
// The checksum of the Internet (RFC 1071). Sums are in the byte order of the machine, which the sum does not mind.
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <span>

namespace netfloor {

[[nodiscard]] inline std::uint64_t addOctets(std::uint64_t sum, std::span<const std::uint8_t> octets) {
    std::size_t at = 0;
    for (; at + 4 <= octets.size(); at += 4) {
        std::uint32_t word = 0;
        std::memcpy(&word, octets.data() + at, sizeof word);
        sum += word;
    }
    std::uint32_t rest = 0;
    std::memcpy(&rest, octets.data() + at, octets.size() - at);
    return sum + rest;
}

[[nodiscard]] constexpr std::uint16_t folded(std::uint64_t sum) {
    sum = (sum >> 32U) + (sum & 0xffffffffU);
    while (sum > 0xffff) {
        sum = (sum >> 16U) + (sum & 0xffffU);
    }
    return static_cast<std::uint16_t>(sum);
}

// Of octets that include their checksum.
[[nodiscard]] constexpr bool isSoundSum(std::uint64_t sum) {
    return folded(sum) == 0xffff;
}

} // namespace netfloor
