// SPDX-License-Identifier: MIT
#include "netfloor-capture/link_layer.h"

#include <algorithm>
#include <array>
#include <cstdio>
#include <string_view>

#include "libpcap.h"

namespace netfloor {

namespace {

constexpr std::uint16_t etherTypeIpv4 = 0x0800;
constexpr std::uint16_t etherTypeIpv6 = 0x86dd;
constexpr std::uint16_t etherTypePppSession = 0x8864;
constexpr std::uint16_t etherTypeMpls = 0x8847;
constexpr std::uint16_t etherTypeMplsMulticast = 0x8848;
constexpr std::uint16_t etherTypeSlarp = 0x8035; // after a Cisco HDLC header; RARP elsewhere
constexpr std::uint16_t leastEtherType = 0x0600; // smaller numbers are lengths (IEEE 802.3)
constexpr std::uint16_t pppIpv4 = 0x0021;
constexpr std::uint16_t pppIpv6 = 0x0057;
constexpr std::uint16_t pppMpls = 0x0281;
constexpr std::uint16_t pppMplsMulticast = 0x0283;

struct NumberName {
    std::uint16_t number;
    std::string_view name;
};

constexpr std::array etherTypeNames = {
    NumberName{0x0806, "ARP"},           NumberName{0x8035, "RARP"},
    NumberName{0x809b, "AppleTalk"},     NumberName{0x80f3, "AppleTalk ARP"},
    NumberName{0x8137, "IPX"},           NumberName{0x8808, "Ethernet flow control"},
    NumberName{0x8809, "slow protocol"}, NumberName{0x8863, "PPPoE discovery"},
    NumberName{0x888e, "802.1X"},        NumberName{0x8892, "PROFINET"},
    NumberName{0x88cc, "LLDP"},          NumberName{0x88e5, "MACsec"},
    NumberName{0x88f7, "PTP"},           NumberName{0x8902, "802.1ag"},
    NumberName{0x9000, "loopback test"}, NumberName{0xfefe, "OSI"},
};

constexpr std::array pppNames = {
    NumberName{0x8021, "PPP IPCP"}, NumberName{0x8057, "PPP IPv6CP"},     NumberName{0x80fd, "PPP CCP"},
    NumberName{0xc021, "PPP LCP"},  NumberName{0xc023, "PPP PAP"},        NumberName{0xc025, "PPP LQR"},
    NumberName{0xc223, "PPP CHAP"}, NumberName{0x00fd, "PPP compressed"}, NumberName{0x8281, "PPP MPLSCP"},
};

// Frame Relay: the network layer protocol after the control field (RFC 2427).
constexpr std::uint8_t unnumberedInformation = 0x03;
constexpr std::uint8_t nlpidSnap = 0x80;
constexpr std::uint8_t nlpidIpv6 = 0x8e;
constexpr std::uint8_t nlpidIpv4 = 0xcc;
constexpr std::uint8_t nlpidPpp = 0xcf;

constexpr std::array nlpidNames = {
    NumberName{0x08, "Frame Relay Q.933"},
    NumberName{0x81, "CLNP"},
    NumberName{0x82, "ES-IS"},
    NumberName{0x83, "IS-IS"},
    NumberName{0xb1, "Frame Relay fragment"},
};

template <std::size_t count>
NotIp nameOf(const std::array<NumberName, count> &names, std::uint16_t number, NotIp::Kind kind) {
    const auto *const found =
        std::find_if(names.begin(), names.end(), [number](const NumberName &row) { return row.number == number; });
    return found != names.end() ? NotIp(NotIp::Kind::name, found->name) : NotIp(kind, number);
}

std::string hexText(const char *kind, std::uint32_t number) {
    std::array<char, 32> text{};
    std::snprintf(text.data(), text.size(), "%s 0x%04x", kind, number);
    return text.data();
}

// Walks over the headers before the IP header, one step for each kind of header.
class LinkWalk {
public:
    explicit LinkWalk(std::span<const std::uint8_t> packet) : packet_(packet) {}

