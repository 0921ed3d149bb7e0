// SPDX-License-Identifier: MIT
// The common header of SCTP (RFC 9260, 3.1), the walk over the chunks, and their bodies.
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "sctp/sctp_packets.h"
#include "support/memory.h"

namespace netfloor::test {
namespace {

TEST(Sctp, headerAndSecondChunk) {
    const Runs runs = runAll(ipv4({.protocol = 132, .payload = hex(R"(
        0b 59 0b 5a   # ports 2905, 2906
        de ad be ef   # verification tag
        00 00 0c 0d   # checksum
        0b a5 00 04   # COOKIE ACK
        0b 00 00 04   # once more
    )")}));
    EXPECT_EQ(linesFrom(lines(runs.md), "795"), expected(R"x(
        795 |6 Common Header| "SCTP Source Port Number" "SCTP Source Port Number=2905" 161-176/8
        796 |6 Common Header| "SCTP Destination Port Number" "SCTP Destination Port Number=2906" 177-192/8
        797 |6 Common Header| "Verification Tag" "Verification Tag=0xdeadbeef" 193-224/8
        798 |6 Common Header| "Checksum" "Checksum=0xc0d" 225-256/8
        802 |7 Chunk| "SCTP Chunk Type" "SCTP Chunk Type=Cookie Acknowledgement (COOKIE ACK)" 257-264
        892 |8 Cookie Acknowledge| "  Chunk flags" "  Chunk flags=a5" 265-272
        808 |9 Length| "  Chunk Length" "  Chunk Length=4" 273-288/8
        805 |9 Chunk| "SCTP  Chunk Type" "SCTP  Chunk Type=Cookie Acknowledgement (COOKIE ACK)" 289-296
        892 |10 Cookie Acknowledge| "  Chunk flags" "  Chunk flags=0" 297-304
        808 |11 Length| "  Chunk Length" "  Chunk Length=4" 305-320/8
    )x"));
    EXPECT_EQ(oneLine(linesFrom(lines(runs.to), "795")),
              R"x(795 "2905"; 796 "2906"; 797 "0xdeadbeef"; 543 "0xc0d"; 802 "SCTP - COOKIE ACK (11)"; 884 "a5"; )x"
              R"x(808 "4"; 805 "Cookie Acknowledgement (COOKIE ACK)"; 884 "0"; 808 "4")x");
    EXPECT_EQ(linesFrom(lines(runs.xtr), "row 84"), expected(R"(
        row 84 SCTP Source Port Number=2905
        row 85 SCTP Destination Port Number=2906
        row 86 SCTP Chunk Type=11
    )"));
    EXPECT_EQ(runs.mv.flags, 0u);
}

TEST(Sctp, headerCutOff) {
    for (const std::size_t octets : {0u, 1u, 3u, 4u, 8u, 11u, 12u}) {
        const Octets whole = sctp({});
        const Runs runs = runAll(shortened(whole, 20 + octets));
        const std::size_t fields = octets < 2 ? 0 : octets < 4 ? 1 : octets < 8 ? 2 : octets < 12 ? 3 : 4;
        EXPECT_EQ(runs.md.fields.size(), 18 + fields) << octets;
        EXPECT_EQ(runs.mv.flags, octets % 4 != 0 ? 0x10u : 0u) << octets;
    }
    // The IP header counts four octets of payload more than there are.
    const Octets cookieAck = sctp(hex("0b 00 00 04"));
    const Runs runs =
        runAll(ipv4({.protocol = 132, .payload = Octets(cookieAck.begin() + 20, cookieAck.end()), .headerWords = 4}));
    EXPECT_EQ(chunkIds(runs.md), "802 892 808");
    EXPECT_EQ(runs.mv.flags, 0x8u);
}

struct Body {
    const char *chunk, *md, *to, *keys;
};

// Each kind of chunk but INIT and INIT ACK, as the only one of its packet: the fields after its type.
TEST(SctpChunk, everyFieldInEveryPass) {
    const std::vector<Body> bodies = {
        {"00 fe 00 14  00 00 00 2a  00 03 00 04  00 00 00 2e  61 62 63 64", R"(
            814 |8 Data| "  Reserved" "  Reserved=1f" 268-272
            815 |8 Data| "  Unordered Data Chunk(U) Bit" "  Unordered Data Chunk(U) Bit=TRUE" 267-267
            816 |8 Data| "  BE bits" "  BE bits=First piece of a fragmented user message" 265-266
            808 |9 Length| "  Chunk Length" "  Chunk Length=20" 273-288/8
            817 |8 Data| "    TSN" "    TSN=0x2a" 289-320/8
            818 |8 Data| "    Stream Indetifier S" "    Stream Indetifier S=3" 321-336/8
            819 |8 Data| "    Stream Sequence Number n" "    Stream Sequence Number n=4" 337-352/8
            820 |8 Data| "    Payload Protocol Identifier" "    Payload Protocol Identifier=0x2e" 353-384/8)",
         R"(290 "1f"; 815 "TRUE"; 816 "First piece of a fragmented user message"; 808 "20"; 817 "0x2a"; )"
         R"(818 "3"; 819 "4"; 820 "0x2e")",
         R"(
            row 87 TSN=42
            row 88 Stream Indetifier S=3
            row 89 Stream Sequence Number n=4
            row 90 Payload Protocol Identifier=46)"},
        {"03 00 00 18  00 00 00 2a  00 01 00 00  00 01 00 01  00 02 00 05  00 00 00 07", R"x(
            873 |8 Selective Acknowledgement| "  Chunk Flags" "  Chunk Flags=0x0" 265-272
            874 |8 Selective Acknowledgement| "  Length" "  Length=24" 273-288/8
            875 |8 Selective Acknowledgement| "    Cumulative TSN Ack" "    Cumulative TSN Ack=0x2a" 289-320/8
            876 |8 Selective Acknowledgement| "    Advertised Receiver Window Credit (a_rwnd)" "    Advertised Receiver Window Credit (a_rwnd)=65536(dec)" 321-352/8
            877 |8 Selective Acknowledgement| "    Number of Gap Ack Blocks" "    Number of Gap Ack Blocks=1(dec)" 353-368/8
            878 |8 Selective Acknowledgement| "    Number of Duplicate TSNs" "    Number of Duplicate TSNs=1(dec)" 369-384/8
            881 |9 Gap Ack Block| "    Gap Ack Block Start" "    Gap Ack Block Start=2" 385-400/8
            882 |9 Gap Ack Block| "    Gap Ack Block End" "    Gap Ack Block End=5" 401-416/8
            883 |9 Duplicate TSN| "    Duplicate TSN" "    Duplicate TSN=0x7" 417-448/8)x",
         R"x(823 "0x0"; 322 "24"; 875 "0x2a"; 826 "65536(dec)"; 877 "1(dec)"; 878 "1(dec)"; 881 "2"; )x"
         R"(882 "5"; 883 "0x7")",
         "row 94 Cumulative TSN Ack=42"},
        {"04 01 00 0c  00 01 00 08  0a b0 00 01", R"(
            939 |8 Heartbeat Request| "  Chunk Flags" "  Chunk Flags=0x1" 265-272
            808 |9 Length| "  Chunk Length" "  Chunk Length=12" 273-288/8
            941 |9 Heartbeat Information TLV| "    Heartbeat Info Type" "    Heartbeat Info Type=1" 289-304/8
            942 |9 Heartbeat Information TLV| "      HB Info length" "      HB Info length=8" 305-320/8
            943 |9 Heartbeat Information TLV| "        Sender-specific HB Info" "        Sender-specific HB Info=ab001" 321-352/8)",
         R"(823 "0x1"; 808 "12"; 941 "1"; 942 "8"; 943 "ab001")", ""},
        {"05 00 00 08  00 01 00 04", R"(
            940 |8 Heartbeat Acknowledgement| "  Chunk Flags" "  Chunk Flags=0x0" 265-272
            808 |9 Length| "  Chunk Length" "  Chunk Length=8" 273-288/8
            941 |9 Heartbeat Information TLV| "    Heartbeat Info Type" "    Heartbeat Info Type=1" 289-304/8
            942 |9 Heartbeat Information TLV| "      HB Info length" "      HB Info length=4" 305-320/8
            943 |9 Heartbeat Information TLV| "        Sender-specific HB Info" "        Sender-specific HB Info=")",
         R"(823 "0x0"; 808 "8"; 941 "1"; 942 "4"; 943 "")", ""},
        {"06 ff 00 04", R"(
            944 |8 Abort Association| "  Reserved" "  Reserved=7f" 266-272
            945 |8 Abort Association| "  T bit" "  T bit=no sender TCB" 265-265
            946 |8 Abort Association| "  Chunk Length" "  Chunk Length=4" 273-288/8)",
         R"(290 "7f"; 945 "no sender TCB"; 808 "4")", ""},
        {"07 a1 00 08  00 00 00 2a", R"(
            884 |8 Shutdown| "  Chunk flags" "  Chunk flags=a1" 265-272
            885 |8 Shutdown| "  Length" "  Length=8" 273-288/8
            886 |8 Shutdown| "    Cumulative TSN Ack" "    Cumulative TSN Ack=42" 289-320/8)",
         R"(884 "a1"; 322 "8"; 875 "42")", "row 94 Cumulative TSN Ack=42"},
        {"08 00 00 04", R"(
            887 |8 Shutdown Acknowledge| "  Chunk flags" "  Chunk flags=0" 265-272
            888 |8 Shutdown Acknowledge| "  Length" "  Length=4" 273-288/8)",
         R"(884 "0"; 322 "4")", ""},
        {"09 00 00 04", R"(
            909 |8 Error| "  Chunk flags" "  Chunk flags=0" 265-272
            910 |8 Error| "  Chunk Length" "  Chunk Length=4" 273-288/8)",
         R"(884 "0"; 808 "4")", ""},
        // A cookie is read from its last octet to its first.
        {"0a 00 00 08  0a b0 00 01", R"(
            893 |8 Cookie Echo| "  Chunk flags" "  Chunk flags=0" 265-272
            808 |9 Length| "  Chunk Length" "  Chunk Length=8" 273-288/8
            895 |8 Cookie Echo| "    Cookie" "    Cookie=10b0a" 313-320 305-312 297-304 289-296)",
         R"(884 "0"; 808 "8"; 895 "10b0a")", ""},
        {"0c 00 00 0a  de ad 00 00 00 2a", R"(
            899 |8 ECNE| "  Chunk Flags" "  Chunk Flags=0x0" 265-272
            808 |9 Length| "  Chunk Length" "  Chunk Length=10" 273-288/8
            903 |8 ECNE| "    Reserved" "    Reserved" 289-336/8)",
         R"(823 "0x0"; 808 "10"; 290 "2a")", ""},
        {"0d 00 00 05  ff", R"(
            904 |8 CWR| "  Chunk Flags" "  Chunk Flags=0x0" 265-272
            808 |9 Length| "  Chunk Length" "  Chunk Length=5" 273-288/8
            908 |8 CWR| "    Reserved" "    Reserved" 289-296)",
         R"(823 "0x0"; 808 "5"; 290 "ff")", ""},
        {"0e 00 00 04", R"(
            889 |8 Shutdown Complete| "  Reserved" "  Reserved=0" 266-272
            890 |8 Shutdown Complete| "  T bit" "  T bit=Sender TCB destroyed" 265-265
            891 |8 Shutdown Complete| "  Length" "  Length=4" 273-288/8)",
         R"(290 "0"; 945 "Sender TCB destroyed"; 322 "4")", ""},
        {"c0 10 00 07  0a b0 00", R"(
            809 |8 Reserved chunks| "  Chunk Flags" "  Chunk Flags=0x10" 265-272
            808 |9 Length| "  Chunk Length" "  Chunk Length=7" 273-288/8
            813 |8 Reserved chunks| "    Reserved contents" "    Reserved contents=ab00" 289-312/8)",
         R"(823 "0x10"; 808 "7"; 813 "ab00")", ""},
    };
    const auto afterType = [](const std::string &text, const char *type) {
        const std::string rest = linesFrom(text, type);
        return rest.substr(rest.find('\n') + 1);
    };
    for (const Body &body : bodies) {
        SCOPED_TRACE(body.chunk);
        const Runs runs = runAll(sctp(hex(body.chunk)));
        EXPECT_EQ(afterType(lines(runs.md), "802"), expected(body.md));
        EXPECT_EQ(oneLine(afterType(lines(runs.to), "802")), body.to);
        EXPECT_EQ(afterType(lines(runs.xtr), "row 86"), expected(body.keys));
        EXPECT_EQ(runs.mv.flags, 0u);
    }
}

