// SPDX-License-Identifier: MIT
// UDP (RFC 768).
//
//    0      7 8     15 16    23 24    31
//   +--------+--------+--------+--------+
//   |   Source Port   | Destination Port|
//   +--------+--------+--------+--------+
//   |     Length      |    Checksum     |
//   +--------+--------+--------+--------+
//
// Neither the length nor the checksum is verified. The length of the next layer is computed from the lengths in the IP
// header.
#pragma once

#include "frame/block.h"
#include "frame/checked_run.h"
#include "frame/field.h"
#include "frame/field_list.h"
#include "frame/field_step.h"
#include "ip/hand_off.h"
#include "ip/outer_protocol.h"
#include "names/ports.h"

namespace netfloor::plugin::udp {

// clang-format off
inline constexpr Field sourcePort             {479, "UDP Source Port",      octetPair(), "  %n=%-S (%u)",    &portNames, "UDP - %-s (%u)"};
inline constexpr Field destinationPortIpInIp  {482, "UDP Destination Port", octetPair(), "  %n=%-S (%u)",    &portNames, "IPinIP - UDP - %-s (%u)"};
inline constexpr Field destinationPortMinimal {486, "UDP Destination Port", octetPair(), "  %n=%-S (%u)",    &portNames, "MIPinIP - UDP - %-s (%u)"};
inline constexpr Field destinationPort        {488, "UDP Destination Port", octetPair(), "  %n=%-S (%u)",    &portNames, "UDP - %-s (%u)"};
inline constexpr Field length                 {489, "UDP Length",           octetPair(), "  %n=%u octet(s)"};
inline constexpr Field checksum               {490, "Checksum",             octetPair(), "  %n=%x"};
// clang-format on

inline constexpr std::int32_t headerOctets = 8;

[[nodiscard]] constexpr bool isRadius(std::uint32_t port) {
    return port == 1812 || port == 1813;
}

template <class Pass>
NETFLOOR_INLINE inline void headerAndPayload(Reader<Pass> &reader) {
    auto &variables = reader.variables();
    const Block<Pass> header{reader, "User Datagram Protocol"};
    read<sourcePort>(reader, &variables.sourcePort);
    readByOuterProtocol<destinationPortIpInIp, destinationPortMinimal, destinationPort>(reader,
                                                                                        &variables.destinationPort);
    if (!reader.live) {
        return;
    }
    const Block<Pass> rest{reader, ""};
    read<length>(reader);
    read<checksum>(reader);
    if (reader.live) {
        variables.payloadOctets -= headerOctets;
        // The reply of a RADIUS server is handed off by the server's port.
        if (isRadius(variables.sourcePort)) {
            variables.destinationPort = variables.sourcePort;
        }
        tellNextLayer(reader);
    }
    if (reader.left > handOffAbove) {
        handOff(reader);
    }
}

template <class Pass>
NETFLOOR_INLINE inline void datagram(Reader<Pass> &reader) {
    checkedRun<sourcePort, checksum, headerAndPayload<Pass>>(reader);
}

// clang-format off
using DatagramRows = Rows<
    FieldList<sourcePort, destinationPortIpInIp, destinationPortMinimal, destinationPort, length, checksum>,
    FieldList<sourcePort, destinationPortIpInIp, destinationPortMinimal, destinationPort>>;

using FieldsOfTopOctet6 = FieldList<length, checksum>;
// clang-format on

} // namespace netfloor::plugin::udp
