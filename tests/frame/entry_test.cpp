// SPDX-License-Identifier: MIT
// Start and end of the entries: frames, layer records, the verdict, and packets that are no IP.
#include <algorithm>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "frame/bare_host.h"
#include "frame/example.h"
#include "support/runs.h"

namespace netfloor::test {
namespace {

std::string layerText(const BareRun &run, std::uint32_t count) {
    std::string text;
    for (std::uint32_t i = 0; i < count; ++i) {
        const LayerInfoRecord &layer = run.layerInfo[i];
        text += std::to_string(layer.layerNumber) + " of " + std::to_string(layer.decoderId) + ": " +
                std::to_string(layer.firstBit) + '-' + std::to_string(layer.lastBit) + '\n';
    }
    return text;
}

TEST(Entry, readsNoOtherVersion) {
    for (unsigned version = 0; version < 16; ++version) {
        if (version == 4 || version == 6) {
            continue;
        }
        const Runs runs = runAll(Octets{static_cast<std::uint8_t>(version << 4 | 5)} + hex("ff*70"));
        const std::string number = std::to_string(version);
        EXPECT_EQ(lines(runs.md), "150 |2 Ip Header| \"Version\" \"Version=" + number + "\" 5-8\n");
        EXPECT_EQ(lines(runs.to), "150 \"" + number + "\"\n");
        EXPECT_EQ(lines(runs.xtr), "row 0 Version=" + number + '\n');
        EXPECT_EQ(lines(runs.mv), "verdict 0 flags 0x0\n");
        EXPECT_EQ(layerLines(runs.md), "layer 1 of 1: 1-0\n");
        EXPECT_EQ(runs.md.cursor, 1u);
        EXPECT_EQ(runs.md.bitsLeft, 71 * 8u);
        EXPECT_FALSE(runs.md.layerHandedOff);
    }
}

// The first layer uses the current frame; a later one takes the next. All words of the frame are cleared.
TEST(Entry, opensALayerFrame) {
    for (const Pass pass : allPasses) {
        for (const bool first : {true, false}) {
            StateOptions options;
            options.cursor = first ? 1 : 33;
            options.prepare = [](DecodeState &state) {
                std::fill_n(reinterpret_cast<std::uint32_t *>(state.layerFrames), 3 * 14, 0xee);
            };
            BareRun run((first ? Octets() : hex("ff*4")) + examplePacket(), options);
            run.nextLayer = [] { return -1; };
            run.enter(pass);
            const DecodeState &state = run.state();
            EXPECT_EQ(state.layerIndex, first ? 0u : 1u);
            const LayerFrame &frame = state.layerFrames[state.layerIndex];
            EXPECT_EQ(frame.firstBit, options.cursor);
            EXPECT_EQ(std::ranges::count(frame.cleared1, 0u), 10);
            EXPECT_EQ(frame.nextLayerKey, 53u);
            EXPECT_EQ(frame.nextLayerProtocol, 17u);
            EXPECT_EQ(frame.cleared2, 0u);
            EXPECT_EQ(state.layerHandedOff, 1u);
            EXPECT_EQ(state.layerFrames[first ? 1 : 0].firstBit, 0xeeu);
        }
    }
}

// The bits left are counted up to the end of the outer limit, and not from `bitsLeft` at the entry.
TEST(Entry, bitsLeftComeFromTheLimits) {
    for (const Pass pass : allPasses) {
        StateOptions options;
        options.prepare = [](DecodeState &state) { state.bitsLeft = 168; };
        BareRun run(ipv4({.protocol = 253, .payload = hex("61")}) + hex("74*9"), options);
        EXPECT_EQ(run.enter(pass), 1);
        EXPECT_EQ(run.contextBitsLeft(pass), 72u);
        BareRun cut(ipv4({.protocol = 253, .payload = hex("61 62")}) + hex("74*9"), options);
        EXPECT_EQ(cut.enter(pass), 1);
        EXPECT_EQ(cut.contextBitsLeft(pass), 168u - 32u); // a length that the lower layer does not allow
    }
}

TEST(Entry, leavesTheStacksBalanced) {
    struct Case {
        Octets packet;
        const char *lastName;
        std::uint32_t blockPushes;
    };
    const std::vector<Case> cases = {
        {hex("75"), "Ip Header", 2},
        {hex("45"), "Type of Service", 4},
        {hex("45 00 00"), "Type of Service", 4},
        {hex("45 00 00 28"), "IPv4 Header", 4},
        {ipv4({.protocol = 17}), "User Datagram Protocol", 5},
        {ipv4({.protocol = 17, .payload = udp(1, 1)}), "", 6},
        {examplePacket(), "NEXT LAYER", 8},
    };
    for (const Case &one : cases) {
        for (const Pass pass : passesThatHandOn) {
            BareRun run(one.packet);
            EXPECT_EQ(run.enter(pass), 1);
            EXPECT_EQ(run.state().blockName, std::string(one.lastName));
            EXPECT_EQ(run.state().blockStarts.count, one.blockPushes); // at the last push
            EXPECT_EQ(stackText(run.state().blockStarts), "1");
            EXPECT_EQ(stackText(run.state().limits), std::to_string(8 * one.packet.size()));
        }
    }
}

TEST(Entry, layerRecordsOfMdAndToAlone) {
    for (const Pass pass : passesThatHandOn) {
        SCOPED_TRACE(passName(pass));
        BareRun run(examplePacket());
        run.context().layerNumber = 255;
        run.context().layerInfoCount = 2;
        run.context().layerInfoCapacity = 1;
        run.nextLayer = [&run] { return run.take(32); };
        EXPECT_EQ(run.enter(pass), 1);
        EXPECT_EQ(run.context().layerNumber, 0); // it counts on modulo 256
        EXPECT_EQ(run.context().decoderId, 7u);
        if (pass == Pass::mv) {
            EXPECT_EQ(run.context().layerInfoCount, 2u);
            EXPECT_EQ(run.layerInfoGrowths, 0u);
        } else {
            EXPECT_EQ(layerText(run, run.context().layerInfoCount), "0 of 0: 0-0\n0 of 0: 0-0\n"
                                                                    "255 of 7: 1-224\n0 of 7: 257-320\n");
            EXPECT_EQ(run.layerInfoGrowths, 2u); // at the entry and after the hand-off
        }
    }
    BareRun room(examplePacket());
    room.context().layerInfoCapacity = 1;
    EXPECT_EQ(room.enter(Pass::md), 1);
    EXPECT_EQ(room.layerInfoGrowths, 0u); // the capacity is the highest index
}

TEST(Entry, headsOfFieldRecordsInMdAlone) {
    for (const Pass pass : passesThatHandOn) {
        BareRun run(examplePacket());
        run.context().layerNumber = 9;
        EXPECT_EQ(run.enter(pass), 1);
        Octets written(run.fieldRecords.size(), 0xee);
        for (std::size_t i = 0; pass == Pass::md && i < run.seen.size(); ++i) {
            written[1000 * i] = 9;
            written[1000 * i + 1] = 0;
            written[1000 * i + 2] = 0;
        }
        EXPECT_TRUE(run.fieldRecords == written) << passName(pass);
    }
}

TEST(Entry, verdictGoesByTheFlags) {
    for (const std::uint32_t flag : {0x1u, 0x2u, 0x8u, 0x10u, 0x8000u, 0x40000000u, 0x80000000u}) {
        for (const Octets &packet : {Octets(), hex("45"), examplePacket()}) {
            StateOptions options;
            options.flags = flag; // by a layer before
            for (const Pass pass : allPasses) {
                BareRun run(packet, options);
                EXPECT_EQ(run.enter(pass), 1);
                EXPECT_EQ(run.context().verdict, pass == Pass::mv ? -52 : 1) << passName(pass);
                EXPECT_EQ(run.state().flags, flag);
            }
        }
    }
    BareRun clean(examplePacket());
    EXPECT_EQ(clean.enter(Pass::mv), 1);
    EXPECT_EQ(clean.context().verdict, 1); // the host clears it, not the plug-in
}

} // namespace
} // namespace netfloor::test