// How much of the payload the walk takes depends on the Lengths; where it reads on depends on the fields.
TEST(SctpWalk, lengthsAndFields) {
    const std::string data = "802 814 815 816 808 817 818 819 820";
    const std::string initAlone = "802 823 824 825 826 827 828 829";
    const std::vector<SctpCase> cases = {
        {"no chunk", {}, ""},
        {"a type alone", hex("0b"), "802"},
        {"Length 0 takes nothing", hex("08 00 00 00  0b 00 00 04"), "802 887 888 805 892 808"},
        {"Length above the packet ends the walk", hex("0b 00 ff ff  0b 00 00 04"), "802 892 808", 0x10},
        {"SACK's Length is taken once more after ABORT", hex("03 00 00 10 00*12  06 00 00 04  0b 00 00 04"),
         "802 873 874 875 876 877 878 805 944 945 946", 0x10},
        {"nothing to take after an ABORT that comes first", hex("06 00 00 04  0b 00 00 04"),
         "802 944 945 946 805 892 808"},
        {"padding of a cookie reads as DATA", hex("0a 00 00 09 01 02 03 04 05  00 00 00  0b 00 00 04"),
         "802 893 808 895 805 814 815 816 808", 0x10},
        {"the rest of a long SHUTDOWN is the next chunk", hex("07 00 00 0c 00 00 00 2a  0b 00 00 04  0e 00 00 04"),
         "802 884 885 886 805 892 808", 0x10},
        {"COOKIE ECHO of Length 4", hex("0a 00 00 04"), "802 893 808 895"},
        {"COOKIE ECHO of Length 3", hex("0a 00 00 03 0b 00 00 04"), "802 893 808", 0x10},
        {"COOKIE ECHO takes 4 octets less", hex("0a 00 00 06 01 02  0b 00 00 04  0b 00 00 04"),
         "802 893 808 895 805 892 808 805 892 808"},
        {"COOKIE ECHO cut short", hex("0a 00 00 09 01 02 03 04"), "802 893 808", 0x10},
        {"ECNE of Length 4", hex("0c 00 00 04  0b 00 00 04"), "802 899 808 805 892 808"},
        {"CWR of Length 3", hex("0d 00 00 03  0b 00 00 04"), "802 904 808 805 892 808"},
        {"ECNE cut short", hex("0c 00 00 08 00 00 00"), "802 899 808", 0x10},
        {"reserved, Length 4", hex("0f 00 00 04  0b 00 00 04"), "802 809 808 805 892 808"},
        {"reserved, Length 5", hex("ff 00 00 05 61  0b 00 00 04  0b 00 00 04"),
         "802 809 808 813 805 892 808 805 892 808"},
        {"reserved, cut short", hex("ff 00 00 06 61"), "802 809 808", 0x10},
        {"reserved, cut before its Length", hex("07 00 00 08 00 00 00 2a  ff 00 00"), "802 884 885 886 805 809", 0x10},
        {"DATA without user data", hex("00 03 00 10 00*12  0b 00 00 04"), data + " 805 892 808"},
        {"DATA cut before its user data", hex("00 03 00 40 00*11"), "802 814 815 816 808 817 818 819", 0x10},
        {"INIT's limit takes the next octet", hex("01 00 00 14 00*16  0b 00 00 04"), initAlone + " 805 814 815 816",
         0x10},
        {"INIT cut before its Length", hex("01 00 00"), "802 823", 0x18},
        {"INIT ACK without parameters", hex("02 00 00 14 00*16  00*3"),
         "802 835 836 837 838 839 840 841 805 814 815 816", 0x10},
    };
    for (const SctpCase &one : cases) {
        checkCase(one);
    }
}

