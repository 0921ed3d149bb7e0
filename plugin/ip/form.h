// SPDX-License-Identifier: MIT
// The forms of the grammar. A pass with checked runs has one for each usual kind of packet, in which the headers and
// the payload of that kind are in line; what else a packet may hold runs out of line there. All forms decode the same.
// Which one a packet starts in is chosen by a look at its version and its protocol: a wrong choice takes longer, and no
// more.
#pragma once

#include <array>
#include <cstdint>

#include "frame/bits.h"
#include "frame/inline.h"
#include "names/ip_protocols.h"
#include "netfloor/records.h"

namespace netfloor::plugin {

enum class Form : std::uint8_t {
    outOfLine, // for packets that are cut short, or that have something rare first
    ipv4Udp,
    ipv4Tcp,
    ipv6Udp,
};

// The forms that a packet can start in. A pass without checked runs takes the first.
inline constexpr std::array startForms = {Form::ipv4Udp, Form::ipv4Tcp, Form::ipv6Udp};

// The form of a header of each version: out of line where the form is one for the other version.
[[nodiscard]] constexpr Form ipv4Form(Form form) {
    return form == Form::ipv6Udp ? Form::outOfLine : form;
}

[[nodiscard]] constexpr Form ipv6Form(Form form) {
    return form == Form::ipv6Udp ? form : Form::outOfLine;
}

// The octets of an IPv4 header, which an IPv6 header has too, and where its protocol lies.
inline constexpr std::uint32_t leastHeaderBits = 160;
inline constexpr std::uint32_t protocolBit = 73;

[[nodiscard]] NETFLOOR_INLINE inline Form likelyForm(const DecodeState &state) {
    if (state.bitsLeft < leastHeaderBits || !onOctetBorder(state.cursor)) {
        return startForms.front();
    }
    const std::uint8_t *const header = octetsFrom(state.data, state.cursor);
    if (pieceAt<4, 7>(header, 1) == 6) {
        return Form::ipv6Udp;
    }
    return octetAt(header, protocolBit) == protocolTcp ? Form::ipv4Tcp : Form::ipv4Udp;
}

} // namespace netfloor::plugin
