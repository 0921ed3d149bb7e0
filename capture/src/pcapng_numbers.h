// SPDX-License-Identifier: MIT
// The numbers of pcapng files (draft-ietf-opsawg-pcapng): kinds of blocks and of their options.
#pragma once

#include <cstdint>

namespace netfloor {

constexpr std::uint32_t sectionHeader = 0x0a0d0d0a;
constexpr std::uint32_t interfaceDescription = 1;
constexpr std::uint32_t packetBlock = 2; // obsolete, still found
constexpr std::uint32_t simplePacket = 3;
constexpr std::uint32_t enhancedPacket = 6;

constexpr std::uint32_t byteOrderMagic = 0x1a2b3c4d; // written in the order that the section has

constexpr std::uint16_t endOption = 0;
constexpr std::uint16_t commentOption = 1;
// Of an interface.
constexpr std::uint16_t nameOption = 2;
constexpr std::uint16_t timeResolutionOption = 9;
constexpr std::uint16_t timeOffsetOption = 14;

} // namespace netfloor
