// SPDX-License-Identifier: MIT
// The causes in ABORT and ERROR (RFC 9260, 3.3.10).
#include <vector>

#include <gtest/gtest.h>

#include "sctp/sctp_packets.h"

namespace netfloor::test {
namespace {

Octets abortChunk(const char *causes) {
    return chunk(6, hex(causes));
}

Octets errorChunk(const char *causes) {
    return chunk(9, hex(causes));
}

constexpr const char *abortIds = "802 944 945 946";
constexpr const char *errorIds = "802 909 910";

struct Cause {
    const char *octets, *md, *to;
    std::uint32_t mvFlags; // a list that is read to its end has a last limit of the same length as the first
};

TEST(SctpCauses, everyCauseInEveryPass) {
    const std::vector<Cause> causes = {
        {"00 01 00 08  00 07 ff fe", R"(
            912 |9 Error Causes| "    Cause Code" "    Cause Code=Invalid Stream Identifier" 289-304/8
            914 |10 Invalid Stream Identifier| "      Length" "      Length=8" 305-320/8
            915 |10 Invalid Stream Identifier| "        Stream Identifier" "        Stream Identifier=7" 321-336/8
            916 |10 Invalid Stream Identifier| "        Reserved" "        Reserved=65534" 337-352/8)",
         R"(912 "Invalid Stream Identifier"; 322 "8"; 915 "7"; 290 "65534")", 0x8},
        {"00 02 00 0c  00 00 00 02  00 05 00 06", R"(
            912 |9 Error Causes| "    Cause Code" "    Cause Code=Missing Mandatory Parameter" 289-304/8
            917 |10 Missing Mandatory Parameter| "      Length" "      Length=12" 305-320/8
            918 |10 Missing Mandatory Parameter| "        Number of missing params" "        Number of missing params=2" 321-352/8
            920 |11 INLINE BLOCK| "        Missing Parameters Type" "        Missing Parameters Type=5" 353-368/8
            920 |11 INLINE BLOCK| "        Missing Parameters Type" "        Missing Parameters Type=6" 369-384/8)",
         R"(912 "Missing Mandatory Parameter"; 322 "12"; 918 "2"; 920 "5"; 920 "6")", 0x8},
        {"00 03 00 08  00 00 03 e8", R"x(
            912 |9 Error Causes| "    Cause Code" "    Cause Code=Stale Cookie Error" 289-304/8
            921 |10 Stale Cookie Error| "      Cause Length" "      Cause Length=8" 305-320/8
            922 |10 Stale Cookie Error| "        Measure of staleness (usec.)" "        Measure of staleness (usec.)=1000" 321-352/8)x",
         R"(912 "Stale Cookie Error"; 921 "8"; 922 "1000")", 0x8},
        {"00 04 00 04", R"(
            912 |9 Error Causes| "    Cause Code" "    Cause Code=Out Of Resource" 289-304/8
            923 |10 Out Of Resource| "      Cause Length" "      Cause Length=4" 305-320/8)",
         R"(912 "Out Of Resource"; 921 "4")", 0x8},
        // The address and the chunk are read from the last octet to the first.
        {"00 05 00 0c  00 05 00 08  0a 00 00 01", R"(
            912 |9 Error Causes| "    Cause Code" "    Cause Code=Unresolvable Address" 289-304/8
            924 |10 Unresolvable Address| "      Length" "      Length=12" 305-320/8
            925 |10 Unresolvable Address| "        Unrecognized Address" "        Unrecognized Address=100a8050" 377-384 369-376 361-368 353-360 345-352 337-344 329-336 321-328)",
         R"(912 "Unresolvable Address"; 322 "12"; 925 "100a8050")", 0x8},
        {"00 06 00 08  0f 00 00 04", R"(
            912 |9 Error Causes| "    Cause Code" "    Cause Code=Unrecognized Chunk Type" 289-304/8
            926 |10 Unrecognized Chunk Type| "      Length" "      Length=8" 305-320/8
            927 |10 Unrecognized Chunk Type| "        Unrecognized Chunk" "        Unrecognized Chunk=400f" 345-352 337-344 329-336 321-328)",
         R"(912 "Unrecognized Chunk Type"; 322 "8"; 927 "400f")", 0x8},
        {"00 07 00 04", R"(
            912 |9 Error Causes| "    Cause Code" "    Cause Code=Invalid Mandatory Parameter" 289-304/8
            928 |10 Invalid Mandatory Parameter| "      Length" "      Length=4" 305-320/8)",
         R"(912 "Invalid Mandatory Parameter"; 322 "4")", 0x8},
        {"00 08 00 0c  c0 00 00 08 00 00 01 02", R"x(
            912 |9 Error Causes| "    Cause Code" "    Cause Code=Unrecognized Parameters" 289-304/8
            929 |10 Unrecognized Parameters| "      Length" "      Length=12" 305-320/8
            863 |12 Unrecogonized Parameters| "        Unrecoginzed Parameter Type" "        Unrecoginzed Parameter Type=49152" 321-336/8
            864 |12 Unrecogonized Parameters| "        Length" "        Length=8 octet(s)" 337-352/8
            865 |12 Unrecogonized Parameters| "                Value" "                Value" 353-384/8)x",
         R"x(912 "Unrecognized Parameters"; 322 "12"; 863 "49152"; 322 "8 octet(s)"; 865 "0x102")x", 0},
        {"00 09 00 08  00 00 00 2a", R"(
            912 |9 Error Causes| "    Cause Code" "    Cause Code=No User Data" 289-304/8
            932 |10 No User Data| "      Length" "      Length=8" 305-320/8
            933 |10 No User Data| "        TSN value" "        TSN value=42" 321-352/8)",
         R"(912 "No User Data"; 322 "8"; 933 "42")", 0x8},
        {"00 0a 00 04", R"(
            912 |9 Error Causes| "    Cause Code" "    Cause Code=Cookie Rcvd While Shutting Down" 289-304/8
            934 |10 Cookie Rcvd While Shutting Down| "      Length" "      Length=4" 305-320/8)",
         R"(912 "Cookie Rcvd While Shutting Down"; 322 "4")", 0},
        // Six octets: the number is that of the last four.
        {"00 63 00 0a  01 02 03 04 05 06", R"(
            912 |9 Error Causes| "    Cause Code" "    Cause Code=UNKNOWN" 289-304/8
            935 |10 Unknown Cause Code| "      Length" "      Length=10" 305-320/8
            938 |10 Unknown Cause Code| "      Unknown Cause" "      Unknown Cause=3040506" 321-368/8)",
         R"(912 "UNKNOWN"; 322 "10"; 938 "3040506")", 0x8},
        {"00 00 00 04", R"(
            912 |9 Error Causes| "    Cause Code" "    Cause Code=UNKNOWN" 289-304/8
            935 |10 Unknown Cause Code| "      Length" "      Length=4" 305-320/8)",
         R"(912 "UNKNOWN"; 322 "4")", 0},
    };
    for (const Cause &cause : causes) {
        for (const Octets &chunk : {abortChunk(cause.octets), errorChunk(cause.octets)}) {
            SCOPED_TRACE(hexText(chunk));
            const Runs runs = runAll(sctp(chunk));
            EXPECT_EQ(linesFrom(lines(runs.md), "912"), expected(cause.md));
            EXPECT_EQ(oneLine(linesFrom(lines(runs.to), "912")), cause.to);
            EXPECT_EQ(runs.mv.flags, cause.mvFlags);
            EXPECT_EQ(runs.md.flags, 0u);
        }
    }
}

