// SPDX-License-Identifier: MIT
// The options of an IPv4 header (RFC 791, 1108).
#include <algorithm>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "support/listings.h"

namespace netfloor::test {
namespace {

std::ptrdiff_t count(const Runs &runs, std::string_view id) {
    return std::ranges::count(linesWith(lines(runs.md), id), '\n');
}

const Octets &withMostTypes() {
    static const Octets packet = ipv4({.options = hex(R"(
        01                                  # all in the order of one round
        82 0b 6b c5 00 00 0a bc 01 02 03
        83 07 04 0a 00 00 01
        89 07 08 0a 00 00 02
        07 07 0c ff 00 ff 03
        88 04 01 23
        00
        aa bb
    )")});
    return packet;
}

TEST(Ipv4Options, everyFieldInEveryPass) {
    const Runs runs = runAll(withMostTypes());
    EXPECT_EQ(fieldLines(runs, 160), expected(R"x(
        318 |7 Type1| "Type1, No Operation" "Type1, No Operation" 161-168 > 318 "1"
        321 |7 Type130| "Type130, Security" "Type130, Security" 169-176 > 321 "130"
        322 |7 Type130| "Length" "Length=11 octets" 177-184 > 322 "11 octets"
        325 |7 Type130| "Security (S Field)" "Security (S Field)=Top Secret" 185-200 > 325 "Top Secret"
        326 |7 Type130| "Compartments (C Field)" "Compartments (C Field)=the information transmitted is not compartmented" 201-216/8 > 326 "the information transmitted is not compartmented"
        327 |7 Type130| "Handling Restrictions (H Field)" "Handling Restrictions (H Field)=abc" 217-232/8 > 327 "abc"
        328 |7 Type130| "Transmission Control Code (TCC Field)" "Transmission Control Code (TCC Field)=10203" 233-256/8 > 328 "10203"
        329 |7 Type131| "Type131, Loose Source and Record Route" "Type131, Loose Source and Record Route" 257-264 > 329 "131"
        330 |7 Type131| "Length" "Length=7 octets" 265-272 > 322 "7 octets"
        333 |7 Type131| "Pointer" "Pointer=4(th) octet" 273-280 > 333 "4(th) octet"
        336 |7 Type131| "Route Data" "Route Data=10.0.0.1" 281-312/8 > 336 "10.0.0.1"
        339 |7 Type137| "Type137, Strict Source and Record Route" "Type137, Strict Source and Record Route" 313-320 > 339 "137"
        340 |7 Type137| "Length" "Length=7 octets" 321-328 > 322 "7 octets"
        343 |7 Type137| "Pointer" "Pointer=8(th) octet" 329-336 > 333 "8(th) octet"
        346 |7 Type137| "Route Data" "Route Data=10.0.0.2" 337-368/8 > 336 "10.0.0.2"
        348 |7 Type7| "Type7, Record Route" "Type7, Record Route" 369-376 > 348 "7"
        349 |7 Type7| "Length" "Length=7 octets" 377-384 > 322 "7 octets"
        352 |7 Type7| "Pointer" "Pointer=12(th) octet" 385-392 > 333 "12(th) octet"
        355 |7 Type7| "Route Data" "Route Data=255.0.255.3" 393-424/8 > 336 "255.0.255.3"
        357 |7 Type136| "Type136, Stream Identifier" "Type136, Stream Identifier" 425-432 > 357 "136"
        358 |7 Type136| "Length" "Length=4 octets" 433-440 > 322 "4 octets"
        361 |7 Type136| "Stream ID" "Stream ID=123" 441-456/8 > 361 "123"
        381 |7 | "End Of Option Part" "End Of Option Part" 457-464 > 381 "0"
        306 |5 Options| "Padding" "Padding=aabb" 465-480/8 > 306 "aabb"
    )x"));
    EXPECT_EQ(verdictLine(runs.mv), "verdict 0 flags 0x0\n");
}

TEST(Ipv4Options, timestampsOfEachForm) {
    const Runs runs = runAll(ipv4({.options = hex(R"(
        44 14 15 21                               # overflow 2; with addresses
        0a 00 00 01 00 00 00 0f 0a 00 00 02 80 00 00 00
        44 08 05 f0 00 00 00 01                   # without, in a second round
        44 0c 05 03 0a 00 00 03 00 00 00 02       # with addresses that show as time stamps
    )")}));
    EXPECT_EQ(fieldLines(runs, 160), expected(R"x(
        362 |7 Type68| "Type68, Internet Timestamp" "Type68, Internet Timestamp" 161-168 > 362 "68"
        363 |7 Type68| "Length" "Length=20 octets" 169-176 > 322 "20 octets"
        366 |7 Type68| "Pointer" "Pointer=21(th) octet" 177-184 > 333 "21(th) octet"
        367 |7 Type68| "Overflow" "Overflow=2" 189-192 > 367 "2"
        368 |7 Type68| "Flag" "Flag=each timestamp is preceded with internet address of the registering entity" 185-188 > 368 "each timestamp is preceded with internet address of the registering entity"
        378 |9 INLINE BLOCK| "Internet Address" "Internet Address=10.0.0.1" 193-224/8 > 378 "10.0.0.1"
        380 |9 INLINE BLOCK| "Timestamp" "Timestamp=f" 225-256/8 > 372 "f"
        378 |9 INLINE BLOCK| "Internet Address" "Internet Address=10.0.0.2" 257-288/8 > 378 "10.0.0.2"
        380 |9 INLINE BLOCK| "Timestamp" "Timestamp=80000000" 289-320/8 > 372 "80000000"
        362 |8 Type68| "Type68, Internet Timestamp" "Type68, Internet Timestamp" 321-328 > 362 "68"
        363 |8 Type68| "Length" "Length=8 octets" 329-336 > 322 "8 octets"
        366 |8 Type68| "Pointer" "Pointer=5(th) octet" 337-344 > 333 "5(th) octet"
        367 |8 Type68| "Overflow" "Overflow=15" 349-352 > 367 "15"
        368 |8 Type68| "Flag" "Flag=time stamps only, stored in consecutive 32-bit words" 345-348 > 368 "time stamps only, stored in consecutive 32-bit words"
        372 |9 INLINE BLOCK| "Timestamp" "Timestamp=1" 353-384/8 > 372 "1"
        362 |9 Type68| "Type68, Internet Timestamp" "Type68, Internet Timestamp" 385-392 > 362 "68"
        363 |9 Type68| "Length" "Length=12 octets" 393-400 > 322 "12 octets"
        366 |9 Type68| "Pointer" "Pointer=5(th) octet" 401-408 > 333 "5(th) octet"
        367 |9 Type68| "Overflow" "Overflow=0" 413-416 > 367 "0"
        368 |9 Type68| "Flag" "Flag=the internet address fields are prespecified" 409-412 > 368 "the internet address fields are prespecified"
        372 |10 INLINE BLOCK| "Timestamp" "Timestamp=a000003" 417-448/8 > 372 "a000003"
        372 |10 INLINE BLOCK| "Timestamp" "Timestamp=2" 449-480/8 > 372 "2"
    )x"));
    EXPECT_EQ(runs.mv.flags, 0u);
}

struct OptionsCase {
    const char *octets;
    std::uint32_t flagsOfMv;
    const char *values; // 285: the payload, 61 62
};

TEST(Ipv4Options, lengthsAndOrders) {
    const std::vector<OptionsCase> cases = {
        {"01 01 00 00", 0, "318=1 318=1 381=0 306=0 285=61 285=62"},
        // In packet order, although the types are tried in another order.
        {"07 07 04 01 02 03 04 82 04 00 00 00", 0,
         "348=7 349=7 352=4 355=1020304 321=82 322=4 325=0 381=0 285=61 285=62"},
        // An unknown type ends the list.
        {"94 04 01 01", 0, "306=94040101 285=61 285=62"},
        {"01 94 04 01", 0, "318=1 306=940401 285=61 285=62"},
        // So does a length that leaves no room for itself. The octet read is not counted, so that the padding
        // takes an octet of the payload.
        {"82 00 00 00", 0, "306=82000000 285=61 285=62"},
        {"82 01 00 00", 2, "321=82 306=1000061 285=62"},
        // Too short for the option's own fields.
        {"83 03 04 00", 0, "329=83 330=3 333=4 381=0 285=61 285=62"},
        {"89 06 04 01 02 03 01 01", 0x10, "339=89 340=6 343=4 318=1 318=1 285=61 285=62"},
        {"82 06 35 f1 00 02 01 01", 0, "321=82 322=6 325=f135 326=2 318=1 318=1 285=61 285=62"},
        {"88 03 ff 00", 0x10, "357=88 358=3 381=0 285=61 285=62"},
        {"44 03 05 00", 0, "362=44 363=3 366=5 381=0 285=61 285=62"},
        {"44 0a 05 01 c0 a8 00 01 00 00 01 01", 0x10,
         "362=44 363=a 366=5 367=0 368=1 378=c0a80001 318=1 318=1 285=61 285=62"},
        // A flag without a form.
        {"44 08 05 12 00 00 00 01", 0x10, "362=44 363=8 366=5 367=1 368=2 285=61 285=62"},
        // Longer than the area: what it takes of the payload is missing there.
        {"88 05 12 34", 0x12, "357=88 358=5 361=1234 285=62"},
        // Longer than the packet: read as far as it goes, and nothing past its end.
        {"83 ff 04 0a 00 00 01 01", 0x18, "329=83 330=ff 333=4 336=a000001"},
    };
    for (const OptionsCase &one : cases) {
        SCOPED_TRACE(one.octets);
        const Runs runs = runAll(ipv4({.payload = hex("61 62"), .options = hex(one.octets)}));
        EXPECT_EQ(fieldValues(runs.md, 160), one.values);
        EXPECT_EQ(runs.md.flags, 0u);
        EXPECT_EQ(runs.mv.flags, one.flagsOfMv);
    }
}

// At most 20 elements, also with a greater length, which reaches into the payload here.
TEST(Ipv4Options, boundOfEachRepeat) {
    const Runs route = runAll(ipv4({.payload = hex("61*84"), .options = hex("83 57 04 00")}));
    EXPECT_EQ(count(route, "336"), 20);
    EXPECT_EQ(count(route, "285"), 1);
    const Runs stamps = runAll(ipv4({.payload = hex("61*84"), .options = hex("44 58 05 00")}));
    EXPECT_EQ(count(stamps, "372"), 20);
    const Runs pairs = runAll(ipv4({.payload = hex("61*168"), .options = hex("44 ac 05 01")}));
    EXPECT_EQ(count(pairs, "378"), 20);
    EXPECT_EQ(count(pairs, "380"), 20);
    for (const Runs *runs : {&route, &stamps, &pairs}) {
        EXPECT_EQ(runs->md.flags, 0u);
        EXPECT_EQ(runs->mv.flags, 0x12u);
    }
}

TEST(Ipv4Options, packetThatEndsInThem) {
    expectValues(160,
                 {
                     {"neither padding nor payload", ipv4({.payload = hex("61*39"), .headerWords = 15}), "", 0, 0x10},
                     // The types after the last option of the area are still tried in its round: on the payload.
                     {"end of the list in the payload", ipv4({.payload = hex("00 62"), .options = hex("88 04 12 34")}),
                      "357=88 358=4 361=1234 381=0 285=62", 0, 2},
                 });
}

} // namespace
} // namespace netfloor::test
