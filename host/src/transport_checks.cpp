// SPDX-License-Identifier: MIT
// The checks of TCP and UDP.
#include <algorithm>
#include <array>

#include "checksum.h"
#include "ip_numbers.h"
#include "packet_walk.h"
#include "ports.h"

namespace netfloor {

namespace {

// The lengths that the RFCs give to options of TCP.
struct OptionLength {
    std::uint32_t kind;
    std::size_t least;
    std::size_t most;
};
constexpr std::array optionLengths = {
    OptionLength{2, 4, 4},    OptionLength{3, 3, 3},    OptionLength{4, 2, 2},   OptionLength{5, 10, 34},
    OptionLength{6, 6, 6},    OptionLength{7, 6, 6},    OptionLength{8, 10, 10}, OptionLength{9, 2, 2},
    OptionLength{10, 3, 3},   OptionLength{11, 6, 6},   OptionLength{12, 6, 6},  OptionLength{13, 6, 6},
    OptionLength{14, 3, 3},   OptionLength{19, 18, 18}, OptionLength{20, 4, 4},  OptionLength{21, 6, 6},
    OptionLength{22, 2, 2},   OptionLength{23, 2, 2},   OptionLength{27, 8, 8},  OptionLength{28, 4, 4},
    OptionLength{29, 4, 40},  OptionLength{30, 3, 40},  OptionLength{34, 2, 18}, OptionLength{253, 4, 40},
    OptionLength{254, 4, 40},
};

// Tunnels whose outer checksum may be 0 over IPv6 (RFC 6935).
bool mayLackChecksum(std::uint32_t port) {
    constexpr std::array<std::uint32_t, 6> tunnels = {gtpUPort, 4341, 4754, vxlanPort, 6081, 6635};
    return std::ranges::find(tunnels, port) != tunnels.end();
}

} // namespace

void PacketWalk::checksum(const Payload &payload, std::string_view protocol, std::size_t fieldAt) {
    const std::size_t octets = payload.end - payload.at;
    if (payload.isFragment || !has(payload.at, octets)) {
        return;
    }
    if (!payload.hasAddresses) {
        return note(protocol, "the checksum is not checked, as the routing header does not tell the last address",
                    fieldAt);
    }
    const std::array<std::uint8_t, 8> head = {static_cast<std::uint8_t>(octets >> 24U),
                                              static_cast<std::uint8_t>(octets >> 16U),
                                              static_cast<std::uint8_t>(octets >> 8U),
                                              static_cast<std::uint8_t>(octets),
                                              0,
                                              0,
                                              0,
                                              payload.protocol};
    const std::uint64_t pseudo = addOctets(payload.addresses, head);
    const std::uint64_t segment = addOctets(0, part(payload.at, payload.end));
    if (isSoundSum(pseudo + segment)) {
        return;
    }
    if (payload.otherSource != 0 && isSoundSum(addOctets(payload.otherSource, head) + segment)) {
        return;
    }
    // A card is handed the sum of the addresses, with the length or, for a segment that it divides, without it.
    const std::uint16_t stored = folded(addOctets(0, part(fieldAt, fieldAt + 2)));
    const std::uint16_t withoutLength = folded(addOctets(payload.addresses, std::span(head).subspan(4)));
    if (stored == 0 || stored == folded(pseudo) || stored == withoutLength) {
        return note(protocol, "the checksum is left to the network card", fieldAt);
    }
    damage(protocol, "the checksum is wrong", fieldAt);
}

void PacketWalk::tcp(const Payload &payload) {
    const std::size_t at = payload.at;
    if (!hasHeader("TCP", at, payload.end, tcpOctets)) {
        return;
    }
    const std::size_t header = (u8(at + 12) >> 4U) * std::size_t{4};
    if (header < tcpOctets) {
        return damage("TCP", "the data offset is # octets, and # is the least", at + 12, header, tcpOctets);
    }
    if (at + header > payload.end) {
        return damage("TCP", "the data offset is # octets, and the segment has #", at + 12, header, payload.end - at);
    }
    const std::uint32_t flags = u8(at + 13);
    if ((flags & 0x10U) == 0 && u32(at + 8) != 0) {
        note("TCP", "an acknowledgment number without the flag ACK", at + 8);
    }
    if ((flags & 0x20U) == 0 && u16(at + 18) != 0) {
        note("TCP", "an urgent pointer without the flag URG", at + 18);
    }
    if (has(at, header)) {
        tcpOptions(at + tcpOctets, at + header);
    }
    checksum(payload, "TCP", at + 16);
}

void PacketWalk::tcpOptions(std::size_t at, std::size_t end) {
    constexpr std::uint32_t windowScale = 3;
    constexpr std::uint32_t mostShift = 14;
    while (at < end) {
        const std::uint32_t kind = u8(at);
        if (kind == 0) {
            if (std::ranges::any_of(part(at, end), [](std::uint8_t octet) { return octet != 0; })) {
                note("TCP", "octets after the end of the options are not 0", at);
            }
            return;
        }
        if (kind == 1) {
            ++at;
            continue;
        }
        if (at + 2 > end) {
            return damage("TCP", "option # has no length, as the header ends", at, kind);
        }
        const std::size_t octets = u8(at + 1);
        if (octets < 2) {
            return damage("TCP", "option # has a length of #", at, kind, octets);
        }
        if (at + octets > end) {
            return damage("TCP", "option # ends # octets after the header", at, kind, at + octets - end);
        }
        const auto *const row = std::ranges::find(optionLengths, kind, &OptionLength::kind);
        const bool isOdd = kind == 5 && octets % 8 != 2;
        if (row != optionLengths.end() && (octets < row->least || octets > row->most || isOdd)) {
            damage("TCP", "option # has a length of #", at, kind, octets);
        } else if (kind == windowScale && u8(at + 2) > mostShift) {
            note("TCP", "the window scale is #, and # is the most", at + 2, u8(at + 2), mostShift);
        }
        at += octets;
    }
}

void PacketWalk::udp(Payload payload) {
    const std::size_t at = payload.at;
    if (!hasHeader("UDP", at, payload.end, udpOctets)) {
        return;
    }
    const std::size_t length = u16(at + 4);
    const std::size_t room = payload.end - at;
    if (length == 0 && payload.isIpv6 && room > 0xffff) {
        return checksum(payload, "UDP", at + 6); // a jumbogram (RFC 2675)
    }
    if (length < udpOctets) {
        return damage("UDP", "the length is # octets, and # is the least", at + 4, length, udpOctets);
    }
    if (length > room && !payload.isFragment) {
        return damage("UDP", "the length is # octets, and the datagram has #", at + 4, length, room);
    }
    if (length < room) {
        note("UDP", "# octets follow inside the datagram", at + length, room - length);
        payload.end = at + length;
    }
    if (u16(at + 6) != 0) {
        checksum(payload, "UDP", at + 6);
    } else if (payload.isIpv6 && !mayLackChecksum(u16(at)) && !mayLackChecksum(u16(at + 2))) {
        damage("UDP", "the checksum is 0, which IPv6 does not allow", at + 6);
    }
    if (!payload.isFragment) {
        inner(at, findInUdp(part(at, std::min(payload.end, octets_.size())), payload.end - at));
    }
}

} // namespace netfloor
