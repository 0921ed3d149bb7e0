// SPDX-License-Identifier: MIT
#include "plain_shape.h"

#include <algorithm>

#include "ip_numbers.h"
#include "netfloor-host/plain_tcp.h"
#include "octets.h"
#include "ports.h"

namespace netfloor {
namespace {

using Octets = std::span<const std::uint8_t>;

constexpr std::uint32_t headerWord = 4; // octets, in which TCP counts its header

std::optional<PlainPart> optionOf(std::uint8_t kind) {
    switch (kind) {
    case 2: return PlainPart::maximumSegment;
    case 3: return PlainPart::windowScale;
    case 4: return PlainPart::sackPermitted;
    case 5: return PlainPart::sackBlock;
    case 8: return PlainPart::timestamps;
    default: return std::nullopt;
    }
}

// Options of a length that is not theirs, and those of a length that varies, are left to the pass.
bool findOptions(Octets area, std::uint32_t octet, PlainPacket &found) {
    constexpr std::uint8_t lastOfOneOctet = 1; // end of list, which ends nothing for the plug-in, and no operation
    constexpr std::uint8_t md5Signature = 19;
    std::size_t at = 0;
    while (at < area.size()) {
        if (area[at] <= lastOfOneOctet) {
            ++at;
            continue;
        }
        const auto part = optionOf(area[at]);
        if (!part) {
            return area[at] != md5Signature; // for the plug-in all others make the rest padding
        }
        const bool isSack = part == PlainPart::sackBlock;
        const std::uint32_t headOctets = isSack ? 2 : 0;
        const std::uint32_t octets = octetsOf(*part);
        const std::uint32_t length = at + 1 < area.size() ? area[at + 1] : 0;
        if (length < octets || at + length > area.size() || (length - headOctets) % octets != 0 ||
            (!isSack && length != octets)) {
            return false;
        }
        const auto first = octet + static_cast<std::uint32_t>(at);
        for (std::uint32_t inside = headOctets; inside < length; inside += octets) {
            found.options[found.optionCount++] = {*part, first + inside};
        }
        at += length;
    }
    return true;
}

bool findTcp(Octets octets, PlainPacket &found) {
    constexpr std::uint32_t dataOffset = 12;
    const std::uint32_t first = octetsOf(found.ip);
    if (first + tcpOctets > std::min<std::size_t>(found.endOctet, octets.size())) {
        return false;
    }
    const std::uint32_t header = (octets[first + dataOffset] >> 4U) * headerWord;
    found.transport = PlainPart::tcp;
    found.payloadOctet = first + header;
    if (header < tcpOctets || found.payloadOctet > std::min<std::size_t>(found.endOctet, octets.size())) {
        return false;
    }
    const std::uint32_t options = first + tcpOctets;
    return findOptions(octets.subspan(options, found.payloadOctet - options), options, found);
}

bool findUdp(Octets octets, PlainPacket &found) {
    const std::uint32_t first = octetsOf(found.ip);
    found.transport = PlainPart::udp;
    found.payloadOctet = first + udpOctets;
    return found.payloadOctet <= found.endOctet && !isGtpPort(be16(octets, first)) &&
           !isGtpPort(be16(octets, first + 2));
}

bool findEcho(Octets octets, PlainPacket &found) {
    constexpr std::uint32_t echoReply = 0; // type and code
    constexpr std::uint32_t echo = 0x0800;
    const std::uint32_t first = octetsOf(found.ip);
    const std::uint32_t message = be16(octets, first);
    found.transport = PlainPart::icmpEcho;
    found.payloadOctet = first + octetsOf(PlainPart::icmpEcho);
    return found.ip == PlainPart::ipv4 && (message == echo || message == echoReply) &&
           found.payloadOctet <= found.endOctet;
}

bool findTransport(std::uint8_t protocol, Octets octets, PlainPacket &found) {
    switch (protocol) {
    case protocolTcp: return findTcp(octets, found);
    case protocolUdp: return findUdp(octets, found);
    case protocolIcmp: return findEcho(octets, found);
    default: return false;
    }
}

} // namespace

bool findPlain(Octets octets, std::size_t wireOctets, PlainPacket &found) {
    constexpr std::uint32_t octetsAhead = 4; // that a pass looks at; they must have been captured
    if (octets.size() < ipv4Octets + udpOctets) {
        return false;
    }
    std::uint8_t protocol = 0;
    bool isLaterFragment = false;
    if (octets[0] == 0x45) {
        found.ip = PlainPart::ipv4;
        found.endOctet = be16(octets, 2);
        protocol = octets[9];
        isLaterFragment = (be16(octets, 6) & 0x1fffU) != 0;
    } else if (octets[0] >> 4U == 6 && octets.size() >= ipv6Octets + udpOctets) {
        found.ip = PlainPart::ipv6;
        found.endOctet = ipv6Octets + be16(octets, 4);
        protocol = octets[6];
    } else {
        return false;
    }
    found.optionCount = 0;
    if (found.endOctet < octetsOf(found.ip) || found.endOctet > std::max(octets.size(), wireOctets)) {
        return false;
    }
    if (isLaterFragment) {
        found.transport = std::nullopt;
        return true;
    }
    return findTransport(protocol, octets, found) &&
           (found.endOctet <= octets.size() || found.payloadOctet + octetsAhead <= octets.size());
}

bool isPlainTcp(Octets packet) {
    PlainPacket found;
    return findPlain(packet, 0, found) && found.transport == PlainPart::tcp;
}

} // namespace netfloor
