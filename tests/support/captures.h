// SPDX-License-Identifier: MIT
// Capture files as a test writes them.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "support/packets.h"

namespace netfloor::test {

// A folder of its own for each test program, removed at its end.
[[nodiscard]] const std::string &folder();

// Writes a file into folder(), and gives its path.
std::string writeFile(const std::string &name, const Octets &octets);

// The paths of the captures in tests/captures, or in another folder.
[[nodiscard]] std::vector<std::string> testCaptures(const char *where = NETFLOOR_CAPTURES);

// A pcap file, in microseconds and the byte order of most machines, with packets one second apart. A packet whose
// `wireOctets` is more than it has was cut by the snap length.
struct PcapPacket {
    Octets octets;
    std::uint32_t wireOctets = 0; // 0: as many as it has
};
[[nodiscard]] Octets pcapFile(std::uint32_t linkType, const std::vector<PcapPacket> &packets);

// The blocks of a pcapng file in network byte order.
[[nodiscard]] Octets pcapngBlock(std::uint32_t type, const Octets &body);
[[nodiscard]] Octets pcapngSection();
[[nodiscard]] Octets pcapngInterface(std::uint16_t linkType, const Octets &options);
[[nodiscard]] Octets pcapngPacket(std::uint32_t interfaceNumber, std::uint64_t time, const Octets &octets);

} // namespace netfloor::test
