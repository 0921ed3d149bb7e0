// SPDX-License-Identifier: MIT
// The checks of the options of IPv4 and IPv6.
#include <algorithm>
#include <array>

#include "checksum.h"
#include "ip_numbers.h"
#include "packet_walk.h"

namespace netfloor {

namespace {

constexpr std::uint32_t timestampOption = 68;
constexpr std::uint32_t cipsoOption = 134;
constexpr std::uint32_t jumboOption = 194;
constexpr std::uint32_t homeAddressOption = 201;

// The lengths of an option of IPv4, with its type and length octets. `pointer` is the least one that it may hold, or 0.
struct Ipv4Option {
    std::uint32_t type;
    std::size_t least;
    std::size_t most;
    std::uint32_t pointer = 0;
};
constexpr std::size_t mostOptions = 40;
constexpr std::array ipv4OptionLengths = {
    Ipv4Option{7, 3, mostOptions, 4},
    Ipv4Option{11, 4, 4},
    Ipv4Option{12, 4, 4},
    Ipv4Option{25, 8, 8},
    Ipv4Option{68, 4, mostOptions, 5},
    Ipv4Option{82, 12, 12},
    Ipv4Option{130, 3, mostOptions},
    Ipv4Option{131, 3, mostOptions, 4},
    Ipv4Option{133, 3, mostOptions},
    Ipv4Option{134, 6, mostOptions},
    Ipv4Option{136, 4, 4},
    Ipv4Option{137, 3, mostOptions, 4},
    Ipv4Option{148, 4, 4},
};

// The same of IPv6, where the length counts the data alone, and the header that may have the option.
struct Ipv6Option {
    std::uint32_t type;
    std::size_t least;
    std::size_t most;
    std::uint32_t header;
};
constexpr std::size_t mostData = 255;
constexpr std::array ipv6OptionLengths = {
    Ipv6Option{4, 1, 1, protocolDestination},
    Ipv6Option{5, 2, 2, protocolHopByHop},
    Ipv6Option{7, 8, mostData, protocolHopByHop},
    Ipv6Option{38, 6, 6, protocolHopByHop},
    Ipv6Option{99, 4, mostData, protocolHopByHop},
    Ipv6Option{jumboOption, 4, 4, protocolHopByHop},
    Ipv6Option{homeAddressOption, 16, 16, protocolDestination},
};

} // namespace

void PacketWalk::ipv4Options(std::size_t at, std::size_t end) {
    while (at < end && has(at, 1)) {
        const std::uint32_t type = u8(at);
        if (type == 0) {
            return;
        }
        if (type == 1) {
            ++at;
            continue;
        }
        if (at + 2 > end) {
            return damage("IPv4", "option # has no length, as the header ends", at, type);
        }
        if (!has(at, 2)) {
            return;
        }
        const std::size_t octets = u8(at + 1);
        const auto *const row = std::ranges::find(ipv4OptionLengths, type, &Ipv4Option::type);
        const bool isKnown = row != ipv4OptionLengths.end();
        if (octets < 2 || (isKnown && (octets < row->least || octets > row->most))) {
            return damage("IPv4", "option # has a length of #", at, type, octets);
        }
        if (at + octets > end) {
            return damage("IPv4", "option # ends # octets after the header", at, type, at + octets - end);
        }
        if (isKnown && has(at, octets)) {
            ipv4Entries(type, row->pointer, at, at + octets);
        }
        at += octets;
        constexpr std::array<std::uint32_t, 8> read = {0, 1, 7, 68, 130, 131, 136, 137};
        if (at == end && has(at, 1) && std::ranges::find(read, u8(at)) != read.end()) {
            add(FaultKind::misread, "IPv4", "the plug-in reads the octet after the options as one more", at);
        }
    }
}

// Addresses, timestamps and the tags of CIPSO.
void PacketWalk::ipv4Entries(std::uint32_t type, std::uint32_t leastPointer, std::size_t at, std::size_t end) {
    if (type == cipsoOption) {
        return cipsoTags(at + 6, end);
    }
    if (leastPointer == 0) {
        return;
    }
    const bool isTimestamp = type == timestampOption;
    const std::uint32_t form = isTimestamp ? u8(at + 3) & 0xfU : 0;
    const std::size_t entry = form == 0 ? 4 : 8; // a timestamp alone, or with an address
    const std::uint32_t pointer = u8(at + 2);
    if ((end - at + 1 - leastPointer) % entry != 0) {
        damage("IPv4", "option # has a length of #, which holds no whole entries", at, type, end - at);
    }
    if (pointer < leastPointer || pointer > end - at + 1 || (pointer - leastPointer) % entry != 0) {
        damage("IPv4", "option # has a pointer of #", at, type, pointer);
    }
    if (form != 0 && form != 1 && form != 3) {
        note("IPv4", "the timestamp option has the unknown form #", at + 3, form);
    }
}

void PacketWalk::cipsoTags(std::size_t at, std::size_t end) {
    constexpr std::size_t tagHead = 4;
    while (at < end) {
        const std::size_t octets = at + 2 <= end ? u8(at + 1) : 0;
        if (octets < tagHead) {
            return damage("IPv4", "tag # of the CIPSO option has a length of #", at, u8(at), octets);
        }
        if (at + octets > end) {
            return damage("IPv4", "tag # of the CIPSO option ends # octets after it", at, u8(at), at + octets - end);
        }
        at += octets;
    }
}

void PacketWalk::ipv6Options(std::size_t at, std::size_t end, Payload &payload, std::size_t header) {
    const std::size_t start = at;
    while (at < end) {
        if (at != start && at == start + (u8(start) == 0 ? 1 : 2 + u8(start + 1))) {
            add(FaultKind::misread, "IPv6", "the plug-in reads the options after the first as the next header", at);
        }
        if (u8(at) == 0) {
            ++at;
            continue;
        }
        if (at + 2 > end) {
            return damage("IPv6", "option # has no length, as the header ends", at, u8(at));
        }
        const std::size_t next = at + 2 + u8(at + 1);
        if (next > end) {
            return damage("IPv6", "option # ends # octets after the header", at, u8(at), next - end);
        }
        ipv6Option(at, next, payload, header);
        at = next;
    }
}

void PacketWalk::ipv6Option(std::size_t at, std::size_t end, Payload &payload, std::size_t header) {
    const std::uint32_t type = u8(at);
    const auto *const row = std::ranges::find(ipv6OptionLengths, type, &Ipv6Option::type);
    if (row == ipv6OptionLengths.end()) {
        return;
    }
    const std::size_t octets = end - at - 2;
    if (octets < row->least || octets > row->most) {
        return damage("IPv6", "option # has a length of #", at, type, octets);
    }
    if (row->header != payload.protocol) {
        note("IPv6", "option # belongs into another kind of header", at, type);
    }
    if (type == homeAddressOption) {
        payload.otherSource = addOctets(addOctets(0, part(at + 2, end)), part(header + 24, header + ipv6Octets));
    } else if (type == jumboOption) { // RFC 2675
        payload.isJumbo = true;
        if (u32(at + 2) <= mostPayload) {
            damage("IPv6", "the jumbo payload has # octets, which need no such option", at, u32(at + 2));
        }
        if (u16(header + 4) != 0) {
            damage("IPv6", "a jumbo payload option with a payload length of #", at, u16(header + 4));
        }
    }
}

} // namespace netfloor