    NetworkPart ethernet() {
        if (!has(14)) {
            return tooShort("Ethernet");
        }
        skip(12);
        return etherType();
    }

    // Octet 14 of the cooked header, or octet 0 of its second version, holds the EtherType.
    NetworkPart cooked(std::size_t typeAt, std::size_t headerOctets) {
        if (!has(headerOctets)) {
            return tooShort("Linux cooked");
        }
        const std::uint16_t type = u16(typeAt);
        skip(headerOctets);
        return afterEtherType(type);
    }

    // The address family of the capturing system, in its own byte order or, for `networkOrder`, in network order.
    NetworkPart addressFamily(bool networkOrder) {
        if (!has(4)) {
            return tooShort("loopback");
        }
        const std::uint32_t asWritten = std::uint32_t{u16(0)} << 16U | u16(2);
        const std::uint32_t reversed = __builtin_bswap32(asWritten);
        if (!networkOrder && asWritten >= 0x10000 && reversed >= 0x10000) {
            return serialLine();
        }
        skip(4);
        // A family is a small number, so that its octets show the order.
        const std::uint32_t family = networkOrder || asWritten < 0x10000 ? asWritten : reversed;
        // 10 Linux, 24 NetBSD and OpenBSD, 28 FreeBSD, 30 macOS, 23 Windows: AF_INET6.
        constexpr std::array<std::uint32_t, 5> ipv6Families = {10, 23, 24, 28, 30};
        if (family == 2 || std::find(ipv6Families.begin(), ipv6Families.end(), family) != ipv6Families.end()) {
            return found();
        }
        if (!networkOrder && family >= leastEtherType) { // some systems write an EtherType instead
            return afterEtherType(static_cast<std::uint16_t>(family));
        }
        return other(NotIp(NotIp::Kind::addressFamily, family));
    }

    // RFC 1661 and 1662: address and control field, and the first octet of the protocol, may be omitted.
    NetworkPart ppp() {
        if (has(2) && packet_[at_] == 0xff && packet_[at_ + 1] == 0x03) {
            skip(2);
        } else if (isCiscoHdlc()) { // also under a PPP link type
            return ciscoHdlc();
        }
        if (!has(1)) {
            return tooShort("PPP");
        }
        if ((packet_[at_] & 1U) != 0) {
            const std::uint16_t shortProtocol = packet_[at_];
            skip(1);
            return afterPppProtocol(shortProtocol);
        }
        if (!has(2)) {
            return tooShort("PPP");
        }
        const std::uint16_t protocol = u16(0);
        skip(2);
        return afterPppProtocol(protocol);
    }

    // One octet of direction before PPP; pppd writes it in place of the address field.
    NetworkPart pppWithDirection(bool controlFollows) {
        const std::size_t headOctets = controlFollows ? 2 : 1;
        if (!has(headOctets)) {
            return tooShort("PPP");
        }
        skip(headOctets);
        return ppp();
    }

    NetworkPart pppoeSession() {
        if (!has(6)) {
            return tooShort("PPPoE");
        }
        skip(6);
        return ppp();
    }

    // Address and control field, then an EtherType.
    NetworkPart ciscoHdlc() {
        if (!has(4)) {
            return tooShort("Cisco HDLC");
        }
        skip(2);
        if (u16(0) == etherTypeSlarp) {
            return other(NotIp(NotIp::Kind::name, "SLARP"));
        }
        return etherType();
    }

    // RFC 2427, or Cisco's form with an EtherType after the address.
    NetworkPart frameRelay() {
        while (has(1) && (packet_[at_] & 1U) == 0) { // the lowest bit ends the address
            skip(1);
        }
        skip(has(1) ? 1 : 0);
        if (!has(2)) {
            return tooShort("Frame Relay");
        }
        if (packet_[at_] != unnumberedInformation) {
            return etherType();
        }
        skip(1);
        if (packet_[at_] == 0 && has(2)) { // an octet of padding
            skip(1);
        }
        const std::uint8_t protocol = packet_[at_];
        skip(1);
        switch (protocol) {
        case nlpidIpv4:
        case nlpidIpv6: return found();
        case nlpidPpp: return ppp();
        case nlpidSnap: return snap();
        default: return other(nameOf(nlpidNames, protocol, NotIp::Kind::nlpid));
        }
    }

