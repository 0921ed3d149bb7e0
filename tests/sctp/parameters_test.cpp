// SPDX-License-Identifier: MIT
// The parameters of INIT and INIT ACK (RFC 9260, 3.3.2 and 3.3.3).
#include <vector>

#include <gtest/gtest.h>

#include "sctp/sctp_packets.h"

namespace netfloor::test {
namespace {

// Tag, window, streams out and in, TSN. The first parameter starts at bit 417.
constexpr const char *fixedFields = "00 00 00 ff  00 01 90 00  00 0a 00 0b  80 00 00 00";

Octets init(const Octets &parameters) {
    return chunk(1, hex(fixedFields) + parameters);
}

Octets initAck(const Octets &parameters) {
    return chunk(2, hex(fixedFields) + parameters);
}

constexpr const char *initIds = "802 823 824 825 826 827 828 829";
constexpr const char *initAckIds = "802 835 836 837 838 839 840 841";

TEST(SctpInit, everyParameterInEveryPass) {
    const Runs runs = runAll(sctp(init(hex(R"(
        00 05 00 08  0a 00 00 01                             # IPv4 Address
        00 06 00 14  20 01 0d b8 00*11 01                    # IPv6 Address
        00 09 00 08  00 00 03 e8                             # Cookie Preservative
        00 0b 00 08  68 69 00 00                             # Host Name Address "hi"
        00 0c 00 0c  00 05 00 06 00 0b 00 01                 # Supported Address Types
        80 00 00 04                                          # ECN Capable
        c0 00 00 08  00 00 01 02                             # Adaptation Layer Indication, not known here
    )"))));
    EXPECT_EQ(linesFrom(lines(runs.md), "823"), expected(R"x(
        823 |8 INIT| "  Chunk Flags" "  Chunk Flags=0x0" 265-272
        824 |8 INIT| "  Length" "  Length=88" 273-288/8
        825 |8 INIT| "    Initiate Tag" "    Initiate Tag=0xff" 289-320/8
        826 |8 INIT| "    Advertised Receiver Window Credit (a_rwnd)" "    Advertised Receiver Window Credit (a_rwnd)=102400(dec)" 321-352/8
        827 |8 INIT| "    Number of Outbound Streams" "    Number of Outbound Streams=10(dec)" 353-368/8
        828 |8 INIT| "    Number of Inbound Streams" "    Number of Inbound Streams=11(dec)" 369-384/8
        829 |8 INIT| "    Initial Transmission Sequence Number(I_TSN)" "    Initial Transmission Sequence Number(I_TSN)=2147483648" 385-416/8
        847 |10 Init Option| "Parameter Type" "Parameter Type=IPv4 Address" 417-432/8
        848 |10 Init Option| "      Length" "      Length=8 octet(s)" 433-448/8
        855 |11 IPv4 Address| "        IP Address" "        IP Address=10.0.0.1" 449-480/8
        847 |11 Init Option| "Parameter Type" "Parameter Type=IPv6 Address" 481-496/8
        848 |11 Init Option| "      Length" "      Length=20 octet(s)" 497-512/8
        856 |13 IPv6 Address| "        IP Address" "        IP Address=2001:db8:0:0:0:0:0:1" 513-640/16 order 8
        847 |12 Init Option| "Parameter Type" "Parameter Type=Cookie Preservative" 641-656/8
        848 |12 Init Option| "      Length" "      Length=8 octet(s)" 657-672/8
        867 |13 Cookie Preservative| "        Suggested Cookie Life-span Increment" "        Suggested Cookie Life-span Increment=1000 (msec.)" 673-704/8
        847 |13 Init Option| "Parameter Type" "Parameter Type=Host Name Address" 705-720/8
        848 |13 Init Option| "      Length" "      Length=8 octet(s)" 721-736/8
        868 |14 Host Name Address| "        Host Name" "        Host Name=hi" 737-768/8
        847 |14 Init Option| "Parameter Type" "Parameter Type=Supported Address Types" 769-784/8
        848 |14 Init Option| "      Length" "      Length=12 octet(s)" 785-800/8
        870 |15 Supported Address Types| "        Address Type" "        Address Type=IPv4 Address" 801-816/8
        870 |15 Supported Address Types| "        Address Type" "        Address Type=IPv6 Address" 817-832/8
        870 |15 Supported Address Types| "        Address Type" "        Address Type=Host Name Address" 833-848/8
        870 |15 Supported Address Types| "        Address Type" "        Address Type=Unknow Address Type" 849-864/8
        847 |15 Init Option| "Parameter Type" "Parameter Type=Reserved for ECN Capable" 865-880/8
        848 |15 Init Option| "      Length" "      Length=4 octet(s)" 881-896/8
        871 |16 Reserved for ECN Capable| "        Reserved" "        Reserved"
        847 |16 Init Option| "Parameter Type" "Parameter Type=UNKNOWN" 897-912/8
        848 |16 Init Option| "      Length" "      Length=8 octet(s)" 913-928/8
        872 |17 Reserved for ECN Capable| "        Reserved" "        Reserved" 929-960/8
    )x"));
    EXPECT_EQ(oneLine(linesFrom(lines(runs.to), "823")),
              R"x(823 "0x0"; 322 "88"; 825 "0xff"; 826 "102400(dec)"; 827 "10(dec)"; 828 "11(dec)"; )x"
              R"x(829 "2147483648"; )x"
              R"x(847 "IPv4 Address"; 322 "8 octet(s)"; 856 "10.0.0.1"; 847 "IPv6 Address"; 322 "20 octet(s)"; )x"
              R"x(856 "2001:db8:0:0:0:0:0:1"; 847 "Cookie Preservative"; 322 "8 octet(s)"; 867 "1000 (msec.)"; )x"
              R"x(847 "Host Name Address"; 322 "8 octet(s)"; 868 "hi"; 847 "Supported Address Types"; )x"
              R"x(322 "12 octet(s)"; 870 "IPv4 Address"; 870 "IPv6 Address"; 870 "Host Name Address"; )x"
              R"x(870 "Unknow Address Type"; 847 "Reserved for ECN Capable"; 322 "4 octet(s)"; 290 "0"; )x"
              R"x(847 "UNKNOWN"; 322 "8 octet(s)"; 290 "102")x");
    EXPECT_EQ(linesFrom(lines(runs.xtr), "row 92"), "row 92 Initial Transmission Sequence Number(I_TSN)=2147483648\n");
    EXPECT_EQ(verdictLine(runs.mv), "verdict -52 flags 0x8\n"); // the list ends on a limit that does not fit
    EXPECT_EQ(runs.md.field("        IP Address")->value, 0x0a000001u);
}

TEST(SctpInitAck, everyParameterInEveryPass) {
    const Runs runs = runAll(sctp(initAck(hex(R"(
        00 07 00 08  0a b0 00 01                             # State Cookie
        00 05 00 08  0a 00 00 01                             # IPv4 Address
        00 06 00 14  20 01 0d b8 00*11 01                    # IPv6 Address
        00 0b 00 06  68 69                                   # Host Name Address "hi"
        80 00 00 04                                          # ECN Capable
        00 09 00 05  7f                                      # Cookie Preservative has no place here
        00 08 00 0c  80 08 00 06 01 02                       # Unrecognized Parameters: one of six octets,
        c0 00 00 04                                          # and, as the list goes on, another
    )"))));
    EXPECT_EQ(linesFrom(lines(runs.md), "835"), expected(R"x(
        835 |8 Init Ack| "  Chunk Flags" "  Chunk Flags=0x0" 265-272
        836 |8 Init Ack| "  Length" "  Length=85" 273-288/8
        837 |8 Init Ack| "    Initiate Tag" "    Initiate Tag=0xff" 289-320/8
        838 |8 Init Ack| "    Advertised Receiver Window Credit (a_rwnd)" "    Advertised Receiver Window Credit (a_rwnd)=102400(dec)" 321-352/8
        839 |8 Init Ack| "    Number of Outbound Streams" "    Number of Outbound Streams=10(dec)" 353-368/8
        840 |8 Init Ack| "    Number of Inbound Streams" "    Number of Inbound Streams=11(dec)" 369-384/8
        841 |8 Init Ack| "    Initial Transmission Sequence Number(I_TSN)" "    Initial Transmission Sequence Number(I_TSN)=2147483648" 385-416/8
        851 |10 InitAck Option| "Parameter Type" "Parameter Type=State Cookie" 417-432/8
        852 |10 InitAck Option| "      Length" "      Length=8 octet(s)" 433-448/8
        857 |11 State Cookie| "        State Cookie" "        State Cookie=ab001" 449-480/8
        851 |11 InitAck Option| "Parameter Type" "Parameter Type=IPv4 Address" 481-496/8
        852 |11 InitAck Option| "      Length" "      Length=8 octet(s)" 497-512/8
        855 |12 IPv4 Address| "        IP Address" "        IP Address=10.0.0.1" 513-544/8
        851 |12 InitAck Option| "Parameter Type" "Parameter Type=IPv6 Address" 545-560/8
        852 |12 InitAck Option| "      Length" "      Length=20 octet(s)" 561-576/8
        856 |14 IPv6 Address| "        IP Address" "        IP Address=2001:db8:0:0:0:0:0:1" 577-704/16 order 8
        851 |13 InitAck Option| "Parameter Type" "Parameter Type=Host Name Address" 705-720/8
        852 |13 InitAck Option| "      Length" "      Length=6 octet(s)" 721-736/8
        868 |14 Host Name Address| "        Host Name" "        Host Name=hi" 737-752/8
        851 |14 InitAck Option| "Parameter Type" "Parameter Type=Reserved for ECN Capable" 753-768/8
        852 |14 InitAck Option| "      Length" "      Length=4 octet(s)" 769-784/8
        871 |15 Reserved for ECN Capable| "        Reserved" "        Reserved"
        851 |15 InitAck Option| "Parameter Type" "Parameter Type=UNKNOWN" 785-800/8
        852 |15 InitAck Option| "      Length" "      Length=5 octet(s)" 801-816/8
        872 |16 Reserved for ECN Capable| "        Reserved" "        Reserved" 817-824
        851 |16 InitAck Option| "Parameter Type" "Parameter Type=Unrecognized Parameters" 825-840/8
        852 |16 InitAck Option| "      Length" "      Length=12 octet(s)" 841-856/8
        863 |19 Unrecogonized Parameters| "        Unrecoginzed Parameter Type" "        Unrecoginzed Parameter Type=32776" 857-872/8
        864 |19 Unrecogonized Parameters| "        Length" "        Length=6 octet(s)" 873-888/8
        865 |19 Unrecogonized Parameters| "                Value" "                Value" 889-904/8
        863 |20 Unrecogonized Parameters| "        Unrecoginzed Parameter Type" "        Unrecoginzed Parameter Type=49152" 905-920/8
        864 |20 Unrecogonized Parameters| "        Length" "        Length=4 octet(s)" 921-936/8
        865 |20 Unrecogonized Parameters| "                Value" "                Value"
    )x"));
    EXPECT_EQ(oneLine(linesFrom(lines(runs.to), "823")),
              R"x(823 "0x0"; 322 "85"; 825 "0xff"; 826 "102400(dec)"; 827 "10(dec)"; 828 "11(dec)"; )x"
              R"x(829 "2147483648"; )x"
              R"x(847 "State Cookie"; 322 "8 octet(s)"; 857 "ab001"; 847 "IPv4 Address"; 322 "8 octet(s)"; )x"
              R"x(856 "10.0.0.1"; 847 "IPv6 Address"; 322 "20 octet(s)"; 856 "2001:db8:0:0:0:0:0:1"; )x"
              R"x(847 "Host Name Address"; 322 "6 octet(s)"; 868 "hi"; 847 "Reserved for ECN Capable"; )x"
              R"x(322 "4 octet(s)"; 290 "0"; 847 "UNKNOWN"; 322 "5 octet(s)"; 290 "7f"; )x"
              R"x(847 "Unrecognized Parameters"; 322 "12 octet(s)"; 863 "32776"; 322 "6 octet(s)"; 865 "0x102"; )x"
              R"x(863 "49152"; 322 "4 octet(s)"; 865 "0x0")x");
    EXPECT_EQ(linesFrom(lines(runs.xtr), "row 92"), "row 92 Initial Transmission Sequence Number(I_TSN)=2147483648\n");
    EXPECT_EQ(runs.mv.flags, 0u);
}

// Each parameter of INIT has a limit of its own, and a fault in it does not go further.
TEST(SctpInit, parametersKeepTheirFaults) {
    const std::vector<SctpCase> cases = {
        {"an address longer than four octets", init(hex("00 05 00 0c 0a 00 00 01 ff ff ff ff  c0 00 00 04")),
         " 847 848 855 847 848 872", 0x18},
        {"an IPv6 address without room, then one of IPv4",
         init(hex("00 06 00 08 aa bb cc dd  00 05 00 08 0a 00 00 01")), " 847 848 847 848 855", 0x18},
        {"an odd octet of address types", init(hex("00 0c 00 07 00 05 ff")), " 847 848 870", 0x18},
        {"address types cut short", shortened(init(hex("00 0c 00 08 00 05 00 06")), 26), " 847 848 870", 0xa},
        {"a value longer than the packet", init(hex("00 0b 00 20 61 62  80 00 00 04")), " 847 848", 0x18},
        {"a Length of 3: the next one starts after three octets", init(hex("80 00 00 03  00 00 04")),
         " 847 847 848 872", 0x18},
        {"no type for an IPv4 Address after one", init(hex("00 05 00 08 0a 00 00 01 00")), " 847 848 855", 0x18},
        {"a following chunk: one octet is INIT's", init(hex("00 05 00 08 0a 00 00 01")) + hex("0b 00 00 04"),
         " 847 848 855 805 814 815 816", 0x18},
        {"State Cookie has no place here", init(hex("00 07 00 06 61 62")), " 847 848 872", 0x8},
        {"Unrecognized Parameters neither", init(hex("00 08 00 04")), " 847 848 872", 0x8},
    };
    for (const SctpCase &one : cases) {
        checkCase(one, initIds);
    }
    const Runs restored = runAll(sctp(init(hex("00 06 00 08 aa bb cc dd  00 05 00 08 0a 00 00 01"))));
    EXPECT_EQ(restored.md.field("        IP Address")->text, "        IP Address=10.0.0.1");
}

// A parameter of Length 0, or a first head that does not fit, would be read again and again.
TEST(SctpInit, listThatWouldNotEnd) {
    for (const char *parameters :
         {"00 05 00 00", "00*8", "00 0b 00 06 68 69 00 00 00 00 00 00", "00 05 00 02 00 02",
          "00 0c 00 06 00 05  00 05 00 00 00 00", "00 05 00 01", "00 0c 00 02", "00 00", "00 00 00", "00"}) {
        SCOPED_TRACE(parameters);
        const Runs runs = runAll(sctp(init(hex(parameters)) + hex("00  0b 00 00 04")));
        EXPECT_EQ(runs.md.ending, Ending::complete);
        EXPECT_EQ(runs.md.bitsLeft, 0u);
        EXPECT_LE(runs.md.fields.size(), 60u);
        EXPECT_TRUE(chunkIds(runs.md).ends_with(" 805 892 808")); // the walk over the chunks goes on
    }
}

// INIT ACK has no limits: it reads on where a field ends, and a field that does not fit ends the walk.
TEST(SctpInitAck, parametersFollowTheFields) {
    const std::vector<SctpCase> cases = {
        {"padding of a cookie is the next type", initAck(hex("00 07 00 11 61*13 00 00 00  00 05 00 08 0a 00 00 01")),
         " 851 852 857 851 852", 0x10},
        {"nothing in Unrecognized Parameters", initAck(hex("00 08 00 04  00 05 00 08 0a 00 00 01")),
         " 851 852 851 852 855"},
        {"an inner Length that ends the inner list",
         initAck(hex("00 08 00 0c  00 01 00 14 00*16  00 05 00 08 0a 00 00 01")), " 851 852 863 864 865 851 852 855"},
        {"an inner value that does not fit", initAck(hex("00 08 00 0c  00 01 00 14 00*15")), " 851 852 863 864", 0x10},
        {"Supported Address Types has no place here", initAck(hex("00 0c 00 08 00 05 00 06")), " 851 852 872"},
        {"an address of Length 12", initAck(hex("00 05 00 0c 0a 00 00 01 80 00 00 04")), " 851 852 855 851 852 871"},
        {"a Length of 3", initAck(hex("00 0b 00 03 61")) + hex("0b 00 00 04"), " 851 852", 0x10},
        {"a cookie cut short", initAck(hex("00 07 00 09 61*4")), " 851 852", 0x10},
        // 20 octets count as 12: as 8 are left, what follows is read as parameters, of -4 octets each.
        {"the list reads on in the next chunk", initAck(hex("00 06 00 14 00*16")) + hex("0b 00 00 04 0b 00 00 04"),
         " 851 852 856 851 852 872 851 852 872"},
        {"a count that the list uses up", hex("02 00 00 20 00*16  00 07 00 14 61*16  0b 00 00 04"),
         " 851 852 857 805 892 808"},
    };
    for (const SctpCase &one : cases) {
        checkCase(one, initAckIds);
    }
}

} // namespace
} // namespace netfloor::test
