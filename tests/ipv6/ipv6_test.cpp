// SPDX-License-Identifier: MIT
// IPv6 (RFC 8200): the header, the chain of extension headers, and the options.
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "ipv6/ipv6_reports.h"
#include "support/memory.h"

namespace netfloor::test {
namespace {

constexpr const char *thirdAddress = "20 01 0d b8 00*11 03";

TEST(Ipv6Header, everyFieldInEveryPass) {
    const Runs runs = runAll(hex(R"(
        6a bc de f0              # version, traffic class ab, flow label cdef0
        00 00 fd 40              # no payload, a protocol without a name, hop limit
        20 01 0d b8 00*11 01     # 2001:db8::1
        fe 80 00*13 9c           # fe80::9c
    )"));
    EXPECT_EQ(lines(runs.md), expected(R"(
        150 |2 Ip Header| "Version" "Version=6" 5-8
        166 |3 IPv6 Header| "Traffic Class" "Traffic Class=171" 1-4 13-16
        167 |3 IPv6 Header| "Flow Label" "Flow Label=843504" 9-12 17-32/8
        168 |3 IPv6 Header| "Payload Length" "Payload Length=0 octets" 33-48/8
        171 |4 IPv6 Body| "Payload Length" "Payload Length=0 octets" 33-48/8
        220 |5 Next Header| "Next Header" "Next Header=" 49-56
        172 |4 IPv6 Body| "Hop Limit" "Hop Limit=64" 57-64
        956 |5 IP Address| "Source IP Address" "Source IP Address=210.d08b.0.0.0.0.0.10" 65-192
        958 |5 IP Address| "Source IP Address" "" 65-192/4
        952 |5 IP Address| "Destination IP Address" "Destination IP Address=ef08.0.0.0.0.0.0.c9" 193-320
        954 |5 IP Address| "Destination IP Address" "" 193-320/4
    )"));
    EXPECT_EQ(oneLine(lines(runs.to)),
              R"(150 "6"; 166 "171"; 167 "843504"; 168 "0 octets"; 168 "0 octets"; 220 ""; 172 "64"; )"
              R"(956 "210.d08b.0.0.0.0.0.10"; 956 ""; 952 "ef08.0.0.0.0.0.0.c9"; 952 "")");
    EXPECT_EQ(lines(runs.xtr), expected(R"(
        row 0 Version=6
        row 96 Payload Length=0
        row 97 Source IP Address=2001:db8::1
        row 98 Destination IP Address=fe80::9c
        row 99 Next Header=253
    )"));
    EXPECT_EQ(runs.xtr.key("Source IP Address")->octets, hex("02 10 d0 8b 00*11 10")); // nibbles exchanged
    EXPECT_EQ(verdictLine(runs.mv), "verdict 0 flags 0x0\n");
    EXPECT_EQ(layerLines(runs.md), "layer 1 of 1: 1-320\n");
    EXPECT_EQ(runs.md.fields[8].value, 0x10u); // the last eight of 32 nibbles
}

struct LengthCase {
    std::uint16_t payloadLength;
    std::size_t present; // octets after the header
    std::size_t fields;
    std::uint32_t mvFlags, bitsLeft;
};

TEST(Ipv6Header, payloadLengthLimitsTheDatagram) {
    for (const LengthCase &one : std::vector<LengthCase>{
             {8, 8, 19, 0, 0},
             {8, 10, 19, 0, 16},
             {0, 3, 11, 0, 24},  // no payload with any Next Header
             {8, 7, 18, 0xa, 0}, // one or two octets short: read to its end
             {8, 6, 17, 0xa, 0},
             {8, 5, 4, 0, 328}, // more than that: left unread
             {1, 0, 11, 0xa, 0},
             {65535, 8, 4, 0, 352},
         }) {
        SCOPED_TRACE(std::to_string(one.payloadLength) + ", there: " + std::to_string(one.present));
        Octets packet = ipv6({.nextHeader = 59, .payloadLength = one.payloadLength});
        packet.resize(40 + one.present, 0x61);
        const Runs runs = runAll(packet);
        EXPECT_EQ(runs.md.fields.size(), one.fields);
        EXPECT_EQ(runs.mv.flags, one.mvFlags);
        EXPECT_EQ(runs.md.bitsLeft, one.bitsLeft);
    }
    // An address that the packet cuts is not read from the octets past its end.
    const Runs runs = runAll(shortened(ipv6({}), 39));
    EXPECT_EQ(runs.mv.flags, 0x18u);
    EXPECT_EQ(linesWith(lines(runs.md), "954"), "");
}

// One header after another.
TEST(Ipv6Chain, everyFieldInEveryPass) {
    const Runs runs = runAll(ipv6({.nextHeader = 0, .payload = hex(R"(
        2b 00  01 04 12 34 00 00                                   # hop by hop: PadN
        3c 02 00 01 00 00 00 00  20 01 0d b8 00*11 03              # routing, type 0, one address
        2c 00  05 04 0a bb cc dd                                   # destination options: one to skip
        33 00 03 21 01 02 03 04                                    # fragment: offset 100, more to come
        32 02 00 00  00 00 01 02  00 00 00 03  a0 a1 a2 a3         # authentication
        01 02 03 04  00 00 00 05  ee ff                            # encapsulating security payload
    )")}));
    EXPECT_EQ(linesFrom(lines(runs.md), "954"), expected(R"x(
        954 |5 IP Address| "Destination IP Address" "" 193-320/4
        220 |7 Next Header| "Next Header" "Next Header=IPv6-Route" 321-328
        222 |7 Header Extention Length| "Header Extention length" "Header Extention length=0*8 octet(s)" 329-336
        223 |7 Options| "Option type" "Option type=1"
        226 |8 PadN Option| "Option Type" " Option Type=PadN option" 337-344
        227 |8 PadN Option| "Option Length" "Option Length=4 Octetc(s)" 345-352
        229 |8 PadN Option| "Padding Data" "Padding Data=21430000 (Hex)" 353-384/4
        177 |10 Ipv6 Routing Header| "Routing Type" "Routing Type=0"
        220 |12 Next Header| "Next Header" "Next Header=IPv6-Opts" 385-392
        222 |12 Header Extention Length| "Header Extention length" "Header Extention length=2*8 octet(s)" 393-400
        180 |11 Type 0 Routing Header| "Routing Type" "Routing Type=0" 401-408
        181 |11 Type 0 Routing Header| "Sgmt Left" "Sgmt Left=1" 409-416
        182 |11 Type 0 Routing Header| "Reserved" "Reserved=0000" 417-448/8
        948 |12 IP Address| "IP Address" "IP Address=210.d08b.0.0.0.0.0.30" 449-576
        950 |12 IP Address| "IP Address" "" 449-576/4
        220 |14 Next Header| "Next Header" "Next Header=IPv6-Frag" 577-584
        222 |14 Header Extention Length| "Header Extention length" "Header Extention length=0*8 octet(s)" 585-592
        223 |14 Options| "Option type" "Option type=5"
        235 |15 Unknown Option| "highest-order 2 bits" "highest-order 2 bits=0"
        238 |16 | "Option Type" " Option Type=Unknown" 593-600
        239 |16 | "Opt Data Length" " Opt Data Length=4 Octet(s)" 601-608
        240 |16 | "Skip" "Skip=a" 609-616
        240 |16 | "Skip" "Skip=bb" 617-624
        240 |16 | "Skip" "Skip=cc" 625-632
        240 |16 | "Skip" "Skip=dd" 633-640
        220 |19 Next Header| "Next Header" "Next Header=AH" 641-648
        197 |18 IPv6 Fragment Header| "Reserved" "Reserved=0" 649-656
        198 |18 IPv6 Fragment Header| "fragment Offset" " fragment Offset=100*8 octet(s)" 657-664 668-672
        199 |18 IPv6 Fragment Header| "Res" "Res=0" 666-667
        200 |18 IPv6 Fragment Header| "M Flag" "M Flag=more fragment" 665-665
        201 |18 IPv6 Fragment Header| "Identification" "Identification=4321" 697-704 689-696 681-688 673-680
        220 |21 Next Header| "Next Header" "Next Header=ESP" 705-712
        206 |20 IP Authentication Header| "Payload Length" "Payload Length=2*4 octets" 713-720
        207 |20 IP Authentication Header| "reserved" "reserved=0" 721-728
        207 |20 IP Authentication Header| "reserved" "reserved=0" 729-736
        208 |20 IP Authentication Header| "SPI" " SPI=33619968" 761-768 753-760 745-752 737-744
        209 |20 IP Authentication Header| "Sequency Number" " Sequency Number=50331648" 793-800 785-792 777-784 769-776
        211 |20 IP Authentication Header| "Authentication Data" "Authentication Data=a0" 801-808
        211 |20 IP Authentication Header| "Authentication Data" "Authentication Data=a1" 809-816
        211 |20 IP Authentication Header| "Authentication Data" "Authentication Data=a2" 817-824
        211 |20 IP Authentication Header| "Authentication Data" "Authentication Data=a3" 825-832
        215 |22 | "SPI" " SPI=67305985" 857-864 849-856 841-848 833-840
        216 |22 | "Sequence Number" " Sequence Number=83886080" 889-896 881-888 873-880 865-872
        218 |22 | "Encrypted Data" "Encrypted Data=ee" 897-904
        218 |22 | "Encrypted Data" "Encrypted Data=ff" 905-912
    )x"));
    EXPECT_EQ(
        oneLine(linesFrom(lines(runs.to), "222")),
        R"x(222 "0*8 octet(s)"; 223 "1"; 232 "1"; 227 "4 Octetc(s)"; 229 "21430000 (Hex)"; 177 "0"; )x"
        R"x(220 "IPv6-Opts"; 222 "2*8 octet(s)"; 177 "0"; 181 "1"; 290 "0000"; 856 "210.d08b.0.0.0.0.0.30"; )x"
        R"x(856 ""; 220 "IPv6-Frag"; 222 "0*8 octet(s)"; 223 "5"; 235 "0"; 232 "5"; 239 "4"; 240 "a"; 240 "bb"; )x"
        R"x(240 "cc"; 240 "dd"; 220 "AH"; 290 "0"; 198 "100*8 octet(s)"; 199 "0"; 200 "more fragment"; )x"
        R"x(156 "4321"; 220 "ESP"; 168 "2*4 octets"; 207 "0"; 207 "0"; 215 "33619968"; 209 "50331648"; )x"
        R"x(211 "a0"; 211 "a1"; 211 "a2"; 211 "a3"; 215 "67305985"; 394 "83886080"; 218 "ee"; 218 "ff")x");
    EXPECT_EQ(linesFrom(lines(runs.xtr), "row 96"), expected(R"(
        row 96 Payload Length=74
        row 97 Source IP Address=2001:db8::1
        row 98 Destination IP Address=2001:db8::2
        row 99 Next Header=50
        row 100 IP Address=2001:db8::3
        row 101 fragment Offset=100
        row 102 M Flag=1
        row 104 Sequence Number=83886080
        row 105 SPI=67305985
        row 106 Sequency Number=50331648
        row 107 Header Extention length=0
        row 110 Option Type=5
        row 111 Opt Data Length=4
    )"));
    EXPECT_EQ(runs.mv.flags, 0u);
}

TEST(Ipv6Chain, headers) {
    const Octets address = hex(thirdAddress);
    const std::string ah = "220 206 207 207 208 209";
    const std::vector<Ipv6Case> cases = {
        {"no next header", 59, hex("61 62 63"), "285 285 285"},
        {"IPv4 is not followed", 4, ipv4({.payload = {}}),
         "285 285 285 285 285 285 285 285 285 285 "
         "285 285 285 285 285 285 285 285 285 285"},
        {"nor minimal encapsulation", 55, hex("11 00"), "285 285"},
        {"ICMP is taken for ICMPv6", 1, hex("82"), "246 247"},
        {"UDP", 17, udp(9, 9), "479 488 489 490"},
        {"a fragment without payload", 44, hex("3b 00 00 00 00*4"), "220 197 198 199 200 201"},
        {"a later fragment is read all the same", 44, hex("11 00 03 20 00*4") + udp(9, 9),
         "220 197 198 199 200 201 479 488 489 490"},
        {"fragment cut after the field of M", 44, hex("3b 00 00"), "220 197", 0x10},
        {"unknown routing with segments left", 43, hex("3b 00 02 01 00*4"), "177 188", 0x10},
        {"unknown routing without segments left", 43, hex("3b 00 02 00 00*4"), "177 188 220 222 193", 0x10},
        {"and longer: the next header is read 4 octets early", 43, hex("3b 01 02 00 00*12 61"),
         "177 188 220 222 193 285", 0x10},
        {"unknown routing cut before its segments", 43, hex("3b 00 02"), "177", 0x10},
        {"routing cut before its type", 43, hex("3b 00"), "", 0x10},
        {"spare longer than the packet", 43, hex("3b 01 02 00 00*7"), "177 188 220 222", 0x10},
        {"an odd length", 43, hex("3b 03 00 00 00*4") + address + hex("00*8"), "177 220 222 180 181 182 948 950", 0x10},
        {"two addresses", 43, hex("3b 04 00 00 00*4") + address + address, "177 220 222 180 181 182 948 950 948 950"},
        {"the second missing", 43, hex("3b 04 00 00 00*4") + address, "177 220 222 180 181 182 948 950"},
        {"no address", 43, hex("3b 00 00 09 00*4 61"), "177 220 222 180 181 182 285"},
        {"ESP shorter than its header", 50, hex("00*7"), "215", 0x12},
        {"ESP with less than was counted", 0, hex("32 00 01 06 00*6  00*8 61*4"),
         "220 222 223 226 227 229 215 216 218 218 218 218", 0x2},
        {"AH of length 0", 51, hex("3b 00 00*10"), ah, 0x2},
        {"AH with twelve octets", 51, hex("3b 04 00*22 61"),
         ah + " 211 211 211 211 211 211 211 211 211 211 211 211 285"},
        {"AH cut between the reserved octets", 51, hex("3b 04 00"), "220 206 207", 0x2},
        {"AH cut in its data", 51, hex("3b 02 00*13"), ah + " 211 211 211", 0x2},
        {"Pad1 and no more", 0, hex("3b 00 00*6"), "220 222 223 232", 0x10},
        {"the next header is read after Pad1", 0, hex("3c 00 00  3b 00 01 02 00 00  00*7"),
         "220 222 223 232 220 222 223 226 227 229", 0x10},
        {"PadN of no octet", 60, hex("3b 00 01 00 00*4"), "220 222 223 226 227 229", 0x10},
        {"PadN longer than the packet", 60, hex("3b 00 01 05 00*4"), "220 222 223 226 227", 0x10},
        {"an option to skip, and the chain", 60, hex("3b 00 3f 04 00*4 61"),
         "220 222 223 235 238 239 240 240 240 240 285"},
        {"one to skip that is longer", 60, hex("3b 00 05 08 00*4"), "220 222 223 235 238 239 240 240 240 240", 0x2},
        {"an option to discard for", 60, hex("3b 00 45 02 61 62 00 00  63 64"), "220 222 223 235 243 285 285", 0x10},
        {"and tell the source", 60, hex("3b 00 c2 02 61 62 00 00"), "220 222 223 235 243", 0x10},
        {"no option", 60, hex("3b 00"), "220 222"},
    };
    for (const Ipv6Case &one : cases) {
        checkCase(one);
    }
    const Runs texts = runAll(ipv6({.nextHeader = 0, .payload = hex("3c 00 00  3c 00 01 00  3b 00 80 61 00*40")}));
    EXPECT_EQ(oneLine(linesWith(shortLines(texts.md), "232") + linesWith(shortLines(texts.md), "229") +
                      linesWith(shortLines(texts.md), "235") + linesWith(shortLines(texts.md), "243")),
              R"x(232 " Option Type=Pad1 option"; 229 "Padding Data= (Hex)"; 235 "highest-order 2 bits=2"; )x"
              R"x(243 "unkown option type, discard packet")x");
    EXPECT_EQ(oneLine(linesWith(lines(texts.to), "243")), R"(243 "128")");
    EXPECT_EQ(texts.md.fields.back().text, "Unknown Protocol Data=0");
    EXPECT_EQ(runAll(ipv6({.nextHeader = 44, .payload = hex("3b 00 00 06 00*4")})).md.field("Res")->value, 3u);
}

TEST(Ipv6Chain, headerInAHeader) {
    const std::string inner = "166 167 168 171 220 172 956 958 952 954";
    const Octets whole = ipv6({.nextHeader = 59, .payload = hex("61 62"), .source = {0xfe, 0x80}});
    const std::vector<Ipv6Case> cases = {
        {"whole", 41, whole, inner + " 285 285"},
        {"octets after it", 41, whole + hex("63"), inner + " 285 285", 0x10},
        {"no payload", 41, ipv6({.nextHeader = 17}), inner},
        {"one octet short", 41, Octets(whole.begin(), whole.end() - 1), inner + " 285", 0xa},
        {"more than two short", 41, ipv6({.payloadLength = 3}), "166 167 168", 0x10},
        {"after a fragment header", 44, hex("29 00 00 00 00*4") + whole,
         "220 197 198 199 200 201 " + inner + " 285 285"},
    };
    for (const Ipv6Case &one : cases) {
        checkCase(one);
    }
    EXPECT_EQ(keyText(*runAll(ipv6({.nextHeader = 41, .payload = whole})).xtr.key("Source IP Address")), "fe80::");
}

Octets times(std::size_t count, const Octets &unit) {
    Octets all;
    for (; count > 0; --count) {
        all.insert(all.end(), unit.begin(), unit.end());
    }
    return all;
}

// The longest packets of headers inside headers.
TEST(Ipv6Chain, deepestOnASmallStack) {
    Octets alternating = ipv6({.nextHeader = 59, .payload = hex("61")});
    Octets tunnels = alternating;
    for (unsigned depth = 0; depth < 1200; ++depth) {
        alternating = ipv6({.nextHeader = 60, .payload = hex("29 00 05 04 00*4") + alternating});
        tunnels = ipv6({.nextHeader = 41, .payload = tunnels});
    }
    const Octets last = hex("61");
    const std::vector<std::pair<Octets, std::size_t>> packets = {
        {ipv6({.nextHeader = 60, .payload = times(8190, hex("3c 00 01 04 00*4")) + last}), 8190 * 6},
        {ipv6({.nextHeader = 60, .payload = times(8190, hex("3c 00 05 04 00*4")) + last}), 8190 * 10},
        {ipv6({.nextHeader = 44, .payload = times(8190, hex("2c 00 00 00 00*4")) + last}), 8190 * 6},
        {ipv6({.nextHeader = 51, .payload = times(5458, hex("33 01 00*10")) + last}), 5458 * 6},
        {ipv6({.nextHeader = 43, .payload = times(8190, hex("2b 00 00*6")) + last}), 8190 * 6},
        {alternating, 1200 * 18},
        {tunnels, 1200 * 10},
    };
    onSmallStack([&] {
        for (const auto &[packet, fields] : packets) {
            const Runs runs = runAll(packet);
            EXPECT_GE(runs.md.fields.size(), ipv6Fields + fields);
            EXPECT_EQ(runs.md.ending, Ending::complete);
            EXPECT_EQ(runs.md.bitsLeft, 0u);
        }
        TestRunOptions options; // room for a chain, but not for this one
        options.state.allowGrowth = [](std::size_t octets) { return octets < 20000; };
        for (const Pass pass : {Pass::md, Pass::to, Pass::mv, Pass::xtr}) {
            const Report report = runPass(pass, alternating, options);
            EXPECT_EQ(report.ending, Ending::cutOff);
            EXPECT_EQ(report.flags, 0x20000000u);
        }
    });
}

} // namespace
} // namespace netfloor::test