TEST(SctpChunk, listsOfSackGoByTheirCounts) {
    const std::string head = "802 873 874 875 876 877 878";
    const auto sack = [](const char *counts, const char *rest) {
        return hex("03 00 00 10  00 00 00 2a  00 01 00 00") + hex(counts) + hex(rest);
    };
    const std::vector<SctpCase> cases = {
        {"three gaps, room for two", sack("00 03 00 00", "00 01 00 02 00 03 00 04"), " 881 882 881 882"},
        {"and a duplicate", sack("00 03 00 01", "00 01 00 02 00 03 00 04"), " 881 882 881 882", 0x2},
        {"three gaps, room for one", sack("00 03 00 00", "00 01 00 02"), " 881 882", 0x2},
        {"half a gap", sack("00 02 00 00", "00 01 00 02 00 03"), " 881 882 881"},
        {"two duplicates, room for one and a half", sack("00 00 00 02", "00 00 00 07 00 00"), " 883", 0x10},
        {"the count of the SACK before, where its own is missing",
         sack("00 01 00 00", "00 01 00 02") + hex("03 00 00 10 00*4 00*3"), " 881 882 805 873 874 875", 0x12},
        {"all there", sack("00 01 00 02", "00 01 00 02 00 00 00 07 00 00 00 08"), " 881 882 883 883"},
    };
    for (const SctpCase &one : cases) {
        checkCase(one, head);
    }
}

