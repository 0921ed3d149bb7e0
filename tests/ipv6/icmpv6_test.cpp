// SPDX-License-Identifier: MIT
// ICMPv6 (RFC 4443), over IPv6 and over IPv4.
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "ipv6/ipv6_reports.h"

namespace netfloor::test {
namespace {

TEST(Icmpv6, everyFieldInEveryPass) {
    const Runs runs = runAll(ipv6({.nextHeader = 58, .payload = hex("01 03 0c 34 00 00 00 00 60 ff")}));
    EXPECT_EQ(linesFrom(lines(runs.md), "246"), expected(R"(
        246 |6  IPv6 - ICMP| "Message Type" "Message Type=Error Message" 328-328
        247 |6  IPv6 - ICMP| "ICMP Message Type" "ICMP Message Type=Destination Unreachable" 321-328
        251 |7 | "Code " "Code =address unreachable" 329-336
        252 |7 | "Checksum " "Checksum =c" 337-344
        252 |7 | "Checksum " "Checksum =34" 345-352
        253 |7 | "Unused" "Unused" 353-384/8
        255 |7 | "Invoking Packet " "Invoking Packet =60" 385-392
        255 |7 | "Invoking Packet " "Invoking Packet =ff" 393-400
    )"));
    EXPECT_EQ(linesFrom(lines(runs.xtr), "row 77"), expected(R"(
        row 77 ICMP Message Type=1
        row 83 Code =3
        row 96 Payload Length=10
        row 97 Source IP Address=2001:db8::1
        row 98 Destination IP Address=2001:db8::2
        row 99 Next Header=58
    )"));
    EXPECT_EQ(runs.mv.flags, 0u);
}

struct Message {
    const char *octets, *md, *to;
};

TEST(Icmpv6, everyMessage) {
    const std::vector<Message> messages = {
        {"01 00 00 0a 01 02 03 04 61",
         R"(251 "Code =no route to destination"; 252 "Checksum =0"; 252 "Checksum =a"; 253 "Unused"; 255 "Invoking Packet =61")",
         R"(246 "Error Message"; 531 "Destination Unreachable"; 251 "no route to destination"; 252 "0"; 252 "a"; 550 "1020304"; 255 "61")"},
        {"02 07 00 0a 00 00 05 00 61",
         R"(256 "Code =7"; 257 "Checksum =0"; 257 "Checksum =a"; 258 "MTU =1280"; 260 "Invoking Packet =61")",
         R"(246 "Error Message"; 531 "Packet Too Big"; 251 "7"; 252 "0"; 252 "a"; 258 "1280"; 255 "61")"},
        {"03 01 00 0a 01 02 03 04 61",
         R"(261 "Code =fragment reassembly time exceeded "; 262 "Checksum =0"; 262 "Checksum =a"; 263 "Unused"; 265 "Invoking Packet =61")",
         R"(246 "Error Message"; 531 "Time Exceeded"; 251 "fragment reassembly time exceeded "; 252 "0"; 252 "a"; 550 "1020304"; 255 "61")"},
        {"04 02 00 0a 00 00 00 2a 61",
         R"(266 "Code =unrecognized IPv6 option encountered "; 267 "Checksum =0"; 267 "Checksum =a"; 268 "Pointer =2a"; 270 "Invoking Packet =61")",
         R"(246 "Error Message"; 531 "Parameter Problem"; 251 "unrecognized IPv6 option encountered "; 252 "0"; 252 "a"; 268 "2a"; 255 "61")"},
        {"80 00 00 0a 12 34 00 2a 61",
         R"(271 "Code =0"; 272 "Checksum =0"; 272 "Checksum =a"; 273 "Identifier =1234"; 274 "Sequence Number =2a"; 276 "Data =61")",
         R"(246 "Informational Message"; 531 "Echo Request"; 251 "0"; 252 "0"; 252 "a"; 273 "1234"; 274 "2a"; 276 "61")"},
        {"81 ff 00 0a 12 34 00 2a 61",
         R"(277 "Code =255"; 278 "Checksum =0"; 278 "Checksum =a"; 279 "Identifier =1234"; 280 "Sequence Number =2a"; 282 "Data =61")",
         R"(246 "Informational Message"; 531 "Echo Reply"; 251 "255"; 252 "0"; 252 "a"; 273 "1234"; 274 "2a"; 276 "61")"},
        {"7f 62", R"(285 "Unknown Protocol Data=62")", R"(246 "Error Message"; 531 "Undefined"; 285 "62")"},
        {"05", "", R"(246 "Error Message"; 531 "Undefined")"},
        {"00", "", R"(246 "Error Message"; 531 "")"},
        {"87", "", R"(246 "Informational Message"; 531 "")"},
    };
    for (const Message &message : messages) {
        SCOPED_TRACE(message.octets);
        for (const Octets &packet : {ipv6({.nextHeader = 58, .payload = hex(message.octets)}),
                                     ipv4({.protocol = 58, .payload = hex(message.octets)})}) {
            const Runs runs = runAll(packet);
            const std::string body = linesFrom(shortLines(runs.md), "247");
            EXPECT_EQ(oneLine(body.substr(body.find('\n') + 1)), message.md);
            EXPECT_EQ(oneLine(linesFrom(lines(runs.to), "246")), message.to);
            EXPECT_EQ(runs.mv.flags, 0u);
        }
    }
}

TEST(Icmpv6, lengths) {
    const std::string echo = "246 247 271 272 272 273 274";
    const std::vector<Ipv6Case> cases = {
        {"no data", 58, hex("80 00 00 00 00*4"), echo},
        {"a type alone", 58, hex("80"), "246 247", 0x2},
        {"cut between the octets of the checksum", 58, hex("80 00 12"), "246 247 271 272", 0x2},
        {"cut in the identifier", 58, hex("80 00 12 34 00"), "246 247 271 272 272", 0x12},
        {"octets of a type that is not known", 58, hex("86 00 00"), "246 247", 0x10},
        {"octets of the first type that is not defined", 58, hex("05 61 61"), "246 247 285 285"},
        {"and of the type after the last one", 58, hex("82 61 61"), "246 247", 0x10},
        // Extension headers that count more, or fewer, octets than their fields cover.
        {"fewer octets counted than the header has", 0, hex("3a 01 01 04 00*4  80 00*7 61 62 63 64"),
         "220 222 223 226 227 229 " + echo, 0x12},
        {"more octets counted than there are", 0, hex("3a 00 01 06 00*6  80 00*7 61"),
         "220 222 223 226 227 229 " + echo + " 276", 0x2},
    };
    for (const Ipv6Case &one : cases) {
        checkCase(one);
    }
}

} // namespace
} // namespace netfloor::test
