// SPDX-License-Identifier: MIT
// The field step: what the host can see at each call, and what remains after a run.
#include <algorithm>
#include <cstddef>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "frame/bare_host.h"
#include "frame/example.h"
#include "support/runs.h"

namespace netfloor::test {
namespace {

// Fills all that the plug-in must not write, or must overwrite only as far as a field reaches.
void seed(DecodeState &state) {
    state.reserved1 = 0x11;
    state.reserved2 = 0x22;
    state.condition = 1;
    state.advance = -5;
    std::fill_n(state.scratch, 32, 0x33);
    FieldRecord &record = state.fieldRecord;
    record.fieldId = 9999;
    std::copy_n("seed", 5, record.fieldName);
    std::copy_n("old", 4, record.valueText);
    record.value = 12345;
    record.rangeCount = 2;
    record.outputRangeCount = 3;
    record.wideStart = 0x44;
    record.wideBits = 0x55;
    record.rawFlag = 0x66;
    std::fill_n(record.untouched1, 2, 0x77);
    std::fill_n(record.untouched2, 2, 0x88);
    std::fill_n(record.ranges, record.rangeCapacity, BitRange{8, 8, 8, 90, {0x99, 0x99}});
}

StateOptions seeded() {
    StateOptions options;
    options.prepare = seed;
    return options;
}

const std::string &stateAt(const BareRun &run, std::uint32_t id) {
    return std::ranges::find(run.seen, id, &Seen::id)->state;
}

// The cursor is after the field already. A single or written-out element clears its flag word. The octets of a loop
// leave it as it was: 90 before each field.
TEST(FieldStep, whatTheHostSeesDuringACall) {
    const auto fill = [](BareRun &run) {
        std::for_each_n(run.state().fieldRecord.ranges, 200, [](BitRange &range) { range.flagWord = 90; });
    };
    BareRun md(examplePacket(), seeded());
    md.afterCall = [&] { fill(md); };
    EXPECT_EQ(md.enter(Pass::md), 1);
    ASSERT_EQ(md.seen.size(), 22u);
    const std::string states = stateAt(md, 150) + '\n' + stateAt(md, 152) + '\n' + stateAt(md, 286) + '\n' +
                               stateAt(md, 290) + '\n' + stateAt(md, 153) + '\n' + stateAt(md, 292) + '\n' +
                               stateAt(md, 294) + '\n' + stateAt(md, 295) + '\n' + stateAt(md, 159) + '\n' +
                               stateAt(md, 479) + '\n' + stateAt(md, 490) + '\n';
    EXPECT_EQ(states, expected(R"(
        cursor 1 left 344 advance 0 condition 1 block "Ip Header" field 150 "Version" value 4 ranges 1/1 4:5-8:0
        cursor 9 left 336 advance 8 condition 1 block "IPv4 Header" field 152 "Internet Header Length" value 5 ranges 1/1 5:1-4:0
        cursor 9 left 336 advance 0 condition 1 block "Type of Service" field 286 "Precedence" value 5 ranges 1/1 5:14-16:0
        cursor 17 left 328 advance 8 condition 1 block "Type of Service" field 290 "Reserved" value 3 ranges 1/1 3:9-10:0
        cursor 33 left 312 advance 16 condition 1 block "IPv4 Header" field 153 "Total Length" value 40 ranges 2/2 0:17-24:90 40:25-32:90
        cursor 49 left 272 advance 0 condition 1 block "Flag and Fragment Offset" field 292 "DF" value 1 ranges 1/1 1:55-55:0
        cursor 65 left 256 advance 16 condition 1 block "Flag and Fragment Offset" field 294 "Fragment Offset" value 1480 ranges 2/2 0:49-53:0 185:57-64:0
        cursor 81 left 240 advance 8 condition 1 block "Protocol" field 295 "Protocol" value 17 ranges 1/1 17:73-80:0
        cursor 129 left 192 advance 32 condition 1 block "Extra" field 159 "Source Address" value 167772161 ranges 4/4 10:97-104:90 0:105-112:90 0:113-120:90 1:121-128:90
        cursor 177 left 144 advance 16 condition 1 block "User Datagram Protocol" field 479 "UDP Source Port" value 53 ranges 2/2 0:161-168:0 53:169-176:0
        cursor 225 left 96 advance 16 condition 1 block "" field 490 "Checksum" value 48879 ranges 2/2 190:209-216:0 239:217-224:0
    )"));

    BareRun to(examplePacket(), seeded());
    to.afterCall = [&] { fill(to); };
    EXPECT_EQ(to.enter(Pass::to), 1);
    ASSERT_EQ(to.seen.size(), md.seen.size());
    for (std::size_t i = 0; i < md.seen.size(); ++i) {
        EXPECT_EQ(to.seen[i].state, md.seen[i].state);
        EXPECT_EQ(md.seen[i].bitOrder, 0u);
    }
}

TEST(FieldStep, whatRemainsAfterARun) {
    for (const Pass pass : allPasses) {
        SCOPED_TRACE(passName(pass));
        BareRun run(examplePacket(), seeded());
        const std::string last = "field 490 \"Checksum\" value 48879 ranges 2/2 190:209-216:0 239:217-224:0";
        std::string atHandOff;
        run.nextLayer = [&] {
            atHandOff = describe(run.state());
            return run.take(96);
        };
        EXPECT_EQ(run.enter(pass), 1);
        const DecodeState &state = run.state();
        atHandOff = pass == Pass::xtr ? describe(state) : atHandOff;
        EXPECT_EQ(atHandOff.substr(atHandOff.find("block")), "block \"NEXT LAYER\" " + last);
        EXPECT_EQ(describe(state).substr(describe(state).find("field")), last);
        EXPECT_EQ(run.seen.empty(), pass == Pass::mv || pass == Pass::xtr);
        EXPECT_EQ(hexText({state.data, examplePacket().size()}), hexText(examplePacket()));

        const FieldRecord &record = state.fieldRecord;
        EXPECT_EQ(record.rawFlag, 0u);
        EXPECT_EQ(record.wideStart + record.wideBits, 0x44u + 0x55u);
        EXPECT_EQ(record.untouched1[0] + record.untouched1[1], 2 * 0x77u);
        EXPECT_EQ(record.untouched2[0] + record.untouched2[1], 2 * 0x88u);
        EXPECT_EQ(record.ranges[0].untouched[0] + record.ranges[1].untouched[1], 2 * 0x99u);
        EXPECT_EQ(state.reserved1 + state.reserved2, 0x33u);
        EXPECT_EQ(std::ranges::count(state.scratch, 0x33u), 29); // all but the three that the hand-off writes
    }
}

// Elements are used again, and keep what a field wrote until another field needs them: after the two elements of the
// last field comes the end of the destination address.
// The other two passes write the record for the last field alone. The elements past its own are undefined there.
TEST(FieldStep, elementsKeepWhatWasReadIntoThem) {
    for (const Pass pass : {Pass::md, Pass::to}) {
        BareRun run(examplePacket(), seeded());
        EXPECT_EQ(run.enter(pass), 1);
        run.state().fieldRecord.rangeCount = 5;
        const std::string text = describe(run.state());
        EXPECT_EQ(text.substr(text.find("239:")), "239:217-224:0 0:145-152:90 2:153-160:90 8:8-8:90") << passName(pass);
    }
}

TEST(FieldStep, fieldThatDoesNotFitLeavesTheRecord) {
    for (const Pass pass : allPasses) {
        for (std::uint32_t bits = 0; bits < 8; ++bits) {
            StateOptions options = seeded();
            options.totalBits = bits;
            BareRun run(hex("45"), options);
            EXPECT_EQ(run.enter(pass), 1);
            EXPECT_EQ(describe(run.state()), "cursor 1 left " + std::to_string(bits) +
                                                 " advance -5 condition 0 block \"Ip Header\" field 9999 \"seed\" "
                                                 "value 12345old ranges 2/3 8:8-8:90 8:8-8:90");
            EXPECT_EQ(run.contextBitsLeft(pass), bits);
            EXPECT_EQ(run.state().flags, 0u);
            EXPECT_TRUE(run.seen.empty());
        }
    }
}

// Where a field without a test of the bits left lies past the packet, it is a field that does not fit.
TEST(FieldStep, fieldPastThePacketClearsTheCondition) {
    const std::vector<Octets> cases = {
        hex("60 00 00 00 00 00 3b 40 01 02 03 04 05 06 07 08 09 0a 0b 0c 0d 0e 0f 10 11 12 13 14 15 16 17 18"
            "19 1a 1b 1c 1d 1e"),                             // two octets of the destination are missing
        ipv6({.nextHeader = 43, .payload = hex("3b 00")}),    // routing type
        ipv6({.nextHeader = 0, .payload = hex("3b 00 ")}),    // option type
        ipv6({.nextHeader = 43, .payload = hex("3b 00 01")}), // segments left
    };
    for (const Octets &packet : cases) {
        for (const Pass pass : allPasses) {
            BareRun run(packet, seeded());
            run.xtr.byteAreaOffset = offsetof(KeyRoom, addresses);
            run.xtr.byteAreaSize = sizeof run.keys.addresses;
            EXPECT_EQ(run.enter(pass), 1);
            EXPECT_EQ(run.state().condition, 0) << passName(pass) << " over " << hexText(packet);
        }
    }
}

// After the last turn of a round of options, and where the next one is cut, nothing is peeked: the record is that of
// the last field.
TEST(FieldStep, recordAfterTheLastOption) {
    const Octets ended = ipv4({.protocol = 17, .payload = hex("61"), .options = hex("01 01 01 00")});
    const Octets cut = ipv6({.nextHeader = 6, .payload = hex("0035 9c40 00*8 60 10 00*6 02 ff"), .payloadLength = 23});
    for (const Pass pass : allPasses) {
        BareRun round(ended);
        EXPECT_EQ(round.enter(pass), 1);
        EXPECT_EQ(round.state().fieldRecord.fieldId, 381u);
        EXPECT_EQ(round.state().fieldRecord.value, 0u) << passName(pass);
        StateOptions options;
        options.totalBits = static_cast<std::uint32_t>(8 * cut.size() - 1); // of the option's length
        BareRun run(cut, options);
        run.xtr.byteAreaOffset = offsetof(KeyRoom, addresses);
        run.xtr.byteAreaSize = sizeof run.keys.addresses;
        EXPECT_EQ(run.enter(pass), 1);
        EXPECT_EQ(run.state().fieldRecord.fieldId, 408u) << passName(pass);
    }
}

// Where a lower layer has changed the working copy, a reversed address restores it from the source, before and after
// the address as well: the second parameter is of type 6 again, and not of type 0x1006.
TEST(FieldStep, reversedAddressRestoresTheWorkingCopy) {
    const Octets packet = ipv4({.protocol = 132, .payload = hex(R"(
        0b 59 0b 5a 00 00 00 2a 00 00 00 00   # SCTP
        01 00 00 3c 00 00 00 01 00 00 00 00   # INIT, tag, window
        00 01 00 01 00 00 00 01               #   streams, initial TSN
        00 06 00 14 20*16                     # IPv6 addresses
        00 06 00 14 30*16
    )")});
    StateOptions options;
    options.prepare = [](DecodeState &state) {
        state.data[8] = 1; // Time to Live
        state.data[72] = 0x10;
    };
    for (const Pass pass : allPasses) {
        SCOPED_TRACE(passName(pass));
        BareRun run(packet, options);
        EXPECT_EQ(run.enter(pass), 1);
        EXPECT_EQ(run.state().fieldRecord.fieldId, 856u);
        EXPECT_EQ(run.state().fieldRecord.value, 0x30303030u);
        EXPECT_EQ(hexText({run.state().data, packet.size()}), hexText(packet));
    }
}

// Where an address of reversed bits ends inside the last octet, of which the packet has only some bits, that octet is
// not reversed: so the address shows it reversed.
TEST(FieldStep, reversedAddressThatEndsInsideAnOctet) {
    const Octets packet = ipv4({.protocol = 132, .payload = hex(R"(
        0b 59 0b 5a 00*8 01 00 00 28 00*16
        00 06 00 14 30*15 35
    )")});
    for (const Pass pass : allPasses) {
        for (unsigned shift = 0; shift < 8; ++shift) {
            StateOptions options;
            options.cursor = 1 + shift;
            options.totalBits = shift + 8 * static_cast<std::uint32_t>(packet.size());
            const Octets moved = shift == 0 ? packet : shifted(packet, shift);
            BareRun run(moved, options);
            EXPECT_EQ(run.enter(pass), 1);
            EXPECT_EQ(run.state().fieldRecord.fieldId, 856u);
            EXPECT_EQ(run.state().fieldRecord.value, shift == 0 ? 0x30303035u : 0x303030acu) << passName(pass) << shift;
            EXPECT_EQ(run.state().fieldRecord.ranges[7].value, shift == 0 ? 0x3035u : 0x30acu) << passName(pass);
            EXPECT_EQ(hexText({run.state().data, moved.size()}), hexText(moved));
        }
    }
}

struct CutCase {
    std::uint32_t bits;
    std::size_t fields;
    std::uint32_t cursor;
};

// The first field of an octet needs all of it, though later ones need less.
TEST(FieldStep, packetThatEndsInsideAnOctet) {
    const std::vector<CutCase> cases = {{8, 2, 9},   {9, 2, 9},   {15, 2, 9},   {16, 7, 17},
                                        {31, 7, 17}, {32, 8, 33}, {319, 8, 33}, {320, 22, 321}};
    for (const CutCase &cut : cases) {
        SCOPED_TRACE(std::to_string(cut.bits) + " bits");
        StateOptions options;
        options.totalBits = cut.bits;
        BareRun run(examplePacket(), options);
        EXPECT_EQ(run.enter(Pass::md), 1);
        EXPECT_EQ(run.seen.size(), cut.fields);
        EXPECT_EQ(run.state().cursor, cut.cursor);
        EXPECT_EQ(run.contextBitsLeft(Pass::md), cut.bits + 1 - cut.cursor);
    }
}

TEST(FieldStep, smallStack) {
    onSmallStack([] { runAll(examplePacket()); });
}

struct DateCase {
    std::uint32_t seconds;
    const char *text;
};

TEST(DateConv, appendsTheTimeOfTheFieldRecord) {
    const std::vector<DateCase> cases = {
        {0, "1970-01-01 00:00:00"},          {59, "1970-01-01 00:00:59"},         {86399, "1970-01-01 23:59:59"},
        {68169599, "1972-02-28 23:59:59"},   {951782400, "2000-02-29 00:00:00"},  {978307199, "2000-12-31 23:59:59"},
        {1709164800, "2024-02-29 00:00:00"}, {2147483647, "2038-01-19 03:14:07"}, {2147483648, "2038-01-19 03:14:08"},
        {4107542400, "2100-03-01 00:00:00"}, {4294967295, "2106-02-07 06:28:15"},
    };
    const auto dateConv = sharedHost().library().dateConv();
    for (const DateCase &date : cases) {
        DecodeState state = {};
        state.fieldRecord.value = date.seconds;
        std::array<char, 24> text = {'a', 't', ' '};
        EXPECT_EQ(dateConv(text.data(), reinterpret_cast<void *>(1), &state), text.data());
        EXPECT_EQ(std::string(text.data()), std::string("at ") + date.text);
    }
}

} // namespace
} // namespace netfloor::test