    // RFC 3032. The labels do not say what they carry; the first octet after the last one does, as routers read it.
    NetworkPart mpls() {
        bool isLast = false;
        while (!isLast) {
            if (!has(4)) {
                return tooShort("MPLS");
            }
            isLast = (packet_[at_ + 2] & 1U) != 0;
            skip(4);
        }
        if (has(1) && (startsIpv4(at_) || startsIpv6(at_))) {
            return found();
        }
        for (const std::size_t controlWord : {std::size_t{4}, std::size_t{0}}) { // of a pseudowire, RFC 4448
            if (carriesIpFrame(at_ + controlWord)) {
                skip(controlWord);
                return ethernet();
            }
        }
        return other(NotIp(NotIp::Kind::name, "MPLS without IP"));
    }

    // One octet of direction before the header.
    NetworkPart ciscoHdlcWithDirection() {
        skip(has(1) ? 1 : 0);
        return ciscoHdlc();
    }
    NetworkPart frameRelayWithDirection() {
        skip(has(1) ? 1 : 0);
        return frameRelay();
    }

    NetworkPart raw() { return found(); }

    [[nodiscard]] NetworkPart other(NotIp what) const { return {{}, at_, what}; }

private:
    [[nodiscard]] bool has(std::size_t octets) const { return packet_.size() - at_ >= octets; }
    [[nodiscard]] std::uint16_t u16(std::size_t offset) const {
        return static_cast<std::uint16_t>(packet_[at_ + offset] << 8U | packet_[at_ + offset + 1]);
    }
    void skip(std::size_t octets) { at_ += octets; }

    [[nodiscard]] NetworkPart found() const {
        if (at_ == packet_.size()) {
            return other(NotIp(NotIp::Kind::name, "no octets after the link layer"));
        }
        return {packet_.subspan(at_), at_, NotIp()};
    }
    [[nodiscard]] NetworkPart tooShort(const char *header) const {
        return other(NotIp(NotIp::Kind::cutHeader, header));
    }

    [[nodiscard]] bool startsIpv4(std::size_t at) const { return packet_[at] >= 0x45 && packet_[at] <= 0x4f; }
    [[nodiscard]] bool startsIpv6(std::size_t at) const { return packet_[at] >> 4U == 6; }

    // Whether an Ethernet frame with IP begins there. A pseudowire does not say that it carries Ethernet.
    [[nodiscard]] bool carriesIpFrame(std::size_t at) const {
        constexpr std::size_t typeAt = 12;
        constexpr std::size_t tagOctets = 4;
        std::size_t type = at + typeAt;
        if (type + 2 < packet_.size() && packet_[type] == 0x81 && packet_[type + 1] == 0x00) {
            type += tagOctets;
        }
        if (type + 2 >= packet_.size()) {
            return false;
        }
        return (packet_[type] == 0x08 && packet_[type + 1] == 0x00 && startsIpv4(type + 2)) ||
               (packet_[type] == 0x86 && packet_[type + 1] == 0xdd && startsIpv6(type + 2));
    }

    [[nodiscard]] bool isCiscoHdlc() const {
        return has(2) && (packet_[at_] == 0x0f || packet_[at_] == 0x8f) && packet_[at_ + 1] == 0x00;
    }

    // Four octets under a loopback link type that are no address family: the header of a serial line.
    NetworkPart serialLine() {
        if (isCiscoHdlc()) {
            return ciscoHdlc();
        }
        if (packet_[at_] == 0xff && packet_[at_ + 1] == 0x03) {
            return ppp();
        }
        const bool isFrameRelay = (packet_[at_] & 1U) == 0 && (packet_[at_ + 1] & 1U) != 0;
        if (isFrameRelay && (packet_[at_ + 2] == unnumberedInformation || u16(2) >= leastEtherType)) {
            return frameRelay();
        }
        const std::uint32_t family = std::uint32_t{u16(0)} << 16U | u16(2);
        skip(4);
        return other(NotIp(NotIp::Kind::addressFamily, family));
    }

