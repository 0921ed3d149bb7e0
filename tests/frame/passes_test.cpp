// SPDX-License-Identifier: MIT
// The passes leave the same state, although two of them defer their writes until the host can read the state.
#include <algorithm>
#include <array>
#include <cstddef>
#include <random>
#include <sstream>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "frame/bare_host.h"
#include "frame/example.h"
#include "support/corpus.h"

namespace netfloor::test {
namespace {

// Up to the element that a stack which is about to grow has no room for.
std::string elementsOf(BitStack stack) {
    stack.top = std::min(stack.top, stack.base + stack.capacity - 1);
    return stackText(stack) + " counted " + std::to_string(stack.count);
}

// Without the flags, of which the MV pass raises more, and without what no field has written in elements that the host
// has not set up.
std::string leftIn(const DecodeState &state, std::uint32_t elementsSetUp) {
    const FieldRecord &record = state.fieldRecord;
    std::ostringstream out;
    out << describeField(state);
    for (std::uint32_t i = 0; i < record.rangeCount; ++i) {
        const BitRange &range = record.ranges[i];
        out << ' ' << range.value;
        if (i < elementsSetUp) {
            out << ':' << range.firstBit << '-' << range.lastBit << ':' << range.flagWord;
        }
    }
    out << " wide " << record.wideStart << '+' << record.wideBits << " blocks " << elementsOf(state.blockStarts)
        << " limits " << elementsOf(state.limits);
    for (const std::uint32_t word : state.scratch) {
        out << ' ' << word;
    }
    out << ' ' << hexText({state.data, state.totalBits / 8});
    return out.str();
}

struct Left {
    std::string atHandOff;              // the first one
    std::vector<std::string> atGrowths; // up to that
    bool cutOff = false;                // by the last of them
    std::string atEnd;
};

// The growth of the number `refused` fails.
Left leftBehind(Pass pass, const Octets &packet, StateOptions options, std::size_t refused) {
    Left left;
    BareRun *current = nullptr;
    options.prepare = [](DecodeState &state) {
        std::fill_n(state.fieldRecord.ranges, state.fieldRecord.rangeCapacity, BitRange{8, 8, 8, 90, {}});
    };
    options.allowGrowth = [&](std::size_t) {
        if (left.atHandOff.empty()) {
            left.atGrowths.push_back(leftIn(current->state(), options.rangeCapacity));
            left.cutOff = left.atGrowths.size() == refused;
        }
        return left.atGrowths.size() != refused || !left.atHandOff.empty();
    };
    BareRun run(packet, options);
    current = &run;
    run.xtr.byteAreaOffset = offsetof(KeyRoom, addresses);
    run.xtr.byteAreaSize = sizeof run.keys.addresses;
    run.nextLayer = [&] {
        left.atHandOff = left.atHandOff.empty() ? leftIn(run.state(), options.rangeCapacity) : left.atHandOff;
        return run.take(run.state().bitsLeft);
    };
    const std::int32_t result = run.enter(pass);
    EXPECT_EQ(result, left.cutOff ? 0 : 1);
    left.atEnd = leftIn(run.state(), options.rangeCapacity);
    return left;
}

// Every field, and what is handed off.
std::vector<Octets> packets() {
    std::vector<Octets> all = packetsOfAllFields();
    const Octets segment = hex("9c 40 c3 50 00 00 00 01 00 00 00 02 80 18 01 f6 00 00 00 00") +
                           hex("01 01 08 0a 3b 9a ca 00 3b 9a c9 ff 61*8");
    const Octets datagram = udp(53, 40000, hex("61*12"));
    // An address in groups is the last field where its nibbles do not fit any more, and shows what others left in its
    // elements.
    const Octets route = hex("3b 06 00 03 00*4") + Octets(40, 0x21);
    const Octets padded = hex("2b 00 01 03 00*3");
    all.push_back(shortened(ipv6({.nextHeader = 43, .payload = route}), 60) + Octets(16, 0x33));
    all.push_back(shortened(ipv6({.nextHeader = 43, .payload = route}), 76) + Octets(16, 0x33));
    all.push_back(shortened(ipv6({.nextHeader = 0, .payload = padded + route}), 67) + Octets(16, 0x33));
    for (const Octets &packet :
         {examplePacket(), ipv6({.nextHeader = 17, .payload = datagram}), ipv4({.protocol = 6, .payload = segment}),
          ipv6({.nextHeader = 60, .payload = hex("06 00 01 04 00 00 00 00") + segment})}) {
        all.push_back(packet);
    }
    return all;
}

TEST(Passes, leaveTheSameState) {
    StateOptions narrow; // at each growth the host can read the state
    narrow.blockCapacity = narrow.limitCapacity = narrow.layerCapacity = 1;
    std::minstd_rand random(20260201);
    int handedOff = 0;
    for (const Octets &whole : packets()) {
        for (int variant = 0; variant < 24 && !testing::Test::HasFailure(); ++variant) {
            Octets packet = whole;
            for (int change = variant / 4; change > 0; --change) {
                packet[random() % packet.size()] = static_cast<std::uint8_t>(random() >> 8);
            }
            packet.resize(variant % 4 == 3 ? 1 + random() % packet.size() : packet.size());
            narrow.rangeCapacity = std::array<std::uint32_t, 3>{1, 5, 12}.at(static_cast<std::size_t>(variant % 3));
            const StateOptions room = variant % 2 == 0 ? StateOptions{} : narrow;
            const std::size_t refused = variant % 8 == 5 ? 1 + random() % 40 : 0;
            const Left md = leftBehind(Pass::md, packet, room, refused);
            for (const Pass pass : {Pass::to, Pass::mv, Pass::xtr}) {
                SCOPED_TRACE(std::string(passName(pass)) + " over " + hexText(packet));
                const Left other = leftBehind(pass, packet, room, refused);
                const bool endsAtHandOff = pass == Pass::xtr && !md.atHandOff.empty();
                EXPECT_EQ(other.atHandOff, pass == Pass::xtr ? "" : md.atHandOff);
                EXPECT_EQ(other.atGrowths, md.atGrowths);
                EXPECT_EQ(other.atEnd, endsAtHandOff ? md.atHandOff : md.atEnd);
                handedOff += endsAtHandOff ? 1 : 0;
            }
        }
    }
    EXPECT_GE(handedOff, 50);
}

} // namespace
} // namespace netfloor::test
