// SPDX-License-Identifier: MIT
// The forwarding header of minimal encapsulation (RFC 2004), between an IPv4 header and its payload.
//
//    0                   1                   2                   3
//    0 1 2 3 4 5 6 7 8 9 0 1 2 3 4 5 6 7 8 9 0 1 2 3 4 5 6 7 8 9 0 1
//   +---------------+-+-------------+-------------------------------+
//   |MIPinIPProtocol|S|  Reserved   |        Header Checksum        |
//   +---------------+-+-------------+-------------------------------+
//   |                     Original Dest Address                     |
//   +---------------------------------------------------------------+
//   |             Original Src Address, where S is 1                |
//   +---------------------------------------------------------------+
//
// The lengths are those of the outer header, less the octets of the forwarding header.
#pragma once

#include <array>
#include <cstdint>

#include "frame/field.h"
#include "frame/field_list.h"
#include "frame/field_step.h"
#include "ipv4/options.h"
#include "names/ip_protocols.h"

namespace netfloor::plugin::minimal {

inline constexpr std::array sourcePresentRows = {
    ValueName{0, "Original Source Address NOT Present"},
    ValueName{1, "Original Source Address Present"},
};
inline constexpr ValueNames sourcePresentNames{sourcePresentRows};

// The checksum is shown as one element for each digit.
// clang-format off
inline constexpr Field protocol           {640, "MIPinIP Protocol",      octets(1),                                               "%n=%-S",                &protocolNames,      "MIPinIP - %-S"};
inline constexpr Field reserved           {641, "  Reserved",            piece(0, 6),                                             "  %n=%x"};
inline constexpr Field sourcePresent      {642, "  S",                   bit(7).advancing(8),                                     "  %n=%-S",              &sourcePresentNames};
inline constexpr Field headerChecksum     {643, "Header Checksum",       pieces({4, 7}, {0, 3}, {12, 15}, {8, 11}).advancing(16), R"(  %n=%-["%x"](hex))", noNames,             "%x"};
inline constexpr Field destinationAddress {646, "Original Dest Address", octets(4),                                               R"(  %n=%-["%u":"."])"};
inline constexpr Field sourceAddress      {651, "Original Src Address",  octets(4),                                               R"(  %n=%-["%u":"."])"};
// clang-format on

inline constexpr std::uint32_t headerOctets = 8;
inline constexpr std::uint32_t sourceAddressOctets = 4;

template <class Pass>
NETFLOOR_INLINE inline void header(Reader<Pass> &reader) {
    auto &variables = reader.variables();
    std::uint32_t minimalSourcePresent = 0;
    read<protocol>(reader, &variables.ipProtocol);
    read<reserved>(reader);
    read<sourcePresent>(reader, &minimalSourcePresent);
    read<headerChecksum>(reader);
    read<destinationAddress>(reader);
    if (!reader.live) {
        return;
    }
    variables.ipTotalLength -= headerOctets;
    if (minimalSourcePresent == 1) {
        variables.ipTotalLength -= sourceAddressOctets;
        read<sourceAddress>(reader);
    }
    // The options of the header around it stand before the forwarding header, which has none of its own.
    ipv4::options(reader, 0);
    if (reader.live) {
        variables.payloadOctets = static_cast<std::int32_t>(variables.ipTotalLength - variables.ipHeaderOctets);
    }
}

// clang-format off
using HeaderRows = Rows<
    FieldList<protocol, reserved, sourcePresent, headerChecksum, destinationAddress, sourceAddress>,
    FieldList<protocol, destinationAddress, sourceAddress>>;
// clang-format on

} // namespace netfloor::plugin::minimal
