// SPDX-License-Identifier: MIT
// The checks of IPv4 and IPv6, and of what leads from one IP header to the next.
#include "netfloor-host/checks.h"

#include <algorithm>
#include <array>
#include <charconv>

#include "checksum.h"
#include "ip_numbers.h"
#include "packet_walk.h"

namespace netfloor {

std::span<const Fault> PacketChecks::check(std::span<const std::uint8_t> packet, std::size_t wireOctets) {
    faults_.clear();
    PacketWalk(packet, faults_).ip(0, std::max(packet.size(), wireOctets));
    return faults_;
}

namespace {

void appendNumber(std::string &text, std::uint32_t number) {
    std::array<char, 10> digits;
    text.append(digits.data(), std::to_chars(digits.data(), digits.data() + digits.size(), number).ptr);
}

} // namespace

void appendFaultText(std::string &text, const Fault &fault) {
    text.append(fault.isQuoted ? "quoted " : "").append(fault.protocol).append(": ");
    std::string_view rest = fault.text;
    for (const std::uint32_t number : {fault.first, fault.second}) {
        const std::size_t place = rest.find('#');
        if (place == std::string_view::npos) {
            break;
        }
        text += rest.substr(0, place);
        appendNumber(text, number);
        rest.remove_prefix(place + 1);
    }
    text.append(rest).append(", at octet ");
    appendNumber(text, fault.octet);
}

std::string faultText(const Fault &fault) {
    std::string text;
    appendFaultText(text, fault);
    return text;
}

bool PacketWalk::hasHeader(std::string_view protocol, std::size_t at, std::size_t end, std::size_t count) {
    if (at + count > end) {
        damage(protocol, "the header ends # octets short of #", at, at + count - end, count);
        return false;
    }
    return has(at, count);
}

void PacketWalk::ip(std::size_t at, std::size_t end) {
    if (!hasHeader("IP", at, end, 1)) {
        return;
    }
    if (++layers_ > mostLayers) {
        note("IP", "more than # IP headers are not checked", at, mostLayers);
        return;
    }
    switch (u8(at) >> 4U) {
    case 4: return ipv4(at, end);
    case 6: return ipv6(at, end);
    default: damage("IP", "the version is #", at, u8(at) >> 4U);
    }
}

void PacketWalk::ipv4(std::size_t at, std::size_t end) {
    const std::size_t headerOctets = std::size_t{u8(at) & 0xfU} * 4;
    if (headerOctets < ipv4Octets) {
        return damage("IPv4", "the header length is # octets, and # is the least", at, headerOctets, ipv4Octets);
    }
    if (!hasHeader("IPv4", at, end, ipv4Octets)) {
        return;
    }
    std::size_t total = u16(at + 2);
    if (total == 0) {
        note("IPv4", "the total length is 0, as where the network card fills it in", at + 2);
        total = end - at;
    }
    if (total < headerOctets) {
        return damage("IPv4", "the total length is # octets, and the header alone has #", at + 2, total, headerOctets);
    }
    if (at + total > end) {
        damage("IPv4", "the total length is # octets, and the packet has #", at + 2, total, end - at);
        total = end - at;
    }
    if (!hasHeader("IPv4", at, at + total, headerOctets)) {
        if (headerOctets <= total) { // the snap length has cut it
            ipv4Options(at + ipv4Octets, at + headerOctets);
        }
        return;
    }
    if (!isSoundSum(addOctets(0, part(at, at + headerOctets)))) {
        if (u16(at + 10) == 0) {
            note("IPv4", "the header checksum is 0, as where the network card fills it in", at + 10);
        } else {
            damage("IPv4", "the header checksum is wrong", at + 10);
        }
    }
    ipv4Options(at + ipv4Octets, at + headerOctets);

    const std::uint32_t fragment = u16(at + 6);
    const std::size_t offset = std::size_t{fragment & 0x1fffU} * 8;
    constexpr std::size_t mostWithHeader = mostPayload - ipv4Octets; // the total length counts the header, too
    if (offset + total - headerOctets > mostWithHeader) {
        damage("IPv4", "the fragment ends at octet # of its datagram, and # is the most", at + 6,
               offset + total - headerOctets, mostWithHeader);
    }
    if (offset != 0) {
        return; // no header of what it carries
    }
    Payload carried;
    carried.at = at + headerOctets;
    carried.end = at + total;
    carried.protocol = static_cast<std::uint8_t>(u8(at + 9));
    carried.isFragment = (fragment & 0x2000U) != 0;
    carried.addresses = addOctets(0, part(at + 12, at + 20));
    payload(carried);
}

void PacketWalk::ipv6(std::size_t at, std::size_t end) {
    if (!hasHeader("IPv6", at, end, ipv6Octets)) {
        return;
    }
    const std::size_t length = u16(at + 4);
    std::size_t last = at + ipv6Octets + length;
    if (last > end) {
        damage("IPv6", "the payload length is # octets, and the packet has #", at + 4, length, end - at - ipv6Octets);
    }
    if (length == 0 && u8(at + 6) != protocolNone) {
        note("IPv6", "the payload length is 0, as of a jumbogram or where the network card fills it in", at + 4);
        constexpr std::array maybeIs = {protocolHopByHop, protocolTcp, protocolUdp};
        last = std::ranges::find(maybeIs, u8(at + 6)) != maybeIs.end() ? end : last;
    }
    Payload carried;
    carried.at = at + ipv6Octets;
    carried.end = std::min(last, end);
    carried.protocol = static_cast<std::uint8_t>(u8(at + 6));
    carried.isIpv6 = true;
    carried.addresses = addOctets(0, part(at + 8, at + ipv6Octets));
    extensionHeaders(carried, at);
}

void PacketWalk::extensionHeaders(Payload payload, std::size_t first) {
    for (;;) {
        const std::size_t at = payload.at;
        const std::uint8_t type = payload.protocol;
        if (!isExtension(type) && type != protocolMobility) {
            return this->payload(payload);
        }
        if (!hasHeader("IPv6 extension", at, payload.end, 8)) {
            return;
        }
        if (type == protocolHopByHop && at != first + ipv6Octets) {
            damage("IPv6", "a hop-by-hop header is not the first one", at);
        }
        const std::size_t octets = extensionOctets(type, u8(at + 1));
        constexpr std::size_t leastAuthentication = 12;
        if (type == protocolAuthentication && octets < leastAuthentication) {
            return damage("IPv6", "the authentication header has # octets, and # is the least", at + 1, octets,
                          leastAuthentication);
        }
        if (!hasHeader("IPv6 extension", at, payload.end, octets)) {
            return;
        }
        if (type == protocolHopByHop || type == protocolDestination) {
            ipv6Options(at + 2, at + octets, payload, first);
        } else if (type == protocolRouting) {
            routingHeader(at, at + octets, payload, first);
        } else if (type == protocolFragment) {
            const std::uint32_t word = u16(at + 2);
            if (payload.isJumbo) {
                damage("IPv6", "a fragment of a jumbo payload", at);
            }
            payload.isFragment = payload.isFragment || (word & 0xfff9U) != 0;
            if ((word & 1U) != 0 && (payload.end - at - octets) % 8 != 0) {
                damage("IPv6", "a fragment with others after it has # octets, which is no multiple of #", at,
                       payload.end - at - octets, 8);
            }
            if ((word & 0xfff8U) != 0) {
                return; // no header of what it carries
            }
        }
        payload.protocol = static_cast<std::uint8_t>(u8(at));
        payload.at = at + octets;
        if (type == protocolMobility) {
            return;
        }
    }
}

void PacketWalk::routingHeader(std::size_t at, std::size_t end, Payload &payload, std::size_t header) {
    const std::size_t addresses = (end - at - 8) / ipv6AddressOctets;
    const std::uint32_t type = u8(at + 2);
    const std::uint32_t left = u8(at + 3);
    const bool isList = type == 0 || type == 2;
    if (isList && (end - at - 8) % ipv6AddressOctets != 0) {
        damage("IPv6", "the routing header has # octets, which hold no whole addresses", at + 1, end - at);
    }
    if (isList && left > addresses) {
        payload.hasAddresses = false;
        return damage("IPv6", "the routing header has # segments left and # addresses", at + 3, left, addresses);
    }
    const bool isSegmentList = type == 4; // its first entry is the last segment
    if (isSegmentList && u8(at + 4) >= addresses) {
        payload.hasAddresses = false;
        return damage("IPv6", "the last entry of the routing header is number #, and it has # addresses", at + 4,
                      u8(at + 4), addresses);
    }
    if (left == 0) {
        return;
    }
    payload.hasAddresses = (isList || isSegmentList) && addresses != 0;
    if (payload.hasAddresses) {
        const std::size_t target = isSegmentList ? at + 8 : at + 8 + (addresses - 1) * ipv6AddressOctets;
        payload.addresses =
            addOctets(addOctets(0, part(header + 8, header + 24)), part(target, target + ipv6AddressOctets));
    }
}

void PacketWalk::payload(const Payload &payload) {
    switch (payload.protocol) {
    case protocolIpv4:
    case protocolIpv6: return payload.isFragment ? void() : ip(payload.at, payload.end);
    case protocolTcp: return tcp(payload);
    case protocolUdp: return udp(payload);
    case protocolIcmp: return icmp(payload);
    case protocolIcmpv6: return payload.isIpv6 ? icmpv6(payload) : void();
    case protocolSctp: return sctp(payload);
    case protocolGre: return payload.isFragment ? void() : gre(payload);
    default: return;
    }
}

void PacketWalk::gre(const Payload &payload) {
    if (!hasHeader("GRE", payload.at, payload.end, 4)) {
        return;
    }
    const std::uint32_t flags = u16(payload.at);
    const std::uint32_t version = flags & 7U;
    if (version > 1) {
        return note("GRE", "the version is #", payload.at, version);
    }
    const auto part4 = [flags](std::uint32_t mask) { return (flags & mask) != 0 ? std::size_t{4} : 0; };
    std::size_t octets = 4 + part4(0xc000) + part4(0x2000) + part4(0x1000);
    octets += version == 1 ? part4(0x0080) : 0;
    if (!hasHeader("GRE", payload.at, payload.end, octets)) {
        return;
    }
    if ((flags & 0x8000U) != 0 && has(payload.at, payload.end - payload.at) &&
        !isSoundSum(addOctets(0, part(payload.at, payload.end)))) {
        damage("GRE", "the checksum is wrong", payload.at + 4);
    }
    std::size_t carried = payload.at + octets;
    if ((flags & 0x4000U) != 0) { // the list of routes of RFC 1701, up to an entry without a length
        constexpr std::size_t entryHead = 4;
        for (std::size_t length = 1; length != 0; carried += entryHead + length) {
            if (!hasHeader("GRE route", carried, payload.end, entryHead)) {
                return;
            }
            length = u8(carried + 3);
        }
    }
    const std::uint32_t type = u16(payload.at + 2);
    if (type == etherIpv4 || type == etherIpv6) {
        return ip(carried, payload.end);
    }
    const std::size_t captured = std::min(payload.end, octets_.size());
    inner(payload.at, findInGre(part(payload.at, captured), payload.end - payload.at));
}

void PacketWalk::inner(std::size_t at, const std::optional<InnerPacket> &found) {
    if (found) {
        ip(at + found->firstOctet, at + found->firstOctet + found->wireOctets);
    }
}

} // namespace netfloor
