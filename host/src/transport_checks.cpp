// SPDX-License-Identifier: MIT
// The checks of TCP, UDP, ICMP and ICMPv6.
#include <algorithm>
#include <array>

#include "checksum.h"
#include "packet_walk.h"

namespace netfloor {

namespace {

constexpr std::size_t tcpOctets = 20;
constexpr std::size_t udpOctets = 8;

// The lengths that the RFCs give to options of TCP.
struct OptionLength {
    std::uint32_t kind;
    std::size_t least;
    std::size_t most;
};
constexpr std::array optionLengths = {
    OptionLength{2, 4, 4},   OptionLength{3, 3, 3},   OptionLength{4, 2, 2},
    OptionLength{5, 10, 34}, OptionLength{8, 10, 10}, OptionLength{19, 18, 18},
    OptionLength{28, 4, 4},  OptionLength{29, 4, 40}, OptionLength{30, 3, 40},
};

// Tunnels whose outer checksum may be 0 over IPv6 (RFC 6935).
bool mayLackChecksum(std::uint32_t port) {
    constexpr std::array<std::uint32_t, 6> tunnels = {2152, 4341, 4754, 4789, 6081, 6635};
    return std::ranges::find(tunnels, port) != tunnels.end();
}

} // namespace

void PacketWalk::checksum(const Payload &payload, std::string_view protocol, std::size_t fieldAt) {
    const std::size_t octets = payload.end - payload.at;
    if (payload.isFragment || !payload.hasAddresses || !has(payload.at, octets)) {
        return;
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
    while (at < end) {
        const std::uint32_t kind = u8(at);
        if (kind == 0) {
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
        return checksum(payload, "UDP", at + 6);
    }
    if (payload.isIpv6 && !mayLackChecksum(u16(at)) && !mayLackChecksum(u16(at + 2))) {
        damage("UDP", "the checksum is 0, which IPv6 does not allow", at + 6);
    }
}

void PacketWalk::icmp(const Payload &payload) {
    if (!hasHeader("ICMP", payload.at, payload.end, 8)) {
        return;
    }
    const bool isWhole = !payload.isFragment && has(payload.at, payload.end - payload.at);
    if (isWhole && !isSoundSum(addOctets(0, part(payload.at, payload.end)))) {
        damage("ICMP", "the checksum is wrong", payload.at + 2);
    }
    const std::uint32_t type = u8(payload.at);
    constexpr std::array<std::uint32_t, 11> codeZero = {0, 4, 8, 9, 10, 13, 14, 15, 16, 17, 18};
    if (u8(payload.at + 1) != 0 && std::ranges::find(codeZero, type) != codeZero.end()) {
        add(FaultKind::misread, "ICMP", "the plug-in reads type # with code 0 only", payload.at + 1, type);
    }
    constexpr std::array<std::uint32_t, 5> errors = {3, 4, 5, 11, 12};
    if (std::ranges::find(errors, type) != errors.end()) {
        quoted(payload.at + 8, payload.end);
    }
}

// A quote may end anywhere: what is after it counts as not captured.
void PacketWalk::quoted(std::size_t at, std::size_t end) {
    if (isQuoted_ || !has(at, 6) || at + 6 > end) {
        return;
    }
    const std::size_t length = u8(at) >> 4U == 6 ? 40 + std::size_t{u16(at + 4)} : u16(at + 2);
    const auto all = octets_;
    octets_ = octets_.first(std::min(octets_.size(), end));
    isQuoted_ = true;
    ip(at, std::max(at + length, end));
    isQuoted_ = false;
    octets_ = all;
}

void PacketWalk::icmpv6(const Payload &payload) {
    if (!hasHeader("ICMPv6", payload.at, payload.end, 4)) {
        return;
    }
    checksum(payload, "ICMPv6", payload.at + 2);
    if (payload.isFragment || !has(payload.at, payload.end - payload.at)) {
        return;
    }
    const std::uint32_t type = u8(payload.at);
    if (type >= 1 && type <= 4) {
        return quoted(payload.at + 8, payload.end);
    }
    if (type == 143 && hasHeader("ICMPv6", payload.at, payload.end, 8)) {
        return multicastRecords(payload.at, payload.end);
    }
    constexpr std::array<std::size_t, 5> headers = {8, 16, 24, 24, 40}; // of neighbour discovery, types 133 to 137
    if (type < 133 || type > 137) {
        return;
    }
    const std::size_t header = headers[type - 133];
    if (hasHeader("ICMPv6", payload.at, payload.end, header)) {
        neighbourOptions(payload.at + header, payload.end);
    }
}

// RFC 3810.
void PacketWalk::multicastRecords(std::size_t at, std::size_t end) {
    constexpr std::size_t recordHead = 20;
    std::size_t record = at + 8;
    for (std::uint32_t left = u16(at + 6); left != 0; --left) {
        const std::size_t octets = record + recordHead <= end ? recordHead + std::size_t{16} * u16(record + 2) +
                                                                    std::size_t{4} * u8(record + 1)
                                                              : recordHead;
        if (record + octets > end) {
            return damage("ICMPv6", "a multicast record ends # octets after the packet", record, record + octets - end);
        }
        record += octets;
    }
}

void PacketWalk::neighbourOptions(std::size_t at, std::size_t end) {
    while (at + 2 <= end) {
        const std::size_t octets = u8(at + 1) * std::size_t{8};
        if (octets == 0) {
            return damage("ICMPv6", "option # has a length of 0", at, u8(at));
        }
        if (at + octets > end) {
            return damage("ICMPv6", "option # ends # octets after the packet", at, u8(at), at + octets - end);
        }
        at += octets;
    }
}

} // namespace netfloor
