// SPDX-License-Identifier: MIT
// ICMP messages (RFC 792, 950, 1256).
#include <algorithm>
#include <sstream>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "support/listings.h"

namespace netfloor::test {
namespace {

Octets icmp(const Octets &message) {
    return ipv4({.protocol = 1, .payload = message});
}

// Of an IPv4 header without options, which an error message quotes.
const Octets &quotedHeader() {
    static const Octets header = hex("45 00 00 54 12 34 40 00 40 11 00 00 0a 00 00 01 c0 a8 00 02");
    return header;
}

TEST(Icmp, everyFieldOfEachMessage) {
    struct MessageCase {
        Octets message;
        std::string keys;  // but for the type
        const char *lines; // after the type
    };
    const std::vector<MessageCase> cases = {
        {hex("08 00 ab cd 00 0a 00 64 41 00"), "row 36 Code=0\nrow 37 ICMP Sequence Number=100\n", R"(
            542 |6 | "Code" "Code=0" 169-176 > 542 "0"
            543 |6 | "Checksum" "  Checksum=abcd" 177-192/8 > 543 "abcd"
            544 |6 | "Identifier" "  Identifier=a" 193-208/8 > 544 "a"
            545 |6 | "ICMP Sequence Number" "  ICMP Sequence Number=100" 209-224/8 > 545 "100"
            547 |6 | "  Message Data" "  Message Data=A" 225-232 > 547 "A"
            547 |6 | "  Message Data" "  Message Data=" 233-240 > 547 ""
        )"},
        {hex("0e 00 00 01 00 02 ff ff 00 00 00 0a 80 00 00 00 00 12 34 56"),
         "row 36 Code=0\nrow 37 ICMP Sequence Number=65535\n", R"(
            576 |6 | "Code" "Code=0" 169-176 > 542 "0"
            577 |6 | "Checksum" "  Checksum=1" 177-192/8 > 543 "1"
            578 |6 | "Identifier" "  Identifier=2" 193-208/8 > 544 "2"
            579 |6 | "ICMP Sequence Number" "  ICMP Sequence Number=65535" 209-224/8 > 545 "65535"
            580 |6 | "Originate Timestamp" "  Originate Timestamp=a" 225-256/8 > 580 "a"
            581 |6 | "Receive Timestamp" "  Receive Timestamp=80000000" 257-288/8 > 581 "80000000"
            582 |6 | "Transmit Timestamp" "  Transmit Timestamp=123456" 289-320/8 > 582 "123456"
        )"},
        {hex("0f 00 00 01 00 02 00 03"), "row 36 Code=0\nrow 37 ICMP Sequence Number=3\n", R"(
            583 |6 | "Code" "Code=0" 169-176 > 542 "0"
            584 |6 | "Checksum" "  Checksum=1" 177-192/8 > 543 "1"
            585 |6 | "Identifier" "  Identifier=2" 193-208/8 > 544 "2"
            586 |6 | "ICMP Sequence Number" "  ICMP Sequence Number=3" 209-224/8 > 545 "3"
        )"},
        // Entries take 8 octets, also where the message gives another size.
        {hex("09 00 00 01 02 04 07 08 0a 00 00 01 00 00 00 05 0a 00 00 02 80 00 00 00"), "row 36 Code=0\n", R"(
            587 |6 | "Code" "Code=0" 169-176 > 542 "0"
            588 |6 | "Checksum" "  Checksum=1" 177-192/8 > 543 "1"
            589 |6 | "Num Addr" "  Num Addr=2" 193-200 > 589 "2"
            590 |6 | "Addr Entry Size" "  Addr Entry Size=4" 201-208 > 590 "4"
            591 |6 | "Lifetime" "  Lifetime=708" 209-224/8 > 591 "708"
            595 |7 | "Router Address" "  Router Address=a000001" 225-256/8 > 595 "a000001"
            596 |7 | "Preference Level" "  Preference Level=5" 257-288/8 > 596 "5"
            595 |7 | "Router Address" "  Router Address=a000002" 289-320/8 > 595 "a000002"
            596 |7 | "Preference Level" "  Preference Level=80000000" 321-352/8 > 596 "80000000"
        )"},
        {hex("0a 00 00 01 00 00 00 1f"), "row 36 Code=0\n", R"(
            597 |6 | "Code" "Code=0" 169-176 > 542 "0"
            598 |6 | "Checksum" "  Checksum=1" 177-192/8 > 543 "1"
            599 |6 | "Reserved" "  Reserved=1f" 193-224/8 > 290 "1f"
        )"},
        {hex("12 00 00 01 00 02 00 03 ff ff ff 00"),
         "row 36 Code=0\nrow 37 ICMP Sequence Number=3\nrow 38 Address Mask=255.255.255.0\n", R"(
            600 |6 | "Code" "Code=0" 169-176 > 542 "0"
            601 |6 | "Checksum" "  Checksum=1" 177-192/8 > 543 "1"
            602 |6 | "Identifier" "  Identifier=2" 193-208/8 > 544 "2"
            603 |6 | "ICMP Sequence Number" "  ICMP Sequence Number=3" 209-224/8 > 545 "3"
            604 |6 | "Address Mask" "  Address Mask=ffffff00" 225-256/8 > 604 "ffffff00"
        )"},
        {hex("02 0a ff"), "", R"(
            541 |7 | "ICMP Reserved Data" "ICMP Reserved Data=a" 169-176 > 541 "a"
            541 |7 | "ICMP Reserved Data" "ICMP Reserved Data=ff" 177-184 > 541 "ff"
        )"},
    };
    for (const MessageCase &one : cases) {
        const Runs runs = runAll(icmp(one.message));
        EXPECT_EQ(fieldLines(runs, 537), expected(one.lines));
        const std::string keys = linesFrom(lines(runs.xtr), "row 9");
        EXPECT_EQ(keys.substr(keys.find('\n') + 1),
                  one.keys + "row 77 ICMP Message Type=" + std::to_string(one.message[0]) + '\n');
        EXPECT_EQ(verdictLine(runs.mv), "verdict 0 flags 0x0\n");
    }
}

TEST(Icmp, everyFieldOfEachErrorMessage) {
    struct ErrorCase {
        const char *head;
        const char *lines; // after the type, without the quoted header
    };
    const std::vector<ErrorCase> cases = {
        {"03 03 00 0a 00 00 00 01", R"(
            548 |6 Destination Unreachable Message| "Code" "  Code=Port unreachable" 169-176 > 542 "Port unreachable"
            549 |6 Destination Unreachable Message| "Checksum" "  Checksum=a" 177-192/8 > 543 "a"
            550 |6 Destination Unreachable Message| "Unused" "  Unused=1" 193-224/8 > 550 "1"
            551 |6 Destination Unreachable Message| "64-bit Original Data Datagram" "  64-bit Original Data Datagram=123a0bcff" 385-448/8 > 551 "b0cff"
            555 |6 Destination Unreachable Message| "" "" 481-488 473-480 465-472 457-464 449-456 > 555 "e4e3e2e1"
        )"},
        {"04 00 00 0a 00 00 00 01", R"(
            556 |6 Source Quench Message| "Code" "Code=0" 169-176 > 542 "0"
            557 |6 Source Quench Message| "Checksum" "  Checksum=a" 177-192/8 > 543 "a"
            558 |6 Source Quench Message| "Unused" "  Unused=1" 193-224/8 > 550 "1"
            559 |6 Source Quench Message| "64-bit Original Data Datagram" "  64-bit Original Data Datagram=123a0bcff" 385-448/8 > 551 "b0cff"
        )"},
        {"05 01 00 0a 0a 00 ff 01", R"(
            560 |6 Redirect Message| "Code" "  Code=Redirect datagram for the host" 169-176 > 542 "Redirect datagram for the host"
            561 |6 Redirect Message| "Checksum" "  Checksum=a" 177-192/8 > 543 "a"
            564 |6 Redirect Message| "Gateway Internet Address" "  Gateway Internet Address=10.0.255.1" 193-224/8 > 564 "10.0.255.1"
            566 |6 Redirect Message| "64-bit Original Data Datagram" "  64-bit Original Data Datagram=123a0bcff" 385-448/8 > 551 "b0cff"
        )"},
        {"0b 00 00 0a 00 00 00 01", R"(
            567 |6 Time Exceeded Message| "Code" "  Code=Time to live exceeded in transmit" 169-176 > 542 "Time to live exceeded in transmit"
            568 |6 Time Exceeded Message| "Checksum" "  Checksum=a" 177-192/8 > 543 "a"
            569 |6 Time Exceeded Message| "Unused" "  Unused=1" 193-224/8 > 550 "1"
            570 |6 Time Exceeded Message| "64-bit Original Data Datagram" "  64-bit Original Data Datagram=123a0bcff" 385-448/8 > 551 "b0cff"
        )"},
        {"0c 00 00 0a 14 00 00 01", R"(
            571 |6 Parameter Problem Message| "Code" "  Code=Pointer Indicates the error" 169-176 > 542 "Pointer Indicates the error"
            572 |6 Parameter Problem Message| "Checksum" "  Checksum=a" 177-192/8 > 543 "a"
            573 |6 Parameter Problem Message| "Pointer" "  Pointer=14" 193-200 > 333 "14"
            574 |6 Parameter Problem Message| "Unused" "  Unused=1" 201-224/8 > 550 "1"
            575 |6 Parameter Problem Message| "64-bit Original Data Datagram" "  64-bit Original Data Datagram=123a0bcff" 385-448/8 > 551 "b0cff"
        )"},
    };
    for (const ErrorCase &one : cases) {
        // Eight octets of the datagram and five more, which only the first message takes, last octet first.
        const Octets head = hex(one.head);
        const Runs runs = runAll(icmp(head + quotedHeader() + hex("01 02 03 0a 00 0b 0c ff e1 e2 e3 e4 e5")));
        std::istringstream all(fieldLines(runs, 537));
        std::string ofMessage;
        for (std::string line; std::getline(all, line);) {
            ofMessage += line.find(" |6 ") == std::string::npos ? "" : line + '\n';
        }
        EXPECT_EQ(ofMessage, expected(one.lines));
        EXPECT_NE(lines(runs.xtr).find("row 36 Code=" + std::to_string(head[1]) + "\nrow 48 "), std::string::npos);
        EXPECT_EQ(runs.md.flags, 0u);
        EXPECT_EQ(runs.mv.flags, head[0] == 3 ? 0u : 0x10u);
    }
}

// Messages that have one code only: with another one, or none, they are not read.
TEST(Icmp, messagesWithCodeZeroOnly) {
    for (const std::uint8_t type : hex("00 04 08 09 0a 0d 0e 0f 10 11 12")) {
        SCOPED_TRACE(int{type});
        const Runs otherCode = runAll(icmp(Octets{type} + hex("01 00*30")));
        EXPECT_EQ(fieldLines(otherCode, 537), "");
        EXPECT_EQ(otherCode.md.flags, 2u);
        EXPECT_EQ(otherCode.mv.flags, 0x12u);
        const Runs noCode = runAll(icmp({type}));
        EXPECT_EQ(noCode.md.flags, 2u);
        EXPECT_EQ(noCode.mv.flags, 2u);
        const Runs whole = runAll(icmp(Octets{type} + hex("00*7")));
        EXPECT_TRUE(fieldValues(whole.md, 537).find("=0 ") != std::string::npos);
        EXPECT_EQ(whole.md.flags, 0u);
    }
    EXPECT_EQ(runAll(icmp(hex("03"))).mv.flags, 0u); // has other codes
}

struct CountCase {
    const char *name;
    Octets packet;
    const char *id;
    std::ptrdiff_t fields; // of this id
    std::uint32_t flagsOfMv;
};

Octets inTunnel(std::uint16_t innerLength, const Octets &message) {
    return ipv4({.protocol = 4, .payload = ipv4({.protocol = 1, .payload = message, .totalLength = innerLength})});
}

TEST(Icmp, countsOfOctetsAndEntries) {
    const Octets echo = hex("08 00 00 00 00 01 00 02");
    const Octets advertisement = hex("09 00 00 00 03 02 00 00");
    const Octets error = hex("0b 00 00 00 00 00 00 00") + quotedHeader();
    const std::vector<CountCase> cases = {
        {"echo without data", icmp(echo), "547", 0, 0},
        {"echo with less data than the header length leaves",
         ipv4({.protocol = 1, .payload = echo + hex("41 42"), .headerWords = 4}), "547", 2, 0},
        {"echo in a shorter datagram", inTunnel(24, echo), "547", 0, 2},
        {"the same with data", inTunnel(24, echo + hex("41")), "547", 0, 0x12},
        {"echo in a datagram that ends in its data", inTunnel(29, echo + hex("41 42")), "547", 1, 0x10},
        {"other type in a shorter datagram", inTunnel(20, hex("02 01")), "541", 0, 0x12},
        {"other type with less data than the header length leaves",
         ipv4({.protocol = 1, .payload = hex("02 01"), .headerWords = 4}), "541", 1, 0},
        {"no router", icmp(hex("09 00 00 00 00 02 00 00")), "595", 0, 0},
        {"cut after the first of three routers", icmp(advertisement + hex("01*8")), "595", 1, 2},
        {"cut inside the second router", icmp(advertisement + hex("01*12")), "595", 2, 2},
        {"cut after the second router", icmp(advertisement + hex("01*16")), "595", 2, 0},
        {"cut inside the third router", icmp(advertisement + hex("01*20")), "595", 3, 0},
        {"more than the routers", icmp(advertisement + hex("01*25")), "595", 3, 0x10},
        {"seven octets of the datagram", icmp(error + hex("61*7")), "570", 0, 0x10},
        {"eight octets of the datagram", icmp(error + hex("61*8")), "570", 1, 0},
        {"none after the datagram", icmp(hex("03 01 00*6") + quotedHeader() + hex("61*8")), "555", 0, 0},
    };
    for (const CountCase &one : cases) {
        SCOPED_TRACE(one.name);
        const Runs runs = runAll(one.packet);
        EXPECT_EQ(std::ranges::count(linesWith(lines(runs.md), one.id), '\n'), one.fields);
        EXPECT_EQ(runs.md.flags, 0u);
        EXPECT_EQ(runs.mv.flags, one.flagsOfMv);
    }
}

// The length in a tunnel's header is no limit: where it has no room for the type, the count of octets is wrong.
TEST(Icmp, lengthOfTheTunnelAndAReservedType) {
    for (const std::uint16_t octets : {std::uint16_t{20}, std::uint16_t{21}}) {
        const Octets inner = ipv4({.protocol = 1, .payload = hex("2a 01 02"), .totalLength = octets});
        const Runs runs = runAll(ipv4({.protocol = 4, .payload = inner}));
        EXPECT_EQ((runs.mv.flags & NETFLOOR_FLAG_EXPECTATION) != 0, octets == 20) << octets;
    }
}

} // namespace
} // namespace netfloor::test