    // After the NLPID of SNAP: an organisation, and a number that it gives.
    NetworkPart snap() {
        if (!has(5)) {
            return tooShort("SNAP");
        }
        const std::uint32_t organisation = std::uint32_t{u16(0)} << 8U | packet_[at_ + 2];
        const std::uint16_t number = u16(3);
        skip(5);
        constexpr std::uint32_t bridged = 0x0080c2; // 1 and 7: Ethernet with and without its check sequence
        if (organisation == bridged && (number == 1 || number == 7)) {
            return ethernet();
        }
        return organisation == 0 ? afterEtherType(number) : other(NotIp(NotIp::Kind::name, "SNAP"));
    }

    // At two octets that are there.
    NetworkPart etherType() {
        const std::uint16_t type = u16(0);
        skip(2);
        return afterEtherType(type);
    }

    NetworkPart afterEtherType(std::uint16_t type) {
        while (type == 0x8100 || type == 0x88a8 || type == 0x9100 || type == 0x9200) { // VLAN tags, 802.1Q and 802.1ad
            if (!has(4)) {
                return tooShort("VLAN");
            }
            type = u16(2);
            skip(4);
        }
        if (type == etherTypeIpv4 || type == etherTypeIpv6) {
            return found();
        }
        if (type == etherTypePppSession) {
            return pppoeSession();
        }
        if (type == etherTypeMpls || type == etherTypeMplsMulticast) {
            return mpls();
        }
        if (type < leastEtherType) {
            return afterLength();
        }
        return other(nameOf(etherTypeNames, type, NotIp::Kind::etherType));
    }

    // IEEE 802.3: an LLC header follows, with SNAP (RFC 1042) an EtherType after it.
    NetworkPart afterLength() {
        constexpr std::array<std::uint8_t, 6> snap = {0xaa, 0xaa, 0x03, 0x00, 0x00, 0x00};
        if (has(8) && std::equal(snap.begin(), snap.end(), packet_.begin() + static_cast<std::ptrdiff_t>(at_))) {
            skip(6);
            const std::uint16_t type = u16(0);
            skip(2);
            if (type >= leastEtherType) {
                return afterEtherType(type);
            }
        }
        if (has(2) && packet_[at_] == 0x42 && packet_[at_ + 1] == 0x42) {
            return other(NotIp(NotIp::Kind::name, "spanning tree"));
        }
        return other(NotIp(NotIp::Kind::name, "802.3 frame"));
    }

    NetworkPart afterPppProtocol(std::uint16_t protocol) {
        if (protocol == pppIpv4 || protocol == pppIpv6) {
            return found();
        }
        if (protocol == pppMpls || protocol == pppMplsMulticast) {
            return mpls();
        }
        return other(nameOf(pppNames, protocol, NotIp::Kind::pppProtocol));
    }

