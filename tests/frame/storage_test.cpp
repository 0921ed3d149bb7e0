// SPDX-License-Identifier: MIT
// Arrays that grow, and arrays that cannot grow.
#include <algorithm>
#include <array>
#include <iterator>
#include <string>
#include <string_view>
#include <vector>

#include <gtest/gtest.h>

#include "frame/bare_host.h"
#include "frame/example.h"

namespace netfloor::test {
namespace {

struct Request {
    std::size_t octets;
    std::size_t fieldsBefore;
    std::uint32_t cursor;
    std::string block, field;
};

// Runs a pass with room for one element in each array, and refuses the request of that number.
struct TightRun {
    static constexpr std::size_t never = 1000;

    TightRun(Pass thePass, std::size_t refused)
        : pass(thePass), run(examplePacket(), options(refused)), result(run.enter(pass)) {}

    StateOptions options(std::size_t refused) {
        StateOptions options;
        options.blockCapacity = options.limitCapacity = options.layerCapacity = options.rangeCapacity = 1;
        options.allowGrowth = [this, refused](std::size_t octets) {
            const DecodeState &state = run.state();
            requests.push_back({octets, run.seen.size(), state.cursor, state.blockName, state.fieldRecord.fieldName});
            return requests.size() - 1 != refused;
        };
        return options;
    }

    Pass pass;
    std::vector<Request> requests;
    BareRun run;
    std::int32_t result;
};

// F layer frames, B block starts, L limits, R ranges. Stacks and frames double, and start where the next index has
// no room; ranges get exactly the elements that a field needs, and get them anew when the field fills them.
constexpr std::string_view arrays = "FBBRRBRRRRRRLRRRRRB";
constexpr std::array<std::size_t, 19> octets = {112, 8,  16, 24, 24, 32, 24, 24, 24, 24,
                                                24,  48, 8,  48, 48, 48, 96, 96, 64};

// A pass that is cut off by missing storage leaves everything as it is.
TEST(Storage, eachGrowthThatFailsCutsThePassOff) {
    for (const Pass pass : allPasses) {
        TightRun whole(pass, TightRun::never);
        EXPECT_EQ(whole.result, 1);
        std::vector<std::size_t> asked;
        std::ranges::transform(whole.requests, std::back_inserter(asked), &Request::octets);
        ASSERT_EQ(asked, std::vector<std::size_t>(octets.begin(), octets.end()));
        TightRun md(Pass::md, TightRun::never);
        for (std::size_t refused = 0; refused < arrays.size(); ++refused) {
            SCOPED_TRACE(std::string(passName(pass)) + " without growth " + std::to_string(refused));
            TightRun cut(pass, refused);
            const DecodeState &state = cut.run.state();
            const Request &last = cut.requests.back();
            EXPECT_EQ(cut.result, 0);
            EXPECT_EQ(cut.requests.size(), refused + 1);
            EXPECT_EQ(state.flags, arrays[refused] == 'F'   ? NETFLOOR_FLAG_NO_LAYER_FRAMES
                                   : arrays[refused] == 'R' ? NETFLOOR_FLAG_NO_RANGES
                                                            : NETFLOOR_FLAG_NO_STACK);
            EXPECT_EQ(cut.run.contextBitsLeft(pass), 0xeeeeeeeeu);
            EXPECT_EQ(cut.run.context().layerInfoCount, 0u); // opened, not closed
            EXPECT_EQ(cut.run.context().layerNumber, 1);
            EXPECT_TRUE(cut.run.modes.empty());
            EXPECT_EQ(cut.run.seen.size(), whole.requests[refused].fieldsBefore);
            EXPECT_EQ(state.layerHandedOff, arrays[refused] == 'F' ? 1u : 0u);

            // All passes ask at the same place: the field that needs room has its name in the record already.
            EXPECT_EQ(state.cursor, md.requests[refused].cursor);
            EXPECT_EQ(last.cursor, md.requests[refused].cursor);
            EXPECT_EQ(last.block, md.requests[refused].block);
            EXPECT_EQ(last.field, md.requests[refused].field);
            if (arrays[refused] == 'R') {
                EXPECT_EQ(std::string(state.blockName), last.block);
                EXPECT_EQ(std::string(state.fieldRecord.fieldName), last.field);
                EXPECT_EQ(state.fieldRecord.value, 0u);
                EXPECT_EQ(state.fieldRecord.rangeCount, 0u);
            }
        }
        EXPECT_EQ(whole.requests[3].field, "Version");
        EXPECT_EQ(whole.requests[3].block, "Ip Header");
        EXPECT_EQ(whole.requests[14].field, "Fragment Offset");
        EXPECT_EQ(whole.requests[17].field, "Destination Address");
        EXPECT_EQ(whole.requests[18].block, "NEXT LAYER");
        EXPECT_EQ(whole.requests[18].field, "Checksum");
    }
}

TEST(Storage, layerFramesHaveRoomForOneMore) {
    for (const std::uint32_t capacity : {3u, 4u, 5u}) {
        std::vector<std::size_t> asked;
        StateOptions options;
        options.layerCapacity = capacity;
        options.cursor = 9;
        options.prepare = [](DecodeState &state) { state.layerIndex = 2; };
        options.allowGrowth = [&asked](std::size_t size) {
            asked.push_back(size);
            return true;
        };
        BareRun run(hex("00") + examplePacket(), options);
        EXPECT_EQ(run.enter(Pass::mv), 1);
        EXPECT_EQ(asked, capacity == 3 ? std::vector<std::size_t>{6 * sizeof(LayerFrame)} : std::vector<std::size_t>{});
        EXPECT_EQ(run.state().layerIndex, 3u);
        EXPECT_EQ(run.state().layerFrames[3].firstBit, 9u);
    }
}

} // namespace
} // namespace netfloor::test
