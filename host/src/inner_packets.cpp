// SPDX-License-Identifier: MIT
// VLAN tags, PPP and MPLS are walked here inside tunnels, and in the capture library as link layers: the two libraries
// do not know of each other, and here a wrong octet means no packet, there a packet of another kind.
#include "netfloor-host/inner_packets.h"

#include <algorithm>
#include <array>

#include "ip_numbers.h"
#include "octets.h"
#include "ports.h"

namespace netfloor {
namespace {

using Found = std::optional<InnerPacket>;

// Octets of a packet, and how many they were on the wire where the snap length has cut them.
class Piece {
public:
    Piece(std::span<const std::uint8_t> octets, std::size_t wireOctets)
        : octets_(octets), wireOctets_(std::max(octets.size(), wireOctets)) {}

    [[nodiscard]] std::size_t size() const { return octets_.size(); }
    [[nodiscard]] std::size_t wireOctets() const { return wireOctets_; }
    [[nodiscard]] std::uint32_t u8(std::size_t at) const { return octets_[at]; }
    [[nodiscard]] std::uint32_t u16(std::size_t at) const { return be16(octets_, at); }
    [[nodiscard]] std::uint32_t u32(std::size_t at) const { return be32(octets_, at); }

    // Both within the length on the wire.
    [[nodiscard]] Piece first(std::size_t count) const {
        return {octets_.first(std::min(count, octets_.size())), count};
    }
    [[nodiscard]] Piece after(std::size_t count) const {
        return {octets_.subspan(std::min(count, octets_.size())), wireOctets_ - count};
    }

private:
    std::span<const std::uint8_t> octets_;
    std::size_t wireOctets_;
};

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

// IP as a type before it says.
Found ipAt(const Piece &octets, std::size_t at) {
    if (at > octets.size() || at >= octets.wireOctets()) {
        return std::nullopt;
    }
    const auto first = static_cast<std::uint32_t>(at);
    return InnerPacket{Tunnel::ip,
                       first,
                       first,
                       static_cast<std::uint32_t>(octets.size() - at),
                       static_cast<std::uint32_t>(octets.wireOctets() - at),
                       {}};
}

bool startsAsIp(const Piece &octets, std::size_t at) {
    return at < octets.size() && (octets.u8(at) >> 4U == 4 || octets.u8(at) >> 4U == 6);
}

// Nothing says what it is, but the first nibble.
Found maybeIpAt(const Piece &octets, std::size_t at) {
    return startsAsIp(octets, at) ? ipAt(octets, at) : std::nullopt;
}

Found afterEtherType(const Piece &octets, std::uint32_t type, std::size_t at);

Found afterMpls(const Piece &octets, std::size_t at) {
    constexpr std::size_t labelOctets = 4;
    while (at + labelOctets <= octets.size()) {
        const bool isLast = (octets.u8(at + 2) & 1U) != 0;
        at += labelOctets;
        if (isLast) {
            return maybeIpAt(octets, at);
        }
    }
    return std::nullopt;
}

Found afterPpp(const Piece &octets, std::size_t at) {
    if (at + 2 <= octets.size() && octets.u16(at) == 0xff03) { // address and control
        at += 2;
    }
    // The protocol may be compressed to its odd octet.
    if (at < octets.size() && (octets.u8(at) & 1U) == 0) {
        if (octets.u8(at) != 0) {
            return std::nullopt;
        }
        ++at;
    }
    if (at >= octets.size() || (octets.u8(at) != 0x21 && octets.u8(at) != 0x57)) {
        return std::nullopt;
    }
    return ipAt(octets, at + 1);
}

Found afterEthernet(const Piece &octets, std::size_t at) {
    constexpr std::size_t addressOctets = 12;
    constexpr std::array<std::uint32_t, 3> tags = {0x8100, 0x88a8, 0x9100};
    at += addressOctets;
    while (at + 4 <= octets.size() && std::ranges::find(tags, octets.u16(at)) != tags.end()) {
        at += 4;
    }
    if (at + 2 > octets.size()) {
        return std::nullopt;
    }
    return afterEtherType(octets, octets.u16(at), at + 2);
}

Found afterEtherType(const Piece &octets, std::uint32_t type, std::size_t at) {
    switch (type) {
    case etherIpv4:
    case etherIpv6: return ipAt(octets, at);
    case etherMpls:
    case etherMplsUpstream: return afterMpls(octets, at);
    default: return std::nullopt;
    }
}

Found inGre(const Piece &octets) {
    constexpr std::size_t fixedOctets = 4;
    if (octets.size() < fixedOctets) {
        return std::nullopt;
    }
    const std::uint32_t flags = octets.u16(0);
    const std::uint32_t type = octets.u16(2);
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
        found->id = hasKey ? std::optional(octets.u32(keyAt)) : std::nullopt;
    }
    return found;
}

Found inVxlan(const Piece &octets) {
    constexpr std::size_t headOctets = 8;
    constexpr std::uint8_t hasIdentifier = 0x08;
    if (octets.size() < headOctets || (octets.u8(0) & hasIdentifier) == 0) {
        return std::nullopt;
    }
    Found found = afterEthernet(octets, headOctets);
    if (found) {
        found->tunnel = Tunnel::vxlan;
        found->headerOctet = 0;
        found->id = octets.u32(4) >> 8U;
    }
    return found;
}

Found inGtpU(const Piece &message) {
    constexpr std::size_t headOctets = 8;
    constexpr std::uint8_t carriesPacket = 255;
    constexpr std::uint8_t versionAndType = 0xf0;
    constexpr std::uint8_t versionOneGtp = 0x30;
    constexpr std::uint8_t optionalFields = 0x07; // E, S, PN
    constexpr std::uint8_t extensionFlag = 0x04;
    if (message.size() < headOctets || (message.u8(0) & versionAndType) != versionOneGtp ||
        message.u8(1) != carriesPacket) {
        return std::nullopt;
    }
    const std::size_t end = headOctets + message.u16(2);
    if (end > message.wireOctets()) {
        return std::nullopt;
    }
    const Piece inside = message.first(end);
    std::size_t at = headOctets;
    if ((message.u8(0) & optionalFields) != 0) {
        at += 4;
        if (at > inside.size()) {
            return std::nullopt;
        }
        std::uint32_t next = (message.u8(0) & extensionFlag) != 0 ? inside.u8(at - 1) : 0;
        while (next != 0) {
            // A length of 0 is an error: the chain would never end.
            if (at >= inside.size() || inside.u8(at) == 0 || at + std::size_t{inside.u8(at)} * 4 > inside.size()) {
                return std::nullopt;
            }
            at += std::size_t{inside.u8(at)} * 4;
            next = inside.u8(at - 1);
        }
    }
    Found found = maybeIpAt(inside, at);
    if (found) {
        found->tunnel = Tunnel::gtpU;
        found->headerOctet = 0;
        found->id = message.u32(4);
    }
    return found;
}

Found inUdp(const Piece &octets) {
    if (octets.size() < udpOctets) {
        return std::nullopt;
    }
    const auto hasPort = [&](std::uint32_t port) { return octets.u16(0) == port || octets.u16(2) == port; };
    const Piece payload = octets.after(udpOctets);
    if (hasPort(gtpUPort)) {
        return moved(inGtpU(payload), udpOctets);
    }
    return hasPort(vxlanPort) ? moved(inVxlan(payload), udpOctets) : std::nullopt;
}

// A header that the plug-in reads itself, and what follows it.
struct Step {
    std::size_t octets = 0; // 0: the chain ends here
    std::uint32_t next = 0;
    std::size_t end = 0; // of the packet, as the header says
};

Step ipv4Step(const Piece &octets) {
    if (octets.size() < ipv4Octets) {
        return {};
    }
    const std::size_t header = std::size_t{octets.u8(0) & 0xfU} * 4;
    const std::size_t total = octets.u16(2);
    const bool isLaterFragment = (octets.u16(6) & 0x1fffU) != 0;
    if (header < ipv4Octets || total < header || total > octets.wireOctets() || isLaterFragment) {
        return {};
    }
    return {header, octets.u8(9), total};
}

Step ipv6Step(const Piece &octets) {
    if (octets.size() < ipv6Octets || ipv6Octets + octets.u16(4) > octets.wireOctets()) {
        return {};
    }
    return {ipv6Octets, octets.u8(6), ipv6Octets + octets.u16(4)};
}

Step extensionStep(std::uint32_t protocol, const Piece &octets) {
    const bool isWhole = octets.size() >= 8;
    if (!isWhole || (protocol == protocolFragment && (octets.u16(2) & 0xfff8U) != 0)) {
        return {};
    }
    const std::size_t size = extensionOctets(protocol, octets.u8(1));
    return size > octets.size() ? Step{} : Step{size, octets.u8(0), octets.wireOctets()};
}

Step minimalStep(const Piece &octets) {
    if (octets.size() < 8) {
        return {};
    }
    const std::size_t size = (octets.u8(1) & 0x80U) != 0 ? 12 : 8;
    return size > octets.size() ? Step{} : Step{size, octets.u8(0), octets.wireOctets()};
}

Found firstInside(const Piece &packet) {
    if (packet.size() == 0) {
        return std::nullopt;
    }
    const bool startsAsIpv6 = packet.u8(0) >> 4U == 6;
    Piece rest = packet;
    std::size_t at = 0;
    Step step = startsAsIpv6 ? ipv6Step(rest) : ipv4Step(rest);
    // Each header takes 8 octets or more, so that this ends.
    while (step.octets != 0) {
        rest = rest.first(step.end).after(step.octets);
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

} // namespace

std::string_view tunnelName(Tunnel tunnel) {
    constexpr std::array<std::string_view, 5> names = {"", "IP", "GRE", "GTP-U", "VXLAN"};
    return names[static_cast<std::size_t>(tunnel)];
}

std::optional<InnerPacket> findInGre(std::span<const std::uint8_t> packet, std::size_t wireOctets) {
    return inGre({packet, wireOctets});
}

std::optional<InnerPacket> findInUdp(std::span<const std::uint8_t> datagram, std::size_t wireOctets) {
    return inUdp({datagram, wireOctets});
}

std::optional<InnerPacket> findInnerPacket(std::span<const std::uint8_t> packet, std::size_t wireOctets) {
    const Piece all(packet, wireOctets);
    const Found found = firstInside(all);
    return found && startsAsIp(all, found->firstOctet) ? found : std::nullopt;
}

std::optional<UpperLayer> findUpperLayer(std::span<const std::uint8_t> packet, std::size_t wireOctets) {
    const Piece all(packet, wireOctets);
    std::size_t at = 0;
    Step step = ipv6Step(all);
    while (step.octets != 0) {
        at += step.octets;
        if (!isExtension(step.next)) {
            return UpperLayer{static_cast<std::uint32_t>(at), static_cast<std::uint8_t>(step.next)};
        }
        step = extensionStep(step.next, all.after(at));
    }
    return std::nullopt;
}

InnerPackets::InnerPackets(std::span<const std::uint8_t> packet, std::size_t wireOctets)
    : octets_(packet), wireOctets_(wireOctets > packet.size() ? wireOctets : 0), allOctets_(packet.size()) {}

void InnerPackets::next() {
    const Found found = findInnerPacket(octets_, wireOctets_);
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
    wireOctets_ = found->wireOctets > found->octets ? found->wireOctets : 0;
    firstOctet_ += found->firstOctet;
    opened_ = *found;
}

} // namespace netfloor