TEST(SctpChunk, heartbeatInformation) {
    const std::string head = "802 939 808";
    const std::vector<SctpCase> cases = {
        {"of another type, at the end", hex("04 00 00 08  00 02 00 04"), "", 0x12, 0x2},
        {"of another type, read as DATA", hex("04 00 00 0c  00 02 00 08 aa bb cc dd  0b 00 00 04"),
         " 805 814 815 816 808 817 818 819", 0x2, 0x2},
        {"without a type", hex("04 00 00 04"), "", 0x2, 0x2},
        {"no room for its own Length", hex("04 00 00 08  00 01 00 03"), " 941", 0x10},
        {"longer than the packet", hex("04 00 00 0c  00 01 00 09 aa bb cc dd"), " 941 942", 0x18},
        {"shorter than the chunk", hex("04 00 00 0c  00 01 00 06 aa bb cc dd"), " 941 942 943", 0x10},
        {"without a Length: as if it were 0", hex("04 00 00 06  00 01"), "", 0x10},
    };
    for (const SctpCase &one : cases) {
        checkCase(one, head);
    }
}

// The supplied owner takes what the chunk's Length says, with its padding, so that a bundle shows all its chunks.
TEST(SctpData, handsOnAndGoesOn) {
    const Octets bundle = hex(R"(
        00 03 00 11  00 00 00 01  00 00 00 00  00 00 00 03  61 00 00 00   # DATA of one octet, padded
        03 00 00 10  00 00 00 2a  00 01 00 00  00 00 00 00                # SACK
        00 03 00 12  00 00 00 02  00 00 00 00  00 00 00 03  62 63 00 00   # DATA of two
        0b 00 00 04                                                       # COOKIE ACK
    )");
    const Runs runs = checkCase({"bundle", bundle,
                                 "802 814 815 816 808 817 818 819 820 * "
                                 "805 873 874 875 876 877 878 "
                                 "805 814 815 816 808 817 818 819 820 * 805 892 808"});
    EXPECT_EQ(handOffLines(runs.md), expected(R"(
        hand-off key 2906 protocol 132 port 2906 at 385 bits 352 octets 0 preceding 0
        hand-off key 2906 protocol 132 port 2906 at 673 bits 64 octets 0 preceding 0
    )"));
    EXPECT_EQ(layerLines(runs.md), expected(R"(
        layer 1 of 1: 1-384
        layer 2 of 0: 385-416
        layer 2 of 1: 417-672
        layer 3 of 0: 673-704
        layer 3 of 1: 705-736
    )"));
    EXPECT_EQ(runs.xtr.key("TSN")->number, 1u); // the key pass ends at the first hand-off
    EXPECT_EQ(runs.xtr.bitsLeft, 352u);
    EXPECT_EQ(runs.xtr.key("Cumulative TSN Ack"), nullptr);

    // Without user data the keys of all chunks are there, and the last one wins.
    const Runs last =
        runAll(sctp(hex("00 03 00 10 00 00 00 07 00*8  03 00 00 10 00 00 00 2a 00*8  07 00 00 08 00 00 00 2b")));
    EXPECT_EQ(last.xtr.key("TSN")->number, 7u);
    EXPECT_EQ(last.xtr.key("Cumulative TSN Ack")->number, 43u);
}

// An owner that runs the plug-in again changes the variables of the walk, which still ends with the bits.
TEST(SctpData, ownerRunsThePluginAgain) {
    Host host = freshHost();
    std::size_t calls = 0;
    host.owners().addProtocol(132, [&calls](NextLayer &next) {
        ++calls;
        static_cast<void>(next.runPlugin());
        return Handled::yes;
    });
    Octets tunnel = sctp(hex("0b 00 00 04 0b 00 00 04"));
    for (unsigned depth = 0; depth < 40; ++depth) {
        tunnel = sctp(chunk(0, hex("00*12") + tunnel) + hex("0b 00 00 04  00 03 00 18 00*12 45 00 00 14 ff ff ff ff"));
    }
    const Octets many = repeated("00 03 00 14 00*12 61 62 63 64", 6000);
    const std::vector<Octets> packets = {
        tunnel,
        sctp(many),
        sctp(hex("00 03 00 14 00*12") + sctp(hex("02 00 ff ff 00*64")) +
             many), // leaves a large count for the next packet
        sctp(hex("00 03 00 14 00*12") + sctp(hex("0a 00 ff ff 00*9")) + hex("0b 00 00 04")),
    };
    for (const Octets &packet : packets) {
        calls = 0;
        const Runs runs = runAll(packet, {}, host);
        EXPECT_EQ(runs.md.ending, Ending::complete);
        EXPECT_LE(runs.md.cursor, packet.size() * 8 + 1);
        EXPECT_GE(calls, 4u);
        EXPECT_LE(calls, 4 * packet.size() / 16);
    }
}

TEST(SctpChunk, longOctetStrings) {
    for (const char *type : {"0a", "ff", "0c"}) { // the first two show all their octets
        const Octets packet = sctp(hex(type) + hex("00 03 ec") + hex("ff*1000"));
        const Runs runs = runAll(packet);
        EXPECT_EQ(runs.md.fields.back().ranges.size(), 1000u);
        const bool shown = *type != '0' || type[1] != 'c';
        EXPECT_EQ(runs.md.fields.back().text.size(), shown ? 255u : std::string_view("    Reserved").size());
        EXPECT_EQ(runs.to.displays.back().text.size(), shown ? 255u : 8u);
    }
}

TEST(SctpWalk, overIpv6) {
    const Runs runs = runAll(ipv6({.nextHeader = 132, .payload = hex(R"(
        ff ff fe ff 00*8                       # ports without a key: the protocol number is the key
        00 03 00 14 00*12 61 62 63 64
        0b 00 00 04
    )")}));
    EXPECT_EQ(handOffLines(runs.md), "hand-off key 132 protocol 0 port 0 at 545 bits 64 octets 0 preceding 0\n");
    EXPECT_EQ(chunkIds(runs.md), "802 814 815 816 808 817 818 819 820 * 805 892 808");
    EXPECT_EQ(runs.mv.flags, 0u);
}

// 65535 octets with a chunk, or another reason for a round of the walk, in every four of them.
TEST(SctpWalk, longestPacketsOnASmallStack) {
    constexpr std::size_t most = 65535 - 32;
    const std::vector<std::pair<Octets, std::size_t>> packets = {
        {repeated("0b 00 00 04", most), 3 * (most / 4)},
        {chunk(1, hex("00*16") + repeated("c0 00 00 04", most - 20)), 3 * ((most - 20) / 4)},
        {chunk(2, hex("00*16") + repeated("c0 00 00 04", most - 20)), 3 * ((most - 20) / 4)},
        {chunk(2, hex("00*16 00 08 ff 00") + repeated("c0 00 00 04", most - 24)), 3 * ((most - 24) / 4)},
        {hex("09 00 00 08") + repeated("00 0a 00 08", most - 4), 2 * ((most - 4) / 4)},
        {hex("03 00 00 10 00*8 ff ff 00 00") + repeated("00 01 00 02", most - 16), 2 * ((most - 16) / 4)},
    };
    onSmallStack([&] {
        for (const auto &[chunks, fields] : packets) {
            const Runs runs = runAll(sctp(chunks));
            EXPECT_GE(runs.md.fields.size(), fields);
            EXPECT_EQ(runs.md.ending, Ending::complete);
            EXPECT_EQ(runs.md.bitsLeft, 0u);
        }
    });
}

} // namespace
} // namespace netfloor::test
