// SPDX-License-Identifier: MIT
// A packet as the capture has it.
#pragma once

#include <compare>
#include <cstdint>
#include <optional>
#include <span>
#include <string_view>

namespace netfloor {

constexpr std::uint32_t nanosecondsPerSecond = 1'000'000'000;

// Time since 1970-01-01 00:00:00 UTC; the nanoseconds are always below a second.
struct CaptureTime {
    std::int64_t seconds = 0;
    std::uint32_t nanoseconds = 0;

    // The same as one number; none before the year 1678 and after 2261, where 64 bits do not hold it.
    [[nodiscard]] std::optional<std::int64_t> inNanoseconds() const {
        std::int64_t product = 0;
        std::int64_t sum = 0;
        if (__builtin_mul_overflow(seconds, std::int64_t{nanosecondsPerSecond}, &product) ||
            __builtin_add_overflow(product, nanoseconds, &sum)) {
            return std::nullopt;
        }
        return sum;
    }

    auto operator<=>(const CaptureTime &) const = default; // NOLINT(modernize-use-nullptr): taken for a null
};

struct CapturedPacket {
    std::uint64_t number = 0;   // from 1
    std::uint64_t position = 0; // octet of the capture, unpacked, at which the packet's record begins
    std::optional<CaptureTime> time = {};
    std::uint8_t timeDigits = 0;       // of a second, that the capture has: 6 for microseconds
    std::uint32_t interfaceNumber = 0; // within its section; 0 where the format has none
    int linkType = 0;                  // as files number it, see www.tcpdump.org/linktypes.html
    std::uint32_t wireOctets = 0;      // what the packet had before the snap length cut it
    // Valid until the next packet is read. Names and comments are as the file has them: any octets.
    std::span<const std::uint8_t> octets = {};
    std::string_view interfaceName = {};
    std::span<const std::string_view> comments = {};

    [[nodiscard]] bool isCut() const { return octets.size() < wireOctets; }
};

} // namespace netfloor
