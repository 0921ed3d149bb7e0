// SPDX-License-Identifier: MIT
// The IP header that an ICMP error message quotes (RFC 792).
#include <algorithm>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "support/listings.h"

namespace netfloor::test {
namespace {

// A time exceeded message with these octets after its own fields.
Octets timeExceeded(const Octets &quoted, const Octets &options = {}) {
    return ipv4({.protocol = 1, .payload = hex("0b 00 00*6") + quoted, .options = options});
}

// A header of this many words, without its options.
Octets header(std::uint8_t words, std::uint8_t protocol = 17) {
    return Octets{static_cast<std::uint8_t>(0x40 + words)} + hex("00 00 54 12 34 40 00 40") + Octets{protocol} +
           hex("00 00 0a 00 00 01 c0 a8 00 02");
}

TEST(QuotedHeader, everyFieldInEveryPass) {
    const Runs runs = runAll(timeExceeded(hex(R"(
        66 9b 00 5a 00 0a c0 02     # version and reserved bits are shown, not tested; offset 16
        ff 06 0a bc 0a 00 00 01 c0 a8 00 02
        01 00 aa bb                 # options
        00 35 9c 40 00*4            # no TCP header for anybody
    )")));
    EXPECT_EQ(fieldLines(runs, 569), expected(R"x(
        605 |7 Internet Protocol Message in ICMP| "Version" "  Version=6" 229-232 > 150 "6"
        606 |7 Internet Protocol Message in ICMP| "IHL" "  IHL=6*4 octet(s)" 225-228 > 606 "6*4 octet(s)"
        607 |7 Internet Protocol Message in ICMP| "Precedence" "  Precedence=Flash override" 238-240 > 286 "Flash override"
        608 |7 Internet Protocol Message in ICMP| "D" "  D=Low delay" 237-237 > 608 "Low delay"
        609 |7 Internet Protocol Message in ICMP| "T" "  T=High throughput" 236-236 > 609 "High throughput"
        610 |7 Internet Protocol Message in ICMP| "R" "  R=Normal reliability" 235-235 > 610 "Normal reliability"
        611 |7 Internet Protocol Message in ICMP| "Fixed Value" "  Fixed Value=3" 233-234 > 611 "3"
        612 |7 Internet Protocol Message in ICMP| "Original Length" "  Original Length=90" 241-256/8 > 612 "90"
        615 |7 Internet Protocol Message in ICMP| "Original Identification" "  Original Identification=a" 257-272/8 > 615 "a"
        616 |7 Internet Protocol Message in ICMP| "Flags Fixed Value" "  Flags Fixed Value=1" 280-280 > 616 "1"
        617 |7 Internet Protocol Message in ICMP| "Flags DF" "  Flags DF=Do not fragment" 279-279 > 617 "Do not fragment"
        618 |7 Internet Protocol Message in ICMP| "Flags MF" "  Flags MF=Last fragment" 278-278 > 618 "Last fragment"
        619 |7 Internet Protocol Message in ICMP| "Fragment Offset" "  Fragment Offset=16" 273-277 281-288 > 294 "16"
        620 |7 Internet Protocol Message in ICMP| "TTL" "  TTL=255" 289-296 > 620 "255"
        688 |8 Embedded IP Protocols| "Embedded IP Protocols" "Embedded IP Protocols=TCP" 297-304 > 663 "ICMP - TEM - TCP"
        621 |7 Internet Protocol Message in ICMP| "Header Checksum" "  Header Checksum=abc" 305-320/8 > 158 "abc"
        624 |7 Internet Protocol Message in ICMP| "IP Source Address" "  IP Source Address=10.0.0.1" 321-352/8 > 624 "10.0.0.1"
        625 |7 Internet Protocol Message in ICMP| "IP Destination Address" "  IP Destination Address=192.168.0.2" 353-384/8 > 625 "192.168.0.2"
        318 |10 Type1| "Type1, No Operation" "Type1, No Operation" 385-392 > 318 "1"
        381 |10 | "End Of Option Part" "End Of Option Part" 393-400 > 381 "0"
        306 |8 Options| "Padding" "Padding=aabb" 401-416/8 > 306 "aabb"
        570 |6 Time Exceeded Message| "64-bit Original Data Datagram" "  64-bit Original Data Datagram=0359c400000" 417-480/8 > 551 "0"
    )x"));
    EXPECT_EQ(linesFrom(lines(runs.xtr), "row 9"), expected(R"(
        row 9 Fragment Offset=0
        row 36 Code=0
        row 48 Embedded IP Protocols=6
        row 77 ICMP Message Type=11
    )"));
    EXPECT_EQ(verdictLine(runs.mv), "verdict 0 flags 0x0\n");
}

// The field of the protocol depends on the message, and on whether it came through a tunnel.
TEST(QuotedHeader, protocolAndOuterProtocol) {
    struct MessageType {
        std::uint8_t type;
        std::uint32_t idInTunnel, id;
        const char *textInTunnel, *text;
    };
    const std::vector<MessageType> types = {{3, 663, 679, "IPinIP - ICMP - DUM - ", "ICMP - DUM- "},
                                            {4, 666, 682, "IPinIP- ICMP - SQM - ", "ICMP - SQM- "},
                                            {5, 669, 685, "IPinIP - ICMP - RM - ", "ICMP - RM - "},
                                            {11, 672, 688, "IPinIP - ICMP - TEM - ", "ICMP - TEM - "},
                                            {12, 675, 691, "IPinIP - ICMP - PPM - ", "ICMP - PPM - "}};
    const Octets minimal = hex("01 00 00 00 0a 00 00 01");
    for (const MessageType &one : types) {
        for (const auto &[protocol, name] : {std::pair(17, "UDP"), std::pair(255, "")}) {
            const Octets message = Octets{one.type} + hex("00*7") + header(5, static_cast<std::uint8_t>(protocol));
            const Octets inner = ipv4({.protocol = 1, .payload = message});
            const auto check = [&, protocol = protocol, name = name](const Octets &packet, bool tunnel) {
                const Runs runs = runAll(packet);
                EXPECT_EQ(runs.md.field("Embedded IP Protocols")->id, tunnel ? one.idInTunnel : one.id);
                EXPECT_EQ(runs.xtr.key("Embedded IP Protocols")->number, static_cast<std::uint32_t>(protocol));
                EXPECT_EQ(runs.md.field("Embedded IP Protocols")->text, std::string("Embedded IP Protocols=") + name);
                EXPECT_EQ(linesWith(lines(runs.to), "663"),
                          std::string("663 \"") + (tunnel ? one.textInTunnel : one.text) + name + "\"\n");
            };
            check(inner, false);
            check(ipv4({.protocol = 4, .payload = inner}), true);
            check(ipv4({.protocol = 55, .payload = minimal + message}), false);
            check(ipv4({.protocol = 4, .payload = ipv4({.protocol = 55, .payload = minimal + message})}), true);
        }
    }
}

// Its options are as long as its own header length says, and not that of the header around it.
TEST(QuotedHeader, lengthOfItsOptions) {
    const Octets rest = hex("01 01 01 00 61*8");
    for (const char *outerOptions : {"", "01 01 01 00", "01*8"}) {
        const Octets options = hex(outerOptions);
        EXPECT_EQ(fieldValues(runAll(timeExceeded(header(6) + rest, options)).md, 625),
                  "318=1 318=1 318=1 381=0 570=61616161");
        for (const std::uint8_t words : hex("00 04 05")) {
            EXPECT_EQ(fieldValues(runAll(timeExceeded(header(words) + rest, options)).md, 625), "570=61616161")
                << int{words};
        }
        // More than is left: neither padding nor data.
        const Runs runs = runAll(timeExceeded(header(15) + hex("61*39"), options));
        EXPECT_EQ(fieldValues(runs.md, 625), "");
        EXPECT_EQ(verdictLine(runs.mv), "verdict -52 flags 0x10\n");
    }
}

// Fields that fit into n octets of it, and those of which a bit is left over. The offset moves on by one octet.
TEST(QuotedHeader, thatEndsEarly) {
    const std::vector<std::ptrdiff_t> fields = {0,  2,  7,  7,  8,  8,  9,  12, 13, 14, 15, 15, 16, 16, 16,
                                                16, 17, 17, 17, 17, 18, 18, 18, 18, 18, 18, 18, 18, 19};
    const Octets swept = hex("03 05 07 08 0b 0d 0e 0f 11 12 13 15 16 17 18 19 1a 1b");
    for (std::size_t octets = 0; octets < fields.size(); ++octets) {
        SCOPED_TRACE(octets);
        const Runs runs = runAll(shortened(timeExceeded(header(5) + hex("61*8")), 28 + octets));
        EXPECT_EQ(std::ranges::count(fieldLines(runs, 569), '\n'), fields[octets]);
        EXPECT_EQ(runs.md.flags, 0u);
        EXPECT_EQ(runs.mv.flags, std::ranges::count(swept, octets) > 0 ? 0x10u : 0u);
    }
}

} // namespace
} // namespace netfloor::test
