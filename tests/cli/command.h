// SPDX-License-Identifier: MIT
// Runs the command as a user does, through a shell, and makes captures for it.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "support/packets.h"

namespace netfloor::test {

struct Outcome {
    int exitCode = -1;
    std::string out;
    std::string err;
};

// A shell line in which `netfloor` is the command, $C the folder of the test captures, $P the plug-in and
// $T folder().
[[nodiscard]] Outcome shell(const std::string &line);

// A folder of its own for each test program, removed at its end.
[[nodiscard]] const std::string &folder();

// Writes a file into folder().
void writeFile(const std::string &name, const Octets &octets);

// A pcap file, in microseconds and the byte order of most machines, with packets one second apart. A packet whose
// `wireOctets` is more than it has was cut by the snap length.
struct PcapPacket {
    Octets octets;
    std::uint32_t wireOctets = 0; // 0: all are there
};
[[nodiscard]] Octets pcapFile(std::uint32_t linkType, const std::vector<PcapPacket> &packets);

// The blocks of a pcapng file in network byte order.
[[nodiscard]] Octets pcapngBlock(std::uint32_t type, const Octets &body);
[[nodiscard]] Octets pcapngSection();
[[nodiscard]] Octets pcapngInterface(std::uint16_t linkType, const Octets &options);
[[nodiscard]] Octets pcapngPacket(std::uint32_t interfaceNumber, std::uint64_t time, const Octets &octets);

} // namespace netfloor::test