TEST(SctpCauses, limitsOfAbort) {
    const std::vector<SctpCase> cases = {
        {"the second cause passes unread", abortChunk("00 03 00 08 00 00 00 01  00 03 00 08 00 00 00 02"),
         " 912 921 922", 0x18},
        {"the walk goes on after ABORT", abortChunk("00 01 00 08 00 07 00 00") + hex("0b 00 00 04"),
         " 912 914 915 916 805 892 808", 0x8},
        {"half a cause code", abortChunk("00"), "", 0x10},
        {"a cause code alone", abortChunk("00 07"), " 912"},
        {"an unknown one alone: what limits it counts as its octets", abortChunk("00 63"), " 912", 0x8},
        {"a Length alone where more should be", abortChunk("00 03 00 08"), " 912 921"},
        {"two types wanted, one there", abortChunk("00 02 00 0a 00 00 00 02 00 05"), " 912 917 918 920"},
        {"three wanted, one there", abortChunk("00 02 00 0a 00 00 00 03 00 05"), " 912 917 918 920", 0xa},
        {"a negative number of types", abortChunk("00 02 00 08 ff ff ff ff"), " 912 917 918", 0xa},
        {"no types", abortChunk("00 02 00 0a 00 00 00 00 00 05"), " 912 917 918", 0x18},
        {"an address longer than the chunk", abortChunk("00 05 00 10 01 02 03 04"), " 912 924", 0x10},
        {"a Length below 4", abortChunk("00 06 00 03"), " 912 926"},
        {"an address of no octet", abortChunk("00 05 00 04"), " 912 924 925"},
        {"octets that code 10 does not read", abortChunk("00 0a 00 08 01 02 03 04"), " 912 934", 0x18},
        {"an inner value that does not fit", abortChunk("00 08 00 0c c0 00 00 20 01 02 03 04"), " 912 929 863 864",
         0x10},
        {"an inner list longer than the chunk", abortChunk("00 08 00 20 c0 00 00 08 01 02 03 04"),
         " 912 929 863 864 865", 0x8},
        {"two inner parameters", abortChunk("00 08 00 0c c0 00 00 04 c0 01 00 04"), " 912 929 863 864 865 863 864 865"},
        {"a Length above the packet", hex("06 00 00 10"), "", 0x8},
        {"a Length of 0", hex("06 00 00 00  0b 00 00 04"), " 912 935", 0x8},
    };
    for (const SctpCase &one : cases) {
        checkCase(one, abortIds);
    }
}