    std::span<const std::uint8_t> packet_;
    std::size_t at_ = 0;
};

// Link types as files number them.
namespace link_type {
constexpr int null = 0;
constexpr int ethernet = 1;
constexpr int ppp = 9;
constexpr int rawOfSystems = 12; // written by mistake: the numbers that FreeBSD and OpenBSD use inside
constexpr int rawOfOpenBsd = 14;
constexpr int pppSerial = 50;
constexpr int pppEthernet = 51;
constexpr int raw = 101;
constexpr int ciscoHdlc = 104;
constexpr int frameRelay = 107;
constexpr int loop = 108;
constexpr int linuxCooked = 113;
constexpr int pppOfPppd = 166;
constexpr int pppWithDirection = 204;
constexpr int ciscoHdlcWithDirection = 205;
constexpr int frameRelayWithDirection = 206;
constexpr int mpls = 219;
constexpr int ipv4 = 228;
constexpr int ipv6 = 229;
constexpr int linuxCooked2 = 276;
} // namespace link_type

constexpr std::array linkTypeNames = {
    NumberName{link_type::null, "BSD loopback"},
    NumberName{link_type::ethernet, "Ethernet"},
    NumberName{link_type::ppp, "PPP"},
    NumberName{link_type::rawOfSystems, "Raw IP"},
    NumberName{link_type::rawOfOpenBsd, "Raw IP"},
    NumberName{link_type::pppSerial, "PPP over serial"},
    NumberName{link_type::pppEthernet, "PPPoE"},
    NumberName{link_type::raw, "Raw IP"},
    NumberName{link_type::ciscoHdlc, "Cisco HDLC"},
    NumberName{link_type::frameRelay, "Frame Relay"},
    NumberName{link_type::loop, "OpenBSD loopback"},
    NumberName{link_type::linuxCooked, "Linux cooked v1"},
    NumberName{link_type::pppOfPppd, "PPP for pppd, with direction flag"},
    NumberName{link_type::pppWithDirection, "PPP with direction"},
    NumberName{link_type::ciscoHdlcWithDirection, "Cisco HDLC with direction"},
    NumberName{link_type::frameRelayWithDirection, "Frame Relay with direction"},
    NumberName{link_type::mpls, "MPLS"},
    NumberName{link_type::ipv4, "Raw IPv4"},
    NumberName{link_type::ipv6, "Raw IPv6"},
    NumberName{link_type::linuxCooked2, "Linux cooked v2"},
};

} // namespace

std::string NotIp::text() const {
    switch (kind_) {
    case Kind::ip: break;
    case Kind::name: return std::string(name_);
    case Kind::cutHeader: return "cut inside the " + std::string(name_) + " header";
    case Kind::etherType: return hexText("EtherType", number_);
    case Kind::pppProtocol: return hexText("PPP protocol", number_);
    case Kind::nlpid: return hexText("Frame Relay protocol", number_);
    case Kind::addressFamily: return "address family " + std::to_string(number_);
    case Kind::linkType: return "link type " + linkTypeName(static_cast<int>(number_));
    }
    return {};
}

NetworkPart findNetworkPart(int linkType, std::span<const std::uint8_t> packet) {
    LinkWalk walk(packet);
    switch (linkType) {
    case link_type::ethernet: return walk.ethernet();
    case link_type::linuxCooked: return walk.cooked(14, 16);
    case link_type::linuxCooked2: return walk.cooked(0, 20);
    case link_type::raw:
    case link_type::rawOfSystems:
    case link_type::rawOfOpenBsd:
    case link_type::ipv4:
    case link_type::ipv6: return walk.raw();
    case link_type::null: return walk.addressFamily(false);
    case link_type::loop: return walk.addressFamily(true);
    case link_type::ppp:
    case link_type::pppSerial: return walk.ppp();
    case link_type::pppEthernet: return walk.pppoeSession();
    case link_type::pppOfPppd: return walk.pppWithDirection(true);
    case link_type::pppWithDirection: return walk.pppWithDirection(false);
    case link_type::ciscoHdlc: return walk.ciscoHdlc();
    case link_type::ciscoHdlcWithDirection: return walk.ciscoHdlcWithDirection();
    case link_type::frameRelay: return walk.frameRelay();
    case link_type::frameRelayWithDirection: return walk.frameRelayWithDirection();
    case link_type::mpls: return walk.mpls();
    default: return walk.other(NotIp(NotIp::Kind::linkType, static_cast<std::uint32_t>(linkType)));
    }
}

std::string linkTypeName(int linkType) {
    const auto *const found = std::find_if(linkTypeNames.begin(), linkTypeNames.end(),
                                           [linkType](const NumberName &row) { return row.number == linkType; });
    if (found != linkTypeNames.end()) {
        return std::string(found->name);
    }
    const Libpcap *const pcap = libpcap();
    const char *const text = pcap == nullptr ? nullptr : pcap->describe(libpcapLinkType(linkType));
    return text != nullptr ? text : std::to_string(linkType);
}

} // namespace netfloor
