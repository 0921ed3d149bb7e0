// SPDX-License-Identifier: MIT
// The checks of ICMP and ICMPv6.
#include <algorithm>
#include <array>

#include "checksum.h"
#include "ip_numbers.h"
#include "packet_walk.h"

namespace netfloor {

namespace {

constexpr std::size_t errorHead = 8;

// The least octets of a message.
struct MessageLength {
    std::uint32_t type;
    std::size_t octets;
};
constexpr std::array icmpLengths = {MessageLength{13, 20}, MessageLength{14, 20}, MessageLength{17, 12},
                                    MessageLength{18, 12}};
constexpr std::array icmpv6Lengths = {
    MessageLength{1, 8},    MessageLength{2, 8},    MessageLength{3, 8},    MessageLength{4, 8},
    MessageLength{128, 8},  MessageLength{129, 8},  MessageLength{130, 24}, MessageLength{131, 24},
    MessageLength{132, 24}, MessageLength{133, 8},  MessageLength{134, 16}, MessageLength{135, 24},
    MessageLength{136, 24}, MessageLength{137, 40}, MessageLength{138, 16}, MessageLength{139, 16},
    MessageLength{140, 16}, MessageLength{143, 8},
};

template <std::size_t count>
std::size_t leastOctets(const std::array<MessageLength, count> &lengths, std::uint32_t type, std::size_t others) {
    const auto *const row = std::ranges::find(lengths, type, &MessageLength::type);
    return row == lengths.end() ? others : row->octets;
}

// The lengths of options of neighbour discovery, in units of 8 octets.
struct NeighbourOption {
    std::uint32_t type;
    std::size_t least;
    std::size_t most;
};
constexpr std::size_t mostUnits = 255;
constexpr std::array neighbourOptionLengths = {NeighbourOption{3, 4, 4},          NeighbourOption{5, 1, 1},
                                               NeighbourOption{17, 2, 3},         NeighbourOption{24, 1, 3},
                                               NeighbourOption{25, 3, mostUnits}, NeighbourOption{31, 2, mostUnits}};

} // namespace

void PacketWalk::icmp(const Payload &payload) {
    const std::size_t at = payload.at;
    constexpr std::size_t leastMessage = 8;
    if (!hasHeader("ICMP", at, payload.end, leastMessage)) {
        return;
    }
    const bool isWhole = !payload.isFragment && has(at, payload.end - at);
    if (isWhole && !isSoundSum(addOctets(0, part(at, payload.end)))) {
        damage("ICMP", "the checksum is wrong", at + 2);
    }
    const std::uint32_t type = u8(at);
    constexpr std::array<std::uint32_t, 11> codeZero = {0, 4, 8, 9, 10, 13, 14, 15, 16, 17, 18};
    if (u8(at + 1) != 0 && std::ranges::find(codeZero, type) != codeZero.end()) {
        add(FaultKind::misread, "ICMP", "the plug-in reads type # with code 0 only", at + 1, type);
    }
    if (!hasHeader("ICMP", at, payload.end, leastOctets(icmpLengths, type, leastMessage)) || payload.isFragment) {
        return;
    }
    constexpr std::uint32_t routerAdvertisement = 9;
    constexpr std::array<std::uint32_t, 3> extensible = {3, 11, 12}; // RFC 4884
    constexpr std::array<std::uint32_t, 2> others = {4, 5};
    if (type == routerAdvertisement) { // RFC 1256
        if (u8(at + 4) == 0 || u8(at + 5) < 2) {
            damage("ICMP", "a router advertisement of # addresses with # words each", at + 4, u8(at + 4), u8(at + 5));
        }
        (void)hasHeader("ICMP", at, payload.end, leastMessage + std::size_t{4} * u8(at + 4) * u8(at + 5));
    } else if (std::ranges::find(extensible, type) != extensible.end()) {
        quoteAndExtension("ICMP", payload, at + 5, 4);
    } else if (std::ranges::find(others, type) != others.end()) {
        quoted("ICMP", at + errorHead, payload.end);
    }
}

void PacketWalk::icmpv6(const Payload &payload) {
    const std::size_t at = payload.at;
    constexpr std::size_t leastMessage = 4;
    if (!hasHeader("ICMPv6", at, payload.end, leastMessage)) {
        return;
    }
    checksum(payload, "ICMPv6", at + 2);
    const std::uint32_t type = u8(at);
    const std::size_t header = leastOctets(icmpv6Lengths, type, leastMessage);
    if (payload.isFragment || !hasHeader("ICMPv6", at, payload.end, header)) {
        return;
    }
    switch (type) {
    case 1:
    case 3: return quoteAndExtension("ICMPv6", payload, at + 4, 8); // RFC 4884
    case 2:
    case 4: return quoted("ICMPv6", at + errorHead, payload.end);
    case 130: return multicastQuery(at, payload.end);
    case 133:
    case 134:
    case 135:
    case 136:
    case 137: return neighbourOptions(at + header, payload.end);
    case 143: return multicastRecords(at, payload.end);
    default: return;
    }
}

// RFC 4884. Before it the octet of the length was unused, so that a wrong one says nothing against the packet.
void PacketWalk::quoteAndExtension(std::string_view protocol, const Payload &payload, std::size_t lengthAt,
                                   std::size_t unit) {
    const std::size_t start = payload.at + errorHead;
    const std::size_t length = u8(lengthAt) * unit;
    if (start + length > payload.end) {
        note(protocol, "the quoted packet has # octets by its length, and the message has #", lengthAt, length,
             payload.end - start);
        return quoted(protocol, start, payload.end);
    }
    if (length == 0) {
        return quoted(protocol, start, payload.end);
    }
    quoted(protocol, start, start + length);
    icmpExtension(protocol, start + length, payload.end);
}

void PacketWalk::icmpExtension(std::string_view protocol, std::size_t at, std::size_t end) {
    constexpr std::size_t head = 4; // of the extension and of its objects
    if (at == end || !hasHeader(protocol, at, end, head) || !has(at, end - at)) {
        return;
    }
    if (u16(at + 2) != 0 && !isSoundSum(addOctets(0, part(at, end)))) {
        damage(protocol, "the checksum of the extension is wrong", at + 2);
    }
    for (std::size_t object = at + head; object < end;) {
        const std::size_t octets = object + head <= end ? u16(object) : 0;
        if (octets < head) {
            return damage(protocol, "an object of the extension has a length of #", object, octets);
        }
        if (object + octets > end) {
            return damage(protocol, "an object of the extension ends # octets after the message", object,
                          object + octets - end);
        }
        object += octets;
    }
}

// A quote has the IP header and 8 octets at least, where the packet had them. What is after the quote counts as not
// captured.
void PacketWalk::quoted(std::string_view protocol, std::size_t at, std::size_t end) {
    if (isQuoted_) {
        return;
    }
    constexpr std::size_t carried = 8;
    const bool isKnown = at + carried <= end && has(at, carried);
    const bool isV6 = isKnown && u8(at) >> 4U == 6;
    const std::size_t header = isV6 ? ipv6Octets : isKnown ? std::size_t{u8(at) & 0xfU} * 4 : ipv4Octets;
    const std::size_t length = isV6 ? ipv6Octets + u16(at + 4) : isKnown ? u16(at + 2) : header + carried;
    const std::size_t least = std::min(std::max(header, length), header + carried);
    if (end - at < least) {
        damage(protocol, "the quoted packet has # octets, and # is the least", at, end - at, least);
    }
    if (!isKnown) {
        return;
    }
    const auto all = octets_;
    octets_ = octets_.first(std::min(octets_.size(), end));
    isQuoted_ = true;
    ip(at, std::max(at + length, end));
    isQuoted_ = false;
    octets_ = all;
}

// RFC 3810; one of RFC 2710 ends after the address.
void PacketWalk::multicastQuery(std::size_t at, std::size_t end) {
    constexpr std::size_t shortQuery = 24;
    constexpr std::size_t head = 28;
    if (end - at != shortQuery && hasHeader("ICMPv6", at, end, head)) {
        (void)hasHeader("ICMPv6", at, end, head + ipv6AddressOctets * u16(at + head - 2));
    }
}

// RFC 3810.
void PacketWalk::multicastRecords(std::size_t at, std::size_t end) {
    constexpr std::size_t recordHead = 20;
    std::size_t record = at + 8;
    for (std::uint32_t left = u16(at + 6); left != 0; --left) {
        if (record + recordHead <= end && !has(record, recordHead)) {
            return;
        }
        const std::size_t octets = record + recordHead <= end ? recordHead + ipv6AddressOctets * u16(record + 2) +
                                                                    std::size_t{4} * u8(record + 1)
                                                              : recordHead;
        if (record + octets > end) {
            return damage("ICMPv6", "a multicast record ends # octets after the packet", record, record + octets - end);
        }
        record += octets;
    }
}

void PacketWalk::neighbourOptions(std::size_t at, std::size_t end) {
    while (at < end && has(at, 1)) {
        if (at + 2 > end) {
            return damage("ICMPv6", "option # has no length, as the packet ends", at, u8(at));
        }
        if (!has(at, 2)) {
            return;
        }
        const std::size_t units = u8(at + 1);
        if (units == 0) {
            return damage("ICMPv6", "option # has a length of 0", at, u8(at));
        }
        const auto *const row = std::ranges::find(neighbourOptionLengths, u8(at), &NeighbourOption::type);
        if (row != neighbourOptionLengths.end() && (units < row->least || units > row->most)) {
            damage("ICMPv6", "option # has a length of # times 8 octets", at, u8(at), units);
        }
        if (at + units * 8 > end) {
            return damage("ICMPv6", "option # ends # octets after the packet", at, u8(at), at + units * 8 - end);
        }
        at += units * 8;
    }
}

} // namespace netfloor