// ERROR has no limit: the list goes on in the chunks after it as long as its last test held.
TEST(SctpCauses, errorReadsOn) {
    const Octets sack = hex("03 00 00 10  00 00 00 2a  00 00 10 00  00 00 00 00");
    const std::vector<SctpCase> cases = {
        {"a limit that does not fit ends the walk", errorChunk("00 01 00 08 00 07 00 00") + hex("0b 00 00 04"),
         " 912 914 915 916 912 935", 0x8},
        {"four octets of SACK as a cause", errorChunk("00 06 00 08 0f 00 00 04") + sack,
         " 912 926 927 912 935 805 814 815 816 808 817 818 819"},
        {"a failed test ends the list, not the walk", errorChunk("00 03 00 08") + hex("0b 00 00 04"),
         " 912 921 805 892 808"},
        {"no causes", errorChunk("") + hex("0b 00 00 04"), " 805 892 808"},
        {"a cause that ends the list", errorChunk("00 63 00 04") + hex("0b 00 00 04"), " 912 935 805 892 808"},
        {"code 8 ends it too", errorChunk("00 08 00 08 c0 00 00 04") + hex("0b 00 00 04"),
         " 912 929 863 864 865 805 892 808"},
        {"code 10 of Length 4 goes on once, with no octet", errorChunk("00 0a 00 04") + hex("0b 00 00 04"),
         " 912 934 805 892 808"},
        {"code 10 of Length 8 goes on with four",
         errorChunk("00 0a 00 08 61 62 63 64") + hex("00 0a 00 04 0b 00 00 04"), " 912 934 912 934 805 892 808", 0x10},
        {"errorOctets of the chunk is taken over and over",
         errorChunk("00 04 00 04") + hex("00 04 00 04  00 07 00 04  00 63 00 04  0b 00 00 04"),
         " 912 923 912 923 912 928 912 935 805 892 808"},
        {"a Length below 4", hex("09 00 00 03  0b 00 00 04"), " 912 935", 0x8},
    };
    for (const SctpCase &one : cases) {
        checkCase(one, errorIds);
    }
}

} // namespace
} // namespace netfloor::test
