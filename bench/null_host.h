// SPDX-License-Identifier: MIT
// The null host: the seven operations of a host, which do nothing, so that the plug-in alone is measured.
//
// The benchmark links this library before the reference host's libraries, so that a plug-in finds its operations
// first.
#pragma once

#include <cstddef>
#include <cstdint>

namespace netfloor::bench {

// How the null host lays out key records: a presence bit for each row, then a place of
// four octets for each row, then the area for values stored as octets.
inline constexpr std::size_t presenceOctets = 16;
inline constexpr std::size_t mostKeyRows = presenceOctets * 8;
inline constexpr std::size_t keyPlaceOctets = 4;
inline constexpr std::size_t byteAreaOffset = presenceOctets + mostKeyRows * keyPlaceOctets;
inline constexpr std::size_t byteAreaSize = 64; // for one value
inline constexpr std::size_t keyRecordOctets = byteAreaOffset + 16 * byteAreaSize;

constexpr std::size_t presencePlace(std::size_t row) {
    return row / 8;
}

constexpr std::uint8_t presenceMask(std::size_t row) {
    return static_cast<std::uint8_t>(1u << row % 8);
}

constexpr std::size_t valuePlace(std::size_t row) {
    return presenceOctets + row * keyPlaceOctets;
}

} // namespace netfloor::bench
