// SPDX-License-Identifier: MIT
// The grammar's variables that more than one protocol reads or sets. The others are declared by their protocol.
#pragma once

#include <cstdint>

namespace netfloor::plugin {

struct SharedVariables {
    std::uint32_t ipVersion;       // of the outermost header
    std::uint32_t ipProtocol;      // protocol number, or Next Header, that was read last
    std::uint32_t outerProtocol;   // of the outermost IPv4 header; over IPv6 the last Next Header
    std::uint32_t ipTotalLength;   // octets of the IPv4 datagram that was read last; 0 over IPv6
    std::uint32_t ipHeaderOctets;  // octets of the IPv4 header that was read last
    std::int32_t payloadOctets;    // octets of IP payload that no header has accounted for
    std::uint32_t sourcePort;      // of TCP, UDP and SCTP alike
    std::uint32_t destinationPort; // of TCP, UDP and SCTP alike
};

} // namespace netfloor::plugin
