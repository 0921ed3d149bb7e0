// SPDX-License-Identifier: MIT
// Generic routing encapsulation (RFC 2784, 2890).
#include <gtest/gtest.h>

#include "support/listings.h"

namespace netfloor::test {
namespace {

Octets gre(const Octets &packet) {
    return ipv4({.protocol = 47, .payload = packet});
}

Octets inTunnel(std::uint16_t innerLength, const Octets &packet) {
    return ipv4({.protocol = 4, .payload = ipv4({.protocol = 47, .payload = packet, .totalLength = innerLength})});
}

TEST(Gre, everyFieldInEveryPass) {
    const Octets packet = gre(hex(R"(
        fa ff 88 0b                           # all of the first bits, reserved bits, version 7, PPP
        0a bc 01 02 00 00 01 00 ff ff ff fe   # checksum, key, sequence number
        7e ff 00 7e 45                        # a frame, and an octet after it
    )"));
    const Runs runs = runAll(packet);
    EXPECT_EQ(fieldLines(runs, 160), expected(R"x(
        692 |5 Generic Routing Encapsulation| "Checksum Present" "Checksum Present=Present" 168-168 > 692 "Present"
        693 |5 Generic Routing Encapsulation| "Unused bit" "Unused bit=1" 167-167 > 693 "1"
        694 |5 Generic Routing Encapsulation| "Key Present" "Key Present=Present" 166-166 > 694 "Present"
        695 |5 Generic Routing Encapsulation| "Sequence Number Present" "Sequence Number Present=Present" 165-165 > 695 "Present"
        696 |5 Generic Routing Encapsulation| "Reserved0" "Reserved0=351" 161-164 172-176 > 696 "351"
        697 |5 Generic Routing Encapsulation| "Version" "Version=7" 169-171 > 150 "7"
        698 |5 Generic Routing Encapsulation| "GRE Protocol" "GRE Protocol=PPP" 177-192/8 > 698 "PPP"
        702 |5 Generic Routing Encapsulation| "CheckSum (hex)" "CheckSum (hex)=abc" 193-208/8 > 702 "abc"
        703 |5 Generic Routing Encapsulation| "Reserved1" "Reserved1=258" 209-224/8 > 703 "258"
        707 |5 Generic Routing Encapsulation| "GRE Key" "GRE Key=256" 225-256/8 > 707 "256"
        711 |5 Generic Routing Encapsulation| "Sequence Number" "Sequence Number=4294967294" 257-288/8 > 394 "4294967294"
        716 |6 HDLC Data| "HDLC Flag" "HDLC Flag=0x7e" 289-296 > 716 "0x7e"
        719 |7 INLINE BLOCK| "HDLC Payload" "HDLC Payload=0xff" 297-304 > 719 "0xff"
        719 |7 INLINE BLOCK| "HDLC Payload" "HDLC Payload=0x0" 305-312 > 719 "0x0"
        724 |7 INLINE BLOCK| "HDLC Flag" "HDLC Flag=0x7e" 313-320 > 716 "0x7e"
        715 |5 Generic Routing Encapsulation| "GRE Payload" "GRE Payload=0x45" 321-328 > 715 "0x45"
    )x"));
    EXPECT_EQ(linesFrom(lines(runs.xtr), "row 71"), expected(R"(
        row 71 Checksum Present=1
        row 72 Key Present=1
        row 73 Sequence Number Present=1
        row 74 GRE Protocol=34827
        row 75 GRE Key=256
        row 104 Sequence Number=4294967294
    )"));
    EXPECT_EQ(verdictLine(runs.mv), "verdict 0 flags 0x0\n");
}

TEST(Gre, framesAndLengths) {
    const Octets head = hex("00 00 08 00");
    expectValues(
        698,
        {
            {"nothing after the header", gre(head), "", 2, 2},
            {"no frame", gre(head + hex("45 00 7e")), "715=45 715=0 715=7e", 2, 2},
            {"a frame", gre(head + hex("7e 01 02 7e")), "716=7e 719=1 719=2 724=7e", 0, 0},
            {"an empty frame", gre(head + hex("7e 7e")), "716=7e 724=7e", 0, 0},
            {"octets after the frame", gre(head + hex("7e 01 7e 7e 55")), "716=7e 719=1 724=7e 715=7e 715=55", 0, 0},
            {"a frame without an end", gre(head + hex("7e 01")), "716=7e 719=1", 0, 0},
            {"a frame of its flag alone", gre(head + hex("7e")), "716=7e", 0, 0},
            {"key only", gre(hex("20 00 08 00 00 00 00 07 7e")), "707=7 716=7e", 0, 0},
            {"sequence number only", gre(hex("10 00 08 00 00 00 00 07 7e")), "711=7 716=7e", 0, 0},
            {"half a checksum", gre(hex("b0 00 08 00 12 34")), "702=1234", 0, 2},
            {"half a key", gre(hex("a0 00 08 00 12 34 00 00 61")), "702=1234 703=0", 0, 0x12},
            // The length of the payload differs from that of the limit.
            {"frame ends before the payload's end",
             ipv4({.protocol = 47, .payload = head + hex("7e 01"), .headerWords = 4}), "716=7e 719=1", 2, 2},
            {"payload ends before the frame's end", inTunnel(26, head + hex("7e 01 02 7e")), "716=7e 719=1", 0, 0x10},
            {"payload ends before the frame", inTunnel(24, head + hex("7e 01")), "716=7e", 0, 0x10},
            {"payload ends after the frame", inTunnel(28, head + hex("7e 01 7e 55 56")), "716=7e 719=1 724=7e 715=55",
             0, 0x10},
            {"payload ends inside the header", inTunnel(22, head + hex("45")), "", 2, 0x12},
        });
}

} // namespace
} // namespace netfloor::test
