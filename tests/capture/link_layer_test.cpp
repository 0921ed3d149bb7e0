// SPDX-License-Identifier: MIT
// From the link layer to the IP header.
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "netfloor-capture/link_layer.h"
#include "support/packets.h"

namespace netfloor::test {
namespace {

constexpr int null = 0;
constexpr int ethernet = 1;
constexpr int ppp = 9;
constexpr int pppSerial = 50;
constexpr int pppOverEthernet = 51;
constexpr int raw = 101;
constexpr int ciscoHdlc = 104;
constexpr int frameRelay = 107;
constexpr int loopback = 108;
constexpr int linuxCooked = 113;
constexpr int pppWithDirectionInFront = 166;
constexpr int pppWithDirection = 204;
constexpr int ciscoHdlcWithDirection = 205;
constexpr int frameRelayWithDirection = 206;
constexpr int mpls = 219;
constexpr int rawIpv4 = 228;
constexpr int rawIpv6 = 229;
constexpr int linuxCooked2 = 276;

const Octets addresses = hex("ff*6 02*6");

TEST(LinkLayer, endsAtTheIpHeader) {
    struct Row {
        int linkType;
        Octets head;
        const char *ip = "45*20";
    };
    const std::vector<Row> rows = {
        {mpls, hex("00010140")},
        {mpls, hex("00010040 00020140"), "60*40"},
        {mpls, hex("00010140"), "4f*60"},
        {mpls, hex("00010140 00000000") + addresses + hex("0800")}, // a pseudowire with its control word
        {mpls, hex("00010140") + addresses + hex("8100 0005 86dd"), "60*40"},
        {ethernet, addresses + hex("8847 00010140")},
        {ethernet, addresses + hex("8100 0005 8848 00010140")},
        {pppSerial, hex("ff03 0281 00010140")},
        {ciscoHdlc, hex("0f00 0800")},
        {ciscoHdlc, hex("8f00 86dd"), "60*40"},
        {ciscoHdlc, hex("0f00 8847 00010140")},
        {ciscoHdlcWithDirection, hex("01 0f00 0800")},
        {pppSerial, hex("0f00 0800")},
        {null, hex("0f00 0800")},
        {null, hex("ff03 0021")},
        {null, hex("1841 03cc")},
        {null, hex("00000800")},
        {null, hex("dd860000"), "60*40"},
        {frameRelay, hex("1841 03cc")},
        {frameRelay, hex("1841 03 00 cc")},
        {frameRelay, hex("18406881 03 8e"), "60*40"}, // an address of four octets
        {frameRelay, hex("1841 03 00 80 000000 0800")},
        {frameRelay, hex("1841 03 80 0080c2 0007") + addresses + hex("0800")},
        {frameRelay, hex("1841 03cf 0021")},
        {frameRelay, hex("1841 0800")},
        {frameRelayWithDirection, hex("00 1841 03cc")},
        {ethernet, addresses + hex("0800")},
        {ethernet, addresses + hex("88a8 0001 8100 0002 8100 0003 0800")},
        {ethernet, addresses + hex("8864 11 00 0001 0026 0021")},
        {ethernet, addresses + hex("8100 0001 8864 11 00 0001 0026 0021")},
        {ethernet, addresses + hex("002c aaaa03 000000 0800")}, // SNAP
        {linuxCooked, hex("0000 0001 0006 02*6 0000 0800")},
        {linuxCooked, hex("0000 0001 0006 02*6 0000 8100 0001 0800")},
        {linuxCooked2, hex("0800 0000 00000001 0001 00 06 02*8")},
        {raw, {}},
        {12, {}},
        {14, {}},
        {rawIpv4, {}},
        {rawIpv6, {}, "60*40"},
        {null, hex("02000000")},
        {null, hex("00000002")},
        {null, hex("1e000000"), "60*40"},
        {loopback, hex("00000002")},
        {loopback, hex("0000001c"), "60*40"},
        {ppp, hex("ff03 0021")},
        {ppp, hex("0021")},
        {ppp, hex("21")},
        {pppSerial, hex("ff03 0021")},
        {pppOverEthernet, hex("11 00 0001 0026 0021")},
        {pppWithDirectionInFront, hex("00 03 0021")},
        {pppWithDirection, hex("00 ff03 0021")},
    };
    for (const Row &row : rows) {
        SCOPED_TRACE(std::to_string(row.linkType) + ": " + hexText(row.head));
        const Octets packet = row.head + hex(row.ip);
        const NetworkPart network = findNetworkPart(row.linkType, packet);
        EXPECT_TRUE(network.isIp()) << network.other.text();
        EXPECT_EQ(network.offset, row.head.size());
        for (std::size_t size = 0; size < row.head.size();
             ++size) { // each beginning says what it is, and reads no further
            const Octets start(packet.begin(), packet.begin() + static_cast<std::ptrdiff_t>(size));
            EXPECT_FALSE(findNetworkPart(row.linkType, start).isIp()) << size;
        }
    }
}

TEST(LinkLayer, saysWhatIsNoIp) {
    struct Row {
        int linkType;
        Octets packet;
        const char *text;
    };
    const std::vector<Row> rows = {
        {mpls, hex("000101"), "cut inside the MPLS header"},
        {mpls, hex("00010140 0000 12*20"), "MPLS without IP"},
        {ciscoHdlc, hex("8f00 8035 00*14"), "SLARP"},
        {ciscoHdlc, hex("0f00 80"), "cut inside the Cisco HDLC header"},
        {frameRelay, hex("0001 0308 00*8"), "Frame Relay Q.933"},
        {frameRelay, hex("1841 0399 00*8"), "Frame Relay protocol 0x0099"},
        {frameRelay, hex("1841"), "cut inside the Frame Relay header"},
        {frameRelay, hex("1841 0380 0000"), "cut inside the SNAP header"},
        {null, hex("07000000 00*8"), "address family 7"},
        {null, hex("78563412 00*8"), "address family 2018915346"},
        {ethernet, addresses + hex("8864 11 00 0001 0026 c021"), "PPP LCP"},
        {ethernet, addresses + hex("8863"), "PPPoE discovery"},
        {ethernet, addresses + hex("0026 4242 03"), "spanning tree"},
        {ethernet, addresses + hex("0026 e0e0 03"), "802.3 frame"},
        {ethernet, addresses + hex("1234"), "EtherType 0x1234"},
        {linuxCooked, hex("0000 0001 0006 02*6 0000 0806"), "ARP"},
        {linuxCooked2, hex("88cc 0000 00000001 0001 00 06 02*8"), "LLDP"},
        {ppp, hex("ff03 8021"), "PPP IPCP"},
        {pppSerial, hex("ff03 8057"), "PPP IPv6CP"},
        {pppWithDirectionInFront, hex("01 03 c023"), "PPP PAP"},
        {147, {}, "link type 147"}, // for private use
        {ethernet, addresses + hex("0800"), "no octets after the link layer"},
        {ppp, hex("ff03 4021 00*4"), "PPP protocol 0x4021"},
    };
    for (const Row &row : rows) {
        SCOPED_TRACE(hexText(row.packet));
        EXPECT_EQ(findNetworkPart(row.linkType, row.packet).other.text(), row.text);
    }
}

} // namespace
} // namespace netfloor::test
