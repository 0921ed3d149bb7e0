// SPDX-License-Identifier: MIT
// Conditions on the layers of a packet.
#include <string>

#include <gtest/gtest.h>

#include "netfloor-host/condition.h"
#include "support/packets.h"

namespace netfloor::test {
namespace {

const Octets inner = ipv4({.protocol = 17, .payload = udp(5000, 53, hex("61*12")), .timeToLive = 3});
const Octets tunnel = ipv4({.protocol = 4, .payload = inner, .source = 0xc0000201, .destination = 0xc0000202});
const Octets overIpv6 = ipv6({.nextHeader = 17, .payload = udp(546, 547, hex("01"))});
// DATA with TSN 7 and stream 1, DATA with TSN 8 and stream 2
const Octets chunks = ipv4({.protocol = 132,
                            .payload = hex("0b59 0b59 00000001 00000000"
                                           "00 03 0011 00000007 0001 0000 00000000 61 000000"
                                           "00 03 0011 00000008 0002 0000 00000000 61 000000")});

const Octets icmpv6Error = ipv6({.nextHeader = 58, .payload = hex("01 00 0000 00000000") + overIpv6});
const Octets icmpError = ipv4({.protocol = 1, .payload = hex("03 01 0000 00000000") + inner});
const Octets gre = ipv4({.protocol = 47, .payload = hex("0000 6003 00*8")});
const Octets esp = ipv6({.nextHeader = 51, .payload = hex("3b 01 0000 00000001 00000001 00000000")});

TEST(Condition, holdsForOneLayerAndOneChunk) {
    Host host(PluginLibrary::open(NETFLOOR_PLUGIN));
    LayerView view(host);
    const struct {
        const Octets &packet;
        const char *text;
        bool holds;
    } cases[] = {
        {inner, "ip and udp and payload and not gre", true},
        {inner, "tcp or sctp or chunk or security", false},
        {gre, "gre and not icmp", true},
        {icmpError, "icmp and quoted and not icmpv6 and not tcp and not udp", true},
        {icmpv6Error, "icmpv6 and not quoted", true},
        {chunks, "sctp and chunk and not security", true},
        {esp, "security and not payload", true},
        {inner, "ip.ttl == 3", true},
        {inner, "ip.ttl = 0x3", true},
        {inner, "ip.ttl != 3", false},
        {inner, "ip.ttl < 3 or ip.ttl > 3", false},
        {inner, "ip.ttl <= 3 && ip.ttl >= 3", true},
        {inner, "ip.ttl < 0 || ip.ttl > 4294967295", false},
        {inner, "ip.ttl eq 3 and ip.ttl ne 4 and ip.ttl lt 4 and ip.ttl le 3 and ip.ttl gt 2 and ip.ttl ge 3", true},
        {inner, "not udp.source_port == 53", true},
        {inner, "tcp.source_port != 53", false}, // there is none
        {inner, "!(tcp.source_port == 53)", true},
        {inner, "udp.port == 53 and udp.port == 5000", true},
        {chunks, "sctp.port == 2905 and not tcp.port == 2905", true},
        {inner, "udp.port in {1, 52-54}", true},
        {inner, "source_port in {53, 5000} and destination_port in {53, 5000}", true},
        {inner, "source_port == 2905", false},
        {chunks, "source_port == 2905", true}, // of any transport
        {inner, "udp.port in {1, 54-60}", false},
        {inner, "udp.source_port == 1 or udp.source_port == 2 and udp or ip.version == 4", true},
        {inner, "ip.dont_fragment", false}, // a flag that is not set
        {inner, "ip.source", true},         // is there
        {inner, "ip.source in 10.0.0.0/8", true},
        {inner, "ip.source in {11.0.0.0/8, 10.0.0.1}", true},
        {inner, "ip.source in 10.0.0.2/31", false},
        {inner, "ip.source in 11.0.0.0/7", true},
        {inner, "ip.address == ::a00:1", false},
        {inner, "ip.source in 0.0.0.0/0", true},
        {overIpv6, "ip.source in 2001:db8::/32", true},
        {overIpv6, "ip.source == 2001:db8:0:0:0::1 or ip.source == 2001:db8:0::0.0.0.1", true},
        {overIpv6, "ip.source in 0.0.0.0/0", false},
        {overIpv6, "ip.source in 2001:db9::/33", false},
        {tunnel, "ip.source == 192.0.2.1 and ip.protocol == 4", true},
        {tunnel, "ip.source == 192.0.2.1 and udp", false}, // another layer
        {tunnel, "ip.ttl == 3 and udp.port == 53", true},
        {chunks, "sctp.tsn == 7 and sctp.stream == 1", true},
        {chunks, "sctp.tsn == 7 and sctp.stream == 2", false}, // another chunk
        {chunks, "sctp.tsn == 8 and sctp.source_port == 2905", true},
    };
    for (const auto &[packet, text, holds] : cases) {
        view.read(packet);
        EXPECT_EQ(Condition(text).holdsFor(view), holds) << text;
    }
}

TEST(Condition, pointsAtAMistake) {
    const struct {
        std::string text;
        const char *marks; // under the text
        const char *words;
    } cases[] = {
        {"", "^", "a field is missing"},
        {"ip.tll < 5", "^^^^^^", "did you mean 'ip.ttl'?"},
        {"zzzzzzzzzzzz", "^^^^^^^^^^^^", "is no field"},
        {"ip.ttl < ", "         ^", "a number is missing"},
        {"ip.ttl < x", "         ^", "'x' is no number"},
        {"ip.ttl == 4294967296", "          ^^^^^^^^^^", "at most 4294967295"},
        {"ip.ttl 5", "       ^", "'and' or 'or'"},
        {"(udp or tcp", "           ^", "a ')' is missing"},
        {"udp and", "       ^", "a field is missing"},
        {"ip.source == 10.0.0", "             ^^^^^^", "no IPv4 or IPv6 address"},
        {"ip.source == 1:::2", "             ^^^^^", "no IPv4 or IPv6 address"},
        {"ip.source in 10.0.0.0/33", "             ^^^^^^^^^^^", "from 0 to 32"},
        {"ip.source in 10.0.0.0/", "             ^^^^^^^^^", "from 0 to 32"},
        {"ip.source < 10.0.0.1", "          ^", "have no order"},
        {"udp.port in {1 2}", "               ^", "a ',' or a '}'"},
        {"udp.port in 5-4", "             ^", "ends before it starts"},
        {"quoted.data == 5", "               ^", "have no value"},
        {std::string(100, '('), "                                                                ^", "more than 64"},
    };
    for (const auto &[text, marks, words] : cases) {
        try {
            const Condition condition(text);
            ADD_FAILURE() << text << " was taken";
        } catch (const ConditionError &error) {
            EXPECT_EQ(std::string(error.place(), ' ') + std::string(error.length(), '^'), marks) << text;
            EXPECT_NE(std::string(error.what()).find(words), std::string::npos) << error.what();
        }
    }
}

} // namespace
} // namespace netfloor::test
