// SPDX-License-Identifier: MIT
#include "netfloor-host/inner_packets.h"

#include <algorithm>
#include <array>

#include "octets.h"

namespace netfloor {
namespace {

using Octets = std::span<const std::uint8_t>;
using Found = std::optional<InnerPacket>;

constexpr std::uint32_t protocolIpv4 = 4;
constexpr std::uint32_t protocolUdp = 17;
constexpr std::uint32_t protocolIpv6 = 41;
constexpr std::uint32_t protocolGre = 47;
constexpr std::uint32_t protocolMinimal = 55;
constexpr std::uint32_t ipv4Octets = 20;
constexpr std::uint32_t ipv6Octets = 40;
constexpr std::uint32_t udpOctets = 8;

constexpr std::uint32_t etherIpv4 = 0x0800;
constexpr std::uint32_t etherIpv6 = 0x86dd;
constexpr std::uint32_t etherMpls = 0x8847;
constexpr std::uint32_t etherMplsUpstream = 0x8848;
constexpr std::uint32_t etherTransparent = 0x6558;
constexpr std::uint32_t etherPpp = 0x880b;
constexpr std::uint32_t etherErspan2 = 0x88be;

Found moved(Found found, std::size_t octets) {
    if (found) {
        found->headerOctet += static_cast<std::uint32_t>(octets);
        found->firstOctet += static_cast<std::uint32_t>(octets);
    }
    return found;
}

// The first nibble says which IP it is.
Found ipAt(Octets octets, std::size_t at) {
    if (at >= octets.size() || (octets[at] >> 4U != 4 && octets[at] >> 4U != 6)) {
        return std::nullopt;
    }
    const auto first = static_cast<std::uint32_t>(at);
    return InnerPacket{Tunnel::ip, first, first, static_cast<std::uint32_t>(octets.size() - at), {}};
}

Found afterEtherType(Octets octets, std::uint32_t type, std::size_t at);

Found afterMpls(Octets octets, std::size_t at) {
    constexpr std::size_t labelOctets = 4;
    while (at + labelOctets <= octets.size()) {
        const bool isLast = (octets[at + 2] & 1U) != 0;
        at += labelOctets;
        if (isLast) {
            return ipAt(octets, at);
        }
    }
    return std::nullopt;
}

Found afterPpp(Octets octets, std::size_t at) {
    if (at + 2 <= octets.size() && be16(octets, at) == 0xff03) { // address and control
        at += 2;
    }
    // The protocol may be compressed to its odd octet.
    if (at < octets.size() && (octets[at] & 1U) == 0) {
        if (octets[at] != 0) {
            return std::nullopt;
        }
        ++at;
    }
    if (at >= octets.size() || (octets[at] != 0x21 && octets[at] != 0x57)) {
        return std::nullopt;
    }
    return ipAt(octets, at + 1);
}

Found afterEthernet(Octets octets, std::size_t at) {
    constexpr std::size_t addressOctets = 12;
    constexpr std::array<std::uint32_t, 3> tags = {0x8100, 0x88a8, 0x9100};
    at += addressOctets;
    while (at + 4 <= octets.size() && std::ranges::find(tags, be16(octets, at)) != tags.end()) {
        at += 4;
    }
    if (at + 2 > octets.size()) {
        return std::nullopt;
    }
    return afterEtherType(octets, be16(octets, at), at + 2);
}

Found afterEtherType(Octets octets, std::uint32_t type, std::size_t at) {
    switch (type) {
    case etherIpv4:
    case etherIpv6: return ipAt(octets, at);
    case etherMpls:
    case etherMplsUpstream: return afterMpls(octets, at);
    default: return std::nullopt;
    }
}

Found inGre(Octets octets) {
    constexpr std::size_t fixedOctets = 4;
    if (octets.size() < fixedOctets) {
        return std::nullopt;
    }
    const std::uint32_t flags = be16(octets, 0);
    const std::uint32_t type = be16(octets, 2);
    const bool hasKey = (flags & 0x2000U) != 0;
    const bool hasSequence = (flags & 0x1000U) != 0;
    const std::uint32_t version = flags & 7U;
    if (version > 1 || (flags & 0x4000U) != 0) { // a routing field, of RFC 1701
        return std::nullopt;
    }
    std::size_t at = fixedOctets + ((flags & 0x8000U) != 0 ? 4 : 0);
    const std::size_t keyAt = at;
    // RFC 2637 has an acknowledgement number under version 1.
    at += (hasKey ? 4U : 0U) + (hasSequence ? 4U : 0U) + (version == 1 && (flags & 0x80U) != 0 ? 4U : 0U);
    if (at > octets.size()) {
        return std::nullopt;
    }
    Found found;
    switch (type) {
    case etherTransparent: found = afterEthernet(octets, at); break;
    case etherPpp: found = afterPpp(octets, at); break;
    case etherErspan2: found = afterEthernet(octets, at + (hasSequence ? 8 : 0)); break;
    default: found = afterEtherType(octets, type, at); break;
    }
    if (found) {
        found->tunnel = Tunnel::gre;
        found->headerOctet = 0;
        found->id = hasKey ? std::optional(be32(octets, keyAt)) : std::nullopt;
    }
    return found;
}

Found inVxlan(Octets octets) {
    constexpr std::size_t headOctets = 8;
    constexpr std::uint8_t hasIdentifier = 0x08;
    if (octets.size() < headOctets || (octets[0] & hasIdentifier) == 0) {
        return std::nullopt;
    }
    Found found = afterEthernet(octets, headOctets);
    if (found) {
        found->tunnel = Tunnel::vxlan;
        found->headerOctet = 0;
        found->id = be32(octets, 4) >> 8U;
    }
    return found;
}

Found inUdp(Octets octets) {
    constexpr std::uint32_t gtpUPort = 2152;
    constexpr std::uint32_t vxlanPort = 4789;
    if (octets.size() < udpOctets) {
        return std::nullopt;
    }
    const auto hasPort = [&](std::uint32_t port) { return be16(octets, 0) == port || be16(octets, 2) == port; };
    const Octets payload = octets.subspan(udpOctets);
    if (hasPort(gtpUPort)) {
        return moved(findInGtpU(payload), udpOctets);
    }
    return hasPort(vxlanPort) ? moved(inVxlan(payload), udpOctets) : std::nullopt;
}

// A header that the plug-in reads itself, and what follows it.
struct Step {
    std::size_t octets = 0; // 0: the chain ends here
    std::uint32_t next = 0;
    std::size_t end = 0; // of the packet, as the header says
};

Step ipv4Step(Octets octets) {
    if (octets.size() < ipv4Octets) {
        return {};
    }
    const std::size_t header = std::size_t{octets[0] & 0xfU} * 4;
    const std::size_t total = be16(octets, 2);
    const bool isLaterFragment = (be16(octets, 6) & 0x1fffU) != 0;
    if (header < ipv4Octets || total < header || total > octets.size() || isLaterFragment) {
        return {};
    }
    return {header, octets[9], total};
}

Step ipv6Step(Octets octets) {
    if (octets.size() < ipv6Octets || ipv6Octets + be16(octets, 4) > octets.size()) {
        return {};
    }
    return {ipv6Octets, octets[6], ipv6Octets + be16(octets, 4)};
}

bool isExtension(std::uint32_t protocol) {
    constexpr std::array<std::uint32_t, 5> extensions = {0, 43, 44, 51, 60};
    return std::ranges::find(extensions, protocol) != extensions.end();
}

Step extensionStep(std::uint32_t protocol, Octets octets) {
    constexpr std::uint32_t fragment = 44;
    constexpr std::uint32_t authentication = 51;
    if (octets.size() < 8) {
        return {};
    }
    std::size_t size = (std::size_t{octets[1]} + 1) * 8;
    if (protocol == fragment) {
        if ((be16(octets, 2) & 0xfff8U) != 0) {
            return {};
        }
        size = 8;
    } else if (protocol == authentication) {
        size = (std::size_t{octets[1]} + 2) * 4;
    }
    return size > octets.size() ? Step{} : Step{size, octets[0], octets.size()};
}

Step minimalStep(Octets octets) {
    if (octets.size() < 8) {
        return {};
    }
    const std::size_t size = (octets[1] & 0x80U) != 0 ? 12 : 8;
    return size > octets.size() ? Step{} : Step{size, octets[0], octets.size()};
}

} // namespace

std::string_view tunnelName(Tunnel tunnel) {
    constexpr std::array<std::string_view, 5> names = {"", "IP", "GRE", "GTP-U", "VXLAN"};
    return names[static_cast<std::size_t>(tunnel)];
}

std::optional<InnerPacket> findInGtpU(std::span<const std::uint8_t> message) {
    constexpr std::size_t headOctets = 8;
    constexpr std::uint8_t carriesPacket = 255;
    constexpr std::uint8_t versionAndType = 0xf0;
    constexpr std::uint8_t versionOneGtp = 0x30;
    constexpr std::uint8_t optionalFields = 0x07; // E, S, PN
    constexpr std::uint8_t extensionFlag = 0x04;
    if (message.size() < headOctets || (message[0] & versionAndType) != versionOneGtp || message[1] != carriesPacket) {
        return std::nullopt;
    }
    const std::size_t end = headOctets + be16(message, 2);
    if (end > message.size()) {
        return std::nullopt;
    }
    const Octets inside = message.first(end);
    std::size_t at = headOctets;
    if ((message[0] & optionalFields) != 0) {
        at += 4;
        if (at > end) {
            return std::nullopt;
        }
        std::uint8_t next = (message[0] & extensionFlag) != 0 ? inside[at - 1] : 0;
        while (next != 0) {
            // A length of 0 is an error: the chain would never end.
            if (at >= end || inside[at] == 0 || at + std::size_t{inside[at]} * 4 > end) {
                return std::nullopt;
            }
            at += std::size_t{inside[at]} * 4;
            next = inside[at - 1];
        }
    }
    Found found = ipAt(inside, at);
    if (found) {
        found->tunnel = Tunnel::gtpU;
        found->headerOctet = 0;
        found->id = be32(message, 4);
    }
    return found;
}

std::optional<InnerPacket> findInnerPacket(std::span<const std::uint8_t> packet) {
    if (packet.empty()) {
        return std::nullopt;
    }
    const bool startsAsIpv6 = packet[0] >> 4U == 6;
    Octets rest = packet;
    std::size_t at = 0;
    Step step = startsAsIpv6 ? ipv6Step(rest) : ipv4Step(rest);
    // Each header takes 8 octets or more, so that this ends.
    while (step.octets != 0) {
        rest = rest.subspan(step.octets, step.end - step.octets);
        at += step.octets;
        const std::uint32_t protocol = step.next;
        if (protocol == protocolUdp) {
            return moved(inUdp(rest), at);
        }
        if (protocol == protocolGre) {
            return moved(inGre(rest), at);
        }
        if (protocol == (startsAsIpv6 ? protocolIpv4 : protocolIpv6)) {
            return moved(ipAt(rest, 0), at);
        }
        if (startsAsIpv6) {
            step = protocol == protocolIpv6 ? ipv6Step(rest)
                   : isExtension(protocol)  ? extensionStep(protocol, rest)
                                            : Step{};
        } else {
            step = protocol == protocolIpv4 ? ipv4Step(rest) : protocol == protocolMinimal ? minimalStep(rest) : Step{};
        }
    }
    return std::nullopt;
}

std::optional<UpperLayer> findUpperLayer(std::span<const std::uint8_t> packet) {
    std::size_t at = 0;
    Step step = ipv6Step(packet);
    while (step.octets != 0) {
        at += step.octets;
        if (!isExtension(step.next)) {
            return UpperLayer{static_cast<std::uint32_t>(at), static_cast<std::uint8_t>(step.next)};
        }
        step = extensionStep(step.next, packet.subspan(at));
    }
    return std::nullopt;
}

InnerPackets::InnerPackets(std::span<const std::uint8_t> packet)
    : octets_(packet), outermostOctets_(packet.size()), allOctets_(packet.size()) {}

void InnerPackets::next() {
    const Found found = findInnerPacket(octets_);
    ended_ = true;
    if (!found) {
        return;
    }
    if (packets_ == mostPackets) {
        limit_ = "more than 16 packets inside one another: the rest stays closed";
        return;
    }
    if (allOctets_ + found->octets > mostOctets) {
        limit_ = "more than 262144 octets in packets inside one another: the rest stays closed";
        return;
    }
    ended_ = false;
    ++packets_;
    allOctets_ += found->octets;
    octets_ = octets_.subspan(found->firstOctet, found->octets);
    firstOctet_ += found->firstOctet;
    opened_ = *found;
}

} // namespace netfloor
