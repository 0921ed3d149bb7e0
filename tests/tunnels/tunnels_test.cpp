// SPDX-License-Identifier: MIT
// IP in IP (RFC 2003) and minimal encapsulation (RFC 2004).
#include <string>
#include <tuple>
#include <vector>

#include <gtest/gtest.h>

#include "support/listings.h"
#include "support/memory.h"

namespace netfloor::test {
namespace {

Octets minimal(std::uint8_t protocol, const Octets &payload) {
    return Octets{protocol} + hex("00 00 00 0a 00 00 01") + payload;
}

Octets tunnel(std::uint8_t protocol, const Octets &payload) {
    return ipv4({.protocol = protocol, .payload = payload});
}

TEST(IpInIp, everyFieldInEveryPass) {
    const Runs runs = runAll(tunnel(4, hex(R"(
        66 9b 00 1a 00 0a 60 02      # version is shown, not tested; DF and MF, offset 16
        ff 3d 0a bc 0a 00 00 01 c0 a8 00 02
        01 01 00 bb                  # options
        61 62 63                     # one octet more than the inner length has
    )")));
    EXPECT_EQ(fieldLines(runs, 160), expected(R"x(
        629 |5 | "Version" "Version=6" 165-168 > 150 "6"
        630 |5 | "Original Internet Header Length" "Original Internet Header Length=6*4 octets" 161-164 > 630 "6*4 octets"
        286 |6 Type of Service| "Precedence" "Precedence=Flash Override" 174-176 > 286 "Flash Override"
        287 |6 Type of Service| "Delay" "Delay=Low Delay" 173-173 > 287 "Low Delay"
        288 |6 Type of Service| "Throughput" "Throughput=High Throughput" 172-172 > 288 "High Throughput"
        289 |6 Type of Service| "Reliability" "Reliability=Normal Reliability" 171-171 > 289 "Normal Reliability"
        290 |6 Type of Service| "Reserved" "Reserved=3" 169-170 > 290 "3"
        631 |5 | "Original IP Total Length" "Original IP Total Length=26 octets" 177-192/8 > 631 "26 octets"
        632 |5 | "Original Identification" "Original Identification=a" 193-208/8 > 615 "a"
        291 |6 Flag and Fragment Offset| "Reserved" "Reserved=0" 216-216 > 290 "0"
        292 |6 Flag and Fragment Offset| "DF" "DF=Don't Fragment" 215-215 > 292 "Don't Fragment"
        293 |6 Flag and Fragment Offset| "MF" "MF=More Fragments" 214-214 > 293 "More Fragments"
        294 |6 Flag and Fragment Offset| "Fragment Offset" "Fragment Offset=16 octets" 209-213 217-224 > 294 "16 octets"
        633 |5 | "Time to Live" "Time to Live=255" 225-232 > 157 "255"
        634 |5 | "IPinIP Protocol" "IPinIP Protocol=any host internal protocol" 233-240 > 634 "IPinIP - any host internal protocol"
        635 |5 | "Header Checksum" "  Header Checksum=abc" 241-256/8 > 158 "abc"
        636 |5 | "Original Src Address" "  Original Src Address=10.0.0.1" 257-288/8 > 636 "10.0.0.1"
        637 |5 | "Original Dest Address" "  Original Dest Address=192.168.0.2" 289-320/8 > 637 "192.168.0.2"
        318 |8 Type1| "Type1, No Operation" "Type1, No Operation" 321-328 > 318 "1"
        318 |9 Type1| "Type1, No Operation" "Type1, No Operation" 329-336 > 318 "1"
        381 |9 | "End Of Option Part" "End Of Option Part" 337-344 > 381 "0"
        306 |6 Options| "Padding" "Padding=bb" 345-352 > 306 "bb"
        285 |6 | "Unknown Protocol Data" "Unknown Protocol Data=61" 353-360 > 285 "61"
        285 |6 | "Unknown Protocol Data" "Unknown Protocol Data=62" 361-368 > 285 "62"
    )x"));
    // The fragment's rows are those of the inner header now, the others have their own.
    EXPECT_EQ(linesFrom(lines(runs.xtr), "row 3"), expected(R"(
        row 3 Time to Live=64
        row 4 Protocol=4
        row 5 Source Address=10.0.0.1
        row 6 Destination Address=192.168.0.2
        row 7 DF=1
        row 8 MF=1
        row 9 Fragment Offset=16
        row 63 Original Internet Header Length=6
        row 64 Original IP Total Length=26
        row 65 IPinIP Protocol=61
        row 69 Original Dest Address=192.168.0.2
        row 70 Original Src Address=10.0.0.1
    )"));
    EXPECT_EQ(verdictLine(runs.mv), "verdict -52 flags 0x10\n");
}

TEST(MinimalEncapsulation, everyFieldInEveryPass) {
    const Runs runs = runAll(tunnel(55, hex("37 ff 0a bc 0a 00 00 01 0a 00 00 02") + minimal(253, hex("61"))));
    EXPECT_EQ(fieldLines(runs, 160), expected(R"x(
        640 |5 | "MIPinIP Protocol" "MIPinIP Protocol=MOBILE" 161-168 > 640 "MIPinIP - MOBILE"
        641 |5 | "  Reserved" "  Reserved=7f" 169-175 > 290 "7f"
        642 |5 | "  S" "  S=Original Source Address Present" 176-176 > 642 "Original Source Address Present"
        643 |5 | "Header Checksum" "  Header Checksum=0abc(hex)" 181-184 177-180 189-192 185-188 > 158 "abc"
        646 |5 | "Original Dest Address" "  Original Dest Address=10.0.0.1" 193-224/8 > 637 "10.0.0.1"
        651 |5 | "Original Src Address" "  Original Src Address=10.0.0.2" 225-256/8 > 636 "10.0.0.2"
        640 |6 | "MIPinIP Protocol" "MIPinIP Protocol=" 257-264 > 640 "MIPinIP - "
        641 |6 | "  Reserved" "  Reserved=0" 265-271 > 290 "0"
        642 |6 | "  S" "  S=Original Source Address NOT Present" 272-272 > 642 "Original Source Address NOT Present"
        643 |6 | "Header Checksum" "  Header Checksum=0000(hex)" 277-280 273-276 285-288 281-284 > 158 "0"
        646 |6 | "Original Dest Address" "  Original Dest Address=10.0.0.1" 289-320/8 > 637 "10.0.0.1"
        285 |7 | "Unknown Protocol Data" "Unknown Protocol Data=61" 321-328 > 285 "61"
    )x"));
    EXPECT_EQ(linesFrom(lines(runs.xtr), "row 68"),
              "row 68 MIPinIP Protocol=253\nrow 69 Original Dest Address=10.0.0.1\n"
              "row 70 Original Src Address=10.0.0.2\n");
    EXPECT_EQ(verdictLine(runs.mv), "verdict 0 flags 0x0\n");
}

// The first field that each protocol leads to. A tunnel carries only some of the protocols of the outer header.
TEST(Tunnels, dispatch) {
    const std::vector<std::tuple<std::uint8_t, std::uint32_t, std::uint32_t>> cases = {
        {1, 531, 535},  {4, 629, 629},  {6, 384, 384},  {17, 479, 479},  {41, 285, 285},
        {47, 692, 285}, {55, 640, 640}, {58, 285, 285}, {132, 285, 285}, {0, 285, 285}};
    for (const auto &[protocol, inIp, inMinimal] : cases) {
        SCOPED_TRACE(int{protocol});
        // A fragment offset does not make the payload unknown data here.
        const Octets fragment = ipv4({.protocol = protocol, .payload = hex("00*20"), .fragment = 1});
        EXPECT_EQ(runAll(tunnel(4, fragment)).md.fields[36].id, inIp);
        EXPECT_EQ(runAll(tunnel(55, minimal(protocol, hex("00*20")))).md.fields[23].id, inMinimal);
    }
    // The protocol of the outermost header counts, also with another tunnel between.
    const Octets message = hex("08 00*7");
    const auto type = [](const Octets &packet) { return linesWith(lines(runAll(packet).to), "531"); };
    EXPECT_EQ(type(tunnel(4, tunnel(55, minimal(1, message)))), "531 \"IPinIP - ICMP - EM (8)\"\n");
    EXPECT_EQ(type(tunnel(55, minimal(4, tunnel(1, message)))), "531 \"MIPinIP - ICMP - EM (8)\"\n");
}

TEST(Tunnels, lengthsOfHeadersAndPayload) {
    const Octets three = hex("61 62 63");
    const auto inner = [&](std::uint8_t words, std::uint16_t length) {
        return ipv4({.payload = three, .totalLength = length, .headerWords = words});
    };
    const Octets withOptions = ipv4({.protocol = 55, .payload = minimal(253, three), .options = hex("01 01 01 00")});
    expectValues(
        637, {
                 {"inner length below its header", tunnel(4, inner(5, 19)), "", 0, 0x10},
                 {"inner length of the header", tunnel(4, inner(5, 20)), "", 0, 0x10},
                 {"inner length above what there is", tunnel(4, inner(5, 99)), "285=61 285=62 285=63", 0, 2},
                 {"short inner header", tunnel(4, inner(4, 22)), "285=61 285=62 285=63", 0, 2},
                 {"inner options beyond the end", tunnel(4, inner(15, 99)), "", 0, 0x10},
                 {"options of the outer header only",
                  ipv4({.protocol = 4, .payload = inner(5, 23), .options = hex("00*4")}), "285=61 285=62 285=63", 0, 0},
                 {"options of a tunnel before minimal encapsulation", tunnel(4, withOptions),
                  "318=1 318=1 318=1 381=0 640=fd 641=0 642=0 643=0 646=a000001 285=61 285=62 285=63", 0, 0},
             });
    expectValues(646, {
                          {"no options after minimal encapsulation", withOptions, "285=61 285=62 285=63", 0, 0},
                          {"source address announced, but missing", tunnel(55, hex("fd 80 00 00 0a 00 00 01 61 62")),
                           "", 0, 0x10},
                      });
}

// As deep as 65535 octets go, with a datagram innermost, and with nothing.
TEST(Tunnels, deepestOnASmallStack) {
    for (const bool datagram : {true, false}) {
        const Octets bottom = datagram ? udp(53, 40000, hex("61*8")) : Octets{};
        const std::uint8_t last = datagram ? 17 : 253;
        for (const std::size_t octets : {std::size_t{8}, std::size_t{20}}) {
            SCOPED_TRACE(std::to_string(octets) + " octets a level");
            const std::size_t levels = (65535 - 20 - bottom.size()) / octets;
            const std::uint8_t protocol = octets == 8 ? 55 : 4;
            Octets payload;
            for (std::size_t level = 1; level <= levels; ++level) {
                const std::uint8_t next = level == levels ? last : protocol;
                const std::size_t left = bottom.size() + octets * (levels - level);
                payload =
                    std::move(payload) +
                    (octets == 8 ? minimal(next, {})
                                 : ipv4({.protocol = next, .totalLength = static_cast<std::uint16_t>(20 + left)}));
            }
            const Octets packet = tunnel(protocol, payload + bottom);
            onSmallStack([&] {
                const Runs runs = runAll(packet);
                EXPECT_EQ(runs.md.fields.size(), 18 + levels * (octets == 8 ? 5 : 18) + (datagram ? 5 : 0));
                EXPECT_EQ(runs.mv.flags, 0u);
                EXPECT_EQ(runs.md.bitsLeft, 0u);
                if (datagram) {
                    EXPECT_EQ(runs.md.handOffs[0].blockDepth, levels + 8);
                    EXPECT_EQ(runs.md.handOffs[0].nextLayerOctets, 8u);
                    EXPECT_EQ(runs.md.handOffs[0].precedingOctets, 28u);
                }
            });
        }
    }
}

} // namespace
} // namespace netfloor::test
