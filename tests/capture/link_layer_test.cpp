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
constexpr int pppSerial = 50;
constexpr int ciscoHdlc = 104;
constexpr int frameRelay = 107;
constexpr int ciscoHdlcWithDirection = 205;
constexpr int frameRelayWithDirection = 206;
constexpr int mpls = 219;

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
    };
    for (const Row &row : rows) {
        SCOPED_TRACE(hexText(row.packet));
        EXPECT_EQ(findNetworkPart(row.linkType, row.packet).other.text(), row.text);
    }
}

} // namespace
} // namespace netfloor::test
