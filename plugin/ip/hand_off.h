// SPDX-License-Identifier: MIT
// The hand-off of TCP, UDP and SCTP: the ports choose the owner of the payload.
#pragma once

#include <cstdint>

#include "frame/block.h"
#include "frame/hand_off.h"
#include "frame/inline.h"
#include "frame/reader.h"
#include "netfloor/records.h"

namespace netfloor::plugin {

// A payload of this many bits or fewer is not handed off.
inline constexpr std::uint32_t handOffAbove = 32;

// A source port below this is well known, and is preferred to all others.
inline constexpr std::uint32_t wellKnownPorts = 1024;
// A port below this is taken for a server's.
inline constexpr std::uint32_t serverPorts = 9000;
// The port of control-plane signalling, as a source port preferred too. Its hand-off does not write the protocol.
inline constexpr std::uint32_t signallingPort = 3452;

[[nodiscard]] NETFLOOR_INLINE constexpr NextLayer chooseNextLayer(std::uint32_t source, std::uint32_t destination,
                                                                  std::uint32_t protocol) {
    const auto byPort = [](std::uint32_t port) NETFLOOR_INLINE {
        return NextLayer{port, port, true, port != signallingPort};
    };
    if (source < wellKnownPorts || source == signallingPort) {
        return byPort(source);
    }
    if (destination < serverPorts) {
        return byPort(destination);
    }
    if (source < serverPorts) {
        return byPort(source);
    }
    return {.key = protocol, .port = 0, .writesPort = false, .writesProtocol = false};
}

// Tells the next layer how many octets it has, and how many octets of the IPv4 datagram precede them. Over
// IPv6 the latter is the negated payload length, as no Total Length was read.
template <class Pass>
NETFLOOR_INLINE inline void tellNextLayer(Reader<Pass> &reader) {
    const auto &variables = reader.variables();
    const auto payloadOctets = static_cast<std::uint32_t>(variables.payloadOctets);
    reader.state->scratch[NETFLOOR_NEXT_LAYER_OCTETS] = payloadOctets;
    reader.state->scratch[NETFLOOR_PRECEDING_OCTETS] = variables.ipTotalLength - payloadOctets;
}

// Hands the rest of the packet to the owner that the ports choose.
template <class Pass>
NETFLOOR_INLINE inline void handOff(Reader<Pass> &reader) {
    if (!reader.live) {
        return;
    }
    const auto &variables = reader.variables();
    const Block<Pass> choice{reader, ""};
    const NextLayer next = chooseNextLayer(variables.sourcePort, variables.destinationPort, variables.ipProtocol);
    if (next.writesPort && !reader.ended()) {
        reader.state->scratch[NETFLOOR_NEXT_LAYER_PORT] = next.port;
    }
    handOffTo(reader, next, variables.ipProtocol);
}

} // namespace netfloor::plugin
