// SPDX-License-Identifier: MIT
// IPv6 addresses (RFC 4291), which occur in headers, options and parameters of several protocols.
#pragma once

#include "frame/bit_order.h"
#include "frame/block.h"
#include "frame/field.h"
#include "frame/field_step.h"

namespace netfloor::plugin::ipv6 {

// clang-format off
inline constexpr Field listedAddress {856, "        IP Address", addressReversed(), R"(        %n=%-["%x":":"])"};
inline constexpr Field address       {948, "IP Address",         addressGroups(),   R"(%n=%-["%x":"."])"};
inline constexpr Field addressKey    {950, "IP Address",         addressNibbles(),  ""};
// clang-format on

// An address is read twice: `shown` gives its text, and `key` what the key record keeps.
template <const Field &shown, const Field &key, class Pass>
NETFLOOR_INLINE inline void addressReadTwice(Reader<Pass> &reader) {
    if (!reader.live) {
        return;
    }
    const Block<Pass> block{reader, "IP Address"};
    read<shown>(reader);
    stepBack(reader, addressBits);
    read<key>(reader);
}

// An address read with the bits of each octet reversed, twice over, so that its groups show in network order.
template <Report report, class Pass>
void reversedAddress(Reader<Pass> &reader) {
    const ReversedBits<Pass> reversed{reader, report};
    const Block<Pass> block{reader, "IPv6 Address"};
    read<listedAddress>(reader);
}

} // namespace netfloor::plugin::ipv6
