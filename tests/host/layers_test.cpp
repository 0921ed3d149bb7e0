// SPDX-License-Identifier: MIT
// The layers of a packet, and the packets inside it.
#include <algorithm>
#include <iterator>
#include <map>
#include <sstream>
#include <string>

#include <gtest/gtest.h>

#include "netfloor-host/field_knowledge.h"
#include "netfloor-host/layers.h"
#include "netfloor-host/plain_tcp.h"
#include "support/packets.h"

namespace netfloor::test {
namespace {

constexpr std::uint8_t udpProtocol = 17;
constexpr std::uint8_t greProtocol = 47;

const Octets inner = ipv4({.protocol = udpProtocol, .payload = udp(5000, 53, hex("61*12")), .source = 0x0a090909});
const Octets inner6 = ipv6({.nextHeader = udpProtocol, .payload = udp(5000, 53, hex("61*12"))});
const Octets ethernet = hex("02*12 0800");

Octets gtpU(const std::string &flags, const Octets &rest, const std::string &type = "ff") {
    return hex(flags + type) + be16(static_cast<std::uint32_t>(rest.size())) + hex("00000007") + rest;
}
Octets overUdp(const Octets &payload, std::uint16_t port = 2152) {
    return ipv4({.protocol = udpProtocol, .payload = udp(port, 53, payload)});
}
Octets overGre(const std::string &header, const Octets &payload) {
    return ipv4({.protocol = greProtocol, .payload = hex(header) + payload});
}

// "2152>53 5000>53": the ports of each layer of UDP.
std::string portsOf(const LayerView &view) {
    std::string text;
    for (const Layer &layer : view.layers()) {
        if (layer.kind == LayerKind::udp) {
            text += (text.empty() ? "" : " ") + std::to_string(*view.number(layer, layerField("udp.source_port"))) +
                    ">" + std::to_string(*view.number(layer, layerField("udp.destination_port")));
        }
    }
    return text;
}

TEST(LayerFields, holdForEveryRow) {
    const FieldTables tables(PluginLibrary::open(NETFLOOR_PLUGIN));
    const LayerFieldMap map(tables.fields());
    for (const std::string &mismatch : map.mismatches()) {
        ADD_FAILURE() << mismatch;
    }
    // A name is in one kind and one place alone.
    std::map<std::string_view, std::size_t> lastRow;
    const auto rows = layerFieldSources();
    for (std::size_t row = 0; row < rows.size(); ++row) {
        const auto [known, isNew] = lastRow.try_emplace(rows[row].name, row);
        EXPECT_TRUE(isNew || (known->second == row - 1 && rows[row].kind == rows[row - 1].kind)) << rows[row].name;
        known->second = row;
    }
}

class Layers : public testing::Test {
protected:
    Host host_ = Host(PluginLibrary::open(NETFLOOR_PLUGIN));
    LayerView view_ = LayerView(host_);
};

TEST_F(Layers, openPacketsInsideAPacket) {
    const struct {
        const char *what;
        Octets packet;
        const char *ports;
        std::uint16_t ipLayers;
    } cases[] = {
        {"GTP-U", overUdp(gtpU("30", inner)), "2152>53 5000>53", 2},
        {"sequence number", overUdp(gtpU("32", hex("0001 00 00") + inner)), "2152>53 5000>53", 2},
        {"two extension headers", overUdp(gtpU("34", hex("0000 00 85  01 0000 c0  02 00000000 0000 00") + inner)),
         "2152>53 5000>53", 2},
        {"an extension header of length 0", overUdp(gtpU("34", hex("0000 00 85  00 0000 00") + inner)), "2152>53", 1},
        {"an extension header past the end", overUdp(gtpU("34", hex("0000 00 85  ff 0000 00") + inner)), "2152>53", 1},
        {"another message", overUdp(gtpU("32", inner, "01")), "2152>53", 1},
        {"a message that is cut", overUdp(hex("30 ff ffff 00000007") + inner), "2152>53", 1},
        {"neither IPv4 nor IPv6", overUdp(gtpU("30", hex("75*40"))), "2152>53", 1},
        {"IPv6 in GTP-U", overUdp(gtpU("30", inner6)), "2152>53 5000>53", 2},
        {"VXLAN", overUdp(hex("08 000000 000102 00") + ethernet + inner, 4789), "4789>53 5000>53", 2},
        {"GRE", overGre("0000 0800", inner), "5000>53", 2},
        {"GRE in minimal encapsulation", ipv4({.protocol = 55, .payload = hex("2f 00*3 0a*4 0000 0800") + inner}),
         "5000>53", 3},
        {"minimal encapsulation with a source",
         ipv4({.protocol = 55, .payload = hex("2f 80 0000 0a*8 0000 0800") + inner}), "5000>53", 3},
        {"minimal encapsulation that is cut", ipv4({.protocol = 55, .payload = hex("2f 00*3 0a*3")}), "", 2},
        {"GRE with key and sequence", overGre("3000 86dd 00000001 00000002", inner6), "5000>53", 2},
        {"Ethernet in GRE", overGre("0000 6558", ethernet + inner), "5000>53", 2},
        {"MPLS in GRE", overGre("0000 8847 00001040 00002140", inner), "5000>53", 2},
        {"PPP in GRE", overGre("3081 880b 00140001 00000001 00000002 ff03 0021", inner), "5000>53", 2},
        {"IPv6 in IPv4", ipv4({.protocol = 41, .payload = inner6}), "5000>53", 2},
        {"IPv4 in IPv6", ipv6({.nextHeader = 4, .payload = inner}), "5000>53", 2},
        {"IP in IP", ipv4({.protocol = 4, .payload = inner}), "5000>53", 2},
        {"a later fragment of IPv4 with DF", ipv4({.protocol = 17, .payload = udp(1, 2), .fragment = 0x4001}), "", 1},
        {"a later fragment of IPv6", ipv6({.nextHeader = 44, .payload = hex("11 00 0008 00000001") + udp(1, 2)}), "",
         1},
        {"a later fragment", ipv4({.protocol = 41, .payload = inner6, .fragment = 1}), "", 1},
    };
    for (const auto &[what, packet, ports, ipLayers] : cases) {
        view_.read(packet);
        EXPECT_EQ(portsOf(view_), ports) << what;
        EXPECT_EQ(view_.ipLayers(), ipLayers) << what;
    }
}

// What the plug-in reads from a wrong place is left out, also inside a tunnel that it reads itself.
TEST_F(Layers, leaveOutWhatIsMisread) {
    const std::string udp = "1388 0035 0008 0000";
    const Octets twoOptions = ipv6({.nextHeader = 0, .payload = hex("1100 0502 0000 0100" + udp)});
    const Octets oneOption = ipv6({.nextHeader = 0, .payload = hex("1100 0104 0000 0000" + udp)});
    const struct {
        Octets packet;
        std::uint32_t unread; // the octet, or 0
        std::uint16_t ipLayers;
        std::size_t layers;
    } cases[] = {
        {twoOptions, 48, 1, 1},
        {ipv6({.nextHeader = 41, .payload = twoOptions}), 88, 2, 2},
        {oneOption, 0, 1, 2},
    };
    for (const auto &[packet, unread, ipLayers, layers] : cases) {
        view_.read(packet);
        EXPECT_EQ(view_.unread() ? view_.unread()->octet : 0, unread) << hexText(packet);
        EXPECT_EQ(view_.ipLayers(), ipLayers);
        ASSERT_EQ(view_.layers().size(), layers);
        EXPECT_EQ(view_.limit().find("several IPv6 options") == std::string_view::npos, unread == 0);
        EXPECT_TRUE(unread == 0 || view_.number(view_.layers().back(), layerField("ip.protocol")) == 17U);
    }
}

// Neither a chain of tunnels that the plug-in reads nor one that the host opens ends in silence.
TEST_F(Layers, nameTheLimits) {
    Octets chain = inner;
    Octets gre = inner;
    Octets large = ipv4({.payload = Octets(60000)});
    for (int i = 0; i < 20; ++i) {
        chain = ipv4({.protocol = 4, .payload = chain});
        gre = overGre("0000 0800", gre);
        large = i < 5 ? overGre("0000 0800", large) : large;
    }
    const std::pair<Octets, const char *> cases[] = {
        {chain, "16 IP layers"}, {gre, "16 packets"}, {large, "262144 octets"}};
    for (const auto &[packet, words] : cases) {
        view_.read(packet);
        EXPECT_NE(view_.limit().find(words), std::string_view::npos) << view_.limit();
        EXPECT_EQ(view_.ipLayers(), packet == large ? 4 : 16);
    }
}

// All that a view gives of a packet.
std::string textOf(const LayerView &view) {
    std::ostringstream out;
    for (const Layer &layer : view.layers()) {
        out << static_cast<int>(layer.kind) << " of " << layer.ipLayer << '/' << layer.packet << ' ' << layer.firstOctet
            << '-' << layer.endOctet << ' ' << view.name(layer) << view.text(layer);
        for (std::uint8_t place = 0; place < layerFieldCount(layer.kind); ++place) {
            const LayerField field{layer.kind, place};
            if (view.has(layer, field)) {
                const LayerValue value = view.valueKind(layer, field);
                const bool isNumber = value != LayerValue::ipv6Address && value != LayerValue::octets;
                out << ' ' << int{place} << '@' << view.octet(layer, field) << ':' << static_cast<int>(value) << '='
                    << (isNumber ? *view.number(layer, field) : 0) << hexText(view.octets(layer, field));
            }
        }
        out << '\n';
    }
    out << view.limit() << (view.isCutOff() ? "cut off" : "");
    return out.str();
}

// The section of the field before the one that has the flag first.
std::string_view sectionBefore(std::uint32_t flag, const Report &report, const FieldKnowledge &knowledge) {
    const auto hasFlag = [flag](const FieldReport &field) { return (field.flags & flag) != 0; };
    return knowledge.section(std::prev(std::ranges::find_if(report.fields, hasFlag))->id);
}

// Each octet of each header with values that matter, and each header cut, by both ways. What is by design in one plain
// TCP packet is so in all of them.
TEST_F(Layers, areTheSameWithoutAPass) {
    constexpr std::uint8_t icmpProtocol = 1;
    constexpr std::uint8_t tcpProtocol = 6;
    const Octets values = hex("00 01 02 05 08 0a 13 1a 20 45 50 ff");
    const Octets tcpHead = hex("d431 0050 01234567 89abcdef");
    const auto tcp = [&](const std::string &rest) { return tcpHead + hex(rest); };
    const Octets payloads[] = {
        udp(5000, 53, hex("61*12")),
        udp(5000, 2152, hex("30 ff 0028 00000007") + inner),
        tcp("5018 7f1a 9b2d 0000  61*5"),
        tcp("8010 7f1a 9b2d 0000  0101 080a 11223344 55667788  61*9"),
        tcp("a002 7f1a 9b2d 0000  0204 05b4 0402 080a 11223344 00000000 01 030307"),
        tcp("b010 7f1a 9b2d 0007  0101 0512 91929394 a1a2a3a4 b1b2b3b4 c1c2c3c4 0000 0000  61"),
        tcp("6010 7f1a 9b2d 0000  fd04 0000"),
        hex("0800 9b2d 1234 5678 61*9"),
    };
    LayerView slow(host_, LayerReading::byPass);
    const FieldKnowledge knowledge(FieldTables(host_.library()).fields());
    int plainTcp = 0;
    const auto expectSame = [&](const Octets &packet, std::size_t wireOctets, std::size_t changed) {
        const RunOptions options{.wireOctets = wireOctets};
        view_.read(packet, options);
        slow.read(packet, options);
        ASSERT_EQ(textOf(view_), textOf(slow)) << hexText(packet) << ", octet " << changed << ", " << wireOctets;
        if (isPlainTcp(packet) && host_.run(Pass::mv, packet).verdict.flags == NETFLOOR_FLAG_EXPECTATION) {
            const Report report = host_.run(Pass::md, packet);
            ASSERT_TRUE(sectionBefore(NETFLOOR_FLAG_EXPECTATION, report, knowledge).starts_with("TCP"))
                << hexText(packet);
            ++plainTcp;
        }
    };
    for (const Octets &payload : payloads) {
        const std::uint8_t protocol = payload[0] == 0xd4   ? tcpProtocol
                                      : payload[0] == 0x08 ? icmpProtocol
                                                           : udpProtocol;
        for (const Octets &packet :
             {ipv4({.protocol = protocol, .payload = payload}), ipv6({.nextHeader = protocol, .payload = payload})}) {
            for (std::size_t octet = 0; octet < packet.size(); ++octet) {
                for (const std::uint8_t value : values) {
                    Octets changed = packet;
                    changed[octet] = value;
                    expectSame(changed, 0, octet);
                }
                const Octets cut(packet.begin(), packet.begin() + static_cast<std::ptrdiff_t>(octet));
                expectSame(cut, 0, octet);
                expectSame(cut, packet.size(), octet);
                if (HasFatalFailure()) {
                    return;
                }
            }
        }
    }
    EXPECT_LT(view_.passes(), slow.passes() / 2);
    EXPECT_GT(plainTcp, 1000);
}

} // namespace
} // namespace netfloor::test
