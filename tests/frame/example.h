// SPDX-License-Identifier: MIT
// The packet of most tests of the frame: fields of every kind, a hand-off with 12 octets of payload, 3 octets after
// the datagram.
#pragma once

#include <array>

#include "netfloor-host/testing.h"
#include "support/packets.h"

namespace netfloor::test {

constexpr std::array<Pass, 4> allPasses = {Pass::md, Pass::to, Pass::mv, Pass::xtr};
constexpr std::array<Pass, 3> passesThatHandOn = {Pass::md, Pass::to, Pass::mv};

inline const Octets &examplePacket() {
    static const Octets packet = hex(R"(
        45 bb 00 28 00 ab e0 b9 40 11 0b cd  0a 00 00 01 c0 a8 00 02  # IPv4, 40 octets, UDP
        00 35 9c 40 00 14 be ef              # UDP from 53 to 40000
        61*12
        74 61 69
    )");
    return packet;
}

} // namespace netfloor::test
