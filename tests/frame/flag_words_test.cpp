// SPDX-License-Identifier: MIT
// The flag words of the elements: which fields clear them, and which leave what the host or an earlier field has put
// there. The host puts 90.
#include <algorithm>
#include <cstdint>
#include <functional>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "frame/bare_host.h"
#include "frame/example.h"

namespace netfloor::test {
namespace {

void fill(DecodeState &state) {
    std::for_each_n(state.fieldRecord.ranges, state.fieldRecord.rangeCapacity,
                    [](BitRange &range) { range.flagWord = 90; });
}

// Those of the elements of the last field, equal ones counted: "2x0 38x90".
std::string flagWords(const DecodeState &state) {
    const FieldRecord &record = state.fieldRecord;
    std::string text;
    for (std::uint32_t i = 0, same = 1; i < record.rangeCount; ++i, ++same) {
        if (i + 1 == record.rangeCount || record.ranges[i].flagWord != record.ranges[i + 1].flagWord) {
            text += (text.empty() ? "" : " ") + std::to_string(same) + 'x' + std::to_string(record.ranges[i].flagWord);
            same = 0;
        }
    }
    return text;
}

const Octets sctpHeader = hex("0b 59 0b 5a 00*8");

struct FieldCase {
    std::uint32_t id;
    Octets packet;
    const char *flagWords;
};

TEST(FlagWords, afterEachKindOfField) {
    const Octets padded = ipv6({.nextHeader = 60, .payload = hex("3b 00 01 04 00*4")});
    const std::vector<FieldCase> cases = {
        {167, padded, "3x0"},                                               // pieces
        {168, padded, "2x90"},                                              // octets
        {222, padded, "1x0"},                                               // a single octet
        {956, padded, "8x90"},                                              // an address in groups
        {958, padded, "32x0"},                                              // its nibbles
        {223, padded, ""},                                                  // read ahead
        {229, padded, "8x0"},                                               // a run of nibbles
        {201, ipv6({.nextHeader = 44, .payload = hex("3b 00*7")}), "4x90"}, // octets from the last to the first
        {643, ipv4({.protocol = 55, .payload = hex("11 00*7")}), "4x0"},    // nibbles of a checksum
        {856, ipv4({.protocol = 132, .payload = sctpHeader + hex("01 00 00 28 00*16 00 06 00 14 20*16")}), "8x0"},
    };
    for (const FieldCase &one : cases) {
        for (const Pass pass : {Pass::md, Pass::to}) {
            BareRun run(one.packet);
            std::string found = "not read";
            fill(run.state());
            run.afterCall = [&] {
                if (run.state().fieldRecord.fieldId == one.id) {
                    found = flagWords(run.state());
                }
                fill(run.state());
            };
            EXPECT_EQ(run.enter(pass), 1);
            EXPECT_EQ(found, one.flagWords) << one.id << ' ' << passName(pass);
        }
    }
}

struct LeftCase {
    const char *name;
    Octets packet;
    std::uint32_t rangeCapacity;
    bool ownerFills;
    const char *flagWords; // of the cookie that ends the packet
};

// A cookie is a row of octets, and shows what is left in its 40 elements. The host fills them at the start and at each
// growth.
TEST(FlagWords, leftToALaterField) {
    const Octets cookie = hex("0a 00 00 2c 77*40");
    const Octets data = hex("00 03 00 14 00*12 61*4");
    const std::vector<LeftCase> cases = {
        {"pieces", ipv4({.protocol = 132, .payload = sctpHeader + cookie}), 200, false, "2x0 38x90"},
        {"nibbles of addresses", ipv6({.nextHeader = 132, .payload = sctpHeader + cookie}), 200, false, "32x0 8x90"},
        {"growth", ipv6({.nextHeader = 132, .payload = sctpHeader + cookie}), 40, false, "40x90"},
        {"hand-off", ipv6({.nextHeader = 132, .payload = sctpHeader + data + cookie}), 200, false, "32x0 8x90"},
        {"hand-off to an owner that fills them", ipv6({.nextHeader = 132, .payload = sctpHeader + data + cookie}), 200,
         true, "1x0 39x90"},
    };
    for (const LeftCase &one : cases) {
        for (const Pass pass : allPasses) {
            BareRun *current = nullptr;
            StateOptions options;
            options.rangeCapacity = one.rangeCapacity;
            options.prepare = fill;
            options.allowGrowth = [&](std::size_t) {
                fill(current->state());
                return true;
            };
            BareRun run(one.packet, options);
            current = &run;
            run.xtr.byteAreaOffset = offsetof(KeyRoom, addresses);
            run.xtr.byteAreaSize = sizeof run.keys.addresses;
            run.nextLayer = [&] {
                if (one.ownerFills) {
                    fill(run.state());
                }
                return run.take(32);
            };
            EXPECT_EQ(run.enter(pass), 1);
            const bool stopped = pass == Pass::xtr && run.state().layerHandedOff == 1;
            EXPECT_EQ(flagWords(run.state()), stopped ? "4x0" : one.flagWords) << one.name << ' ' << passName(pass);
        }
    }
}

} // namespace
} // namespace netfloor::test
