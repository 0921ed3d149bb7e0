// SPDX-License-Identifier: MIT
// The hand-off: chooses by the ports who owns the payload, and gives control back to the host.
#pragma once

#include <cstdint>

#include "frame/block.h"
#include "frame/reader.h"
#include "netfloor/records.h"

namespace netfloor {

// A payload of so many bits or less is left unread.
inline constexpr std::uint32_t handOffAbove = 32;

// Who gets the payload.
struct NextLayer {
    std::uint32_t key;
    std::uint32_t port;
    bool writesPort;
    bool writesProtocol;
};

// Below this a source port is well known, and wins over everything.
inline constexpr std::uint32_t wellKnownPorts = 1024;
// Below this a port is taken as a server's.
inline constexpr std::uint32_t serverPorts = 9000;
// The signalling of the control plane, on either side: looked up without the protocol.
inline constexpr std::uint32_t signallingPort = 3452;

[[nodiscard]] constexpr NextLayer chooseNextLayer(std::uint32_t source, std::uint32_t destination,
                                                  std::uint32_t protocol) {
    const auto byPort = [](std::uint32_t port) { return NextLayer{port, port, true, port != signallingPort}; };
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

// Tells the next layer how many octets it has, and how many of the IPv4 datagram stand in front of them. Over
// IPv6 the latter is the negated payload, as no Total Length was read.
template <class Pass>
NETFLOOR_INLINE inline void tellNextLayer(Reader<Pass> &at) {
    const auto &variables = at.variables();
    const auto payloadOctets = static_cast<std::uint32_t>(variables.payloadOctets);
    at.state->scratch[NETFLOOR_NEXT_LAYER_OCTETS] = payloadOctets;
    at.state->scratch[NETFLOOR_PRECEDING_OCTETS] = variables.ipTotalLength - payloadOctets;
}

// Hands the rest of the packet to the owner of the next layer. The XTR pass ends here; the others come back
// with the cursor where the next layer left it.
template <class Pass>
NETFLOOR_INLINE inline void handOff(Reader<Pass> &at) {
    if (!at.live) {
        return;
    }
    const auto &variables = at.variables();
    const Block<Pass> choice{at, ""};
    const NextLayer next = chooseNextLayer(variables.sourcePort, variables.destinationPort, variables.ipProtocol);
    if (next.writesPort && !at.over()) {
        at.state->scratch[NETFLOOR_NEXT_LAYER_PORT] = next.port;
    }
    const Block<Pass> transfer{at, "NEXT LAYER"};
    if (at.over()) {
        return;
    }
    LayerFrame &frame = at.state->layerFrames[at.state->layerIndex];
    frame.nextLayerKey = next.key;
    if (next.writesProtocol) {
        frame.nextLayerProtocol = variables.ipProtocol;
    }
    at.state->layerHandedOff = 1;
    at.giveState();
    at.context->bitsLeft = at.left;
    const std::uint32_t payload = at.cursor;
    if (const Outcome outcome = Pass::transfer(*at.context); outcome != Outcome::on) {
        at.end(outcome);
        return;
    }
    at.takeState();
    at.variables().copyRestored = false; // the next layer may have changed it
    // What the next layer leaves in front of its payload or beyond the limit is not the grammar's to read on.
    const std::uint32_t end = at.state->limits.base[at.limitDepth] + 1;
    if (at.cursor < payload || at.cursor > end || at.left > end - at.cursor) {
        at.live = false;
    }
}

} // namespace netfloor
