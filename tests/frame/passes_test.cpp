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

// Without the flags, of which the MV pass raises more, and without the parts of the elements that the last field does
// not write.
std::string leftIn(const DecodeState &state) {
    const FieldRecord &record = state.fieldRecord;
    std::ostringstream out;
    out << describeField(state) << " wide " << record.wideStart << '+' << record.wideBits << " blocks "
        << stackText(state.blockStarts) << " counted " << state.blockStarts.count << " limits "
        << stackText(state.limits) << " counted " << state.limits.count << " elements";
    for (std::uint32_t i = 0; i < record.rangeCount; ++i) {
        out << ' ' << record.ranges[i].value;
        if (i < record.outputRangeCount) {
            out << ':' << record.ranges[i].firstBit << '-' << record.ranges[i].lastBit;
        }
    }
    for (const std::uint32_t word : state.scratch) {
        out << ' ' << word;
    }
    return out.str();
}

struct Left {
    std::string atHandOff; // the first one
    std::string atEnd;
};

Left leftBehind(Pass pass, const Octets &packet, const StateOptions &options) {
    Left left;
    BareRun run(packet, options);
    run.xtr.byteAreaOffset = offsetof(KeyRoom, addresses);
    run.xtr.byteAreaSize = sizeof run.keys.addresses;
    run.nextLayer = [&] {
        left.atHandOff = left.atHandOff.empty() ? leftIn(run.state()) : left.atHandOff;
        return run.take(run.state().bitsLeft);
    };
    EXPECT_EQ(run.enter(pass), 1);
    left.atEnd = leftIn(run.state());
    return left;
}

// Every field, and what is handed off.
std::vector<Octets> packets() {
    std::vector<Octets> all = packetsOfAllFields();
    const Octets segment = hex("9c 40 c3 50 00 00 00 01 00 00 00 02 80 18 01 f6 00 00 00 00") +
                           hex("01 01 08 0a 3b 9a ca 00 3b 9a c9 ff 61*8");
    const Octets datagram = udp(53, 40000, hex("61*12"));
    for (const Octets &packet :
         {examplePacket(), ipv6({.nextHeader = 17, .payload = datagram}), ipv4({.protocol = 6, .payload = segment}),
          ipv6({.nextHeader = 60, .payload = hex("06 00 01 04 00 00 00 00") + segment})}) {
        all.push_back(packet);
    }
    return all;
}

TEST(Passes, leaveTheSameState) {
    StateOptions narrow; // at each growth the host can read the state
    narrow.blockCapacity = narrow.limitCapacity = narrow.layerCapacity = narrow.rangeCapacity = 1;
    const std::array<StateOptions, 2> rooms = {StateOptions{}, narrow};
    std::minstd_rand random(20260201);
    int handedOff = 0;
    for (const Octets &whole : packets()) {
        for (int variant = 0; variant < 24 && !testing::Test::HasFailure(); ++variant) {
            Octets packet = whole;
            for (int change = variant / 4; change > 0; --change) {
                packet[random() % packet.size()] = static_cast<std::uint8_t>(random() >> 8);
            }
            packet.resize(variant % 4 == 3 ? 1 + random() % packet.size() : packet.size());
            const StateOptions &room = rooms[static_cast<std::size_t>(variant % 2)];
            const Left md = leftBehind(Pass::md, packet, room);
            for (const Pass pass : {Pass::to, Pass::mv, Pass::xtr}) {
                SCOPED_TRACE(std::string(passName(pass)) + " over " + hexText(packet));
                const Left other = leftBehind(pass, packet, room);
                const bool endsAtHandOff = pass == Pass::xtr && !md.atHandOff.empty();
                EXPECT_EQ(other.atHandOff, pass == Pass::xtr ? "" : md.atHandOff);
                EXPECT_EQ(other.atEnd, endsAtHandOff ? md.atHandOff : md.atEnd);
                handedOff += endsAtHandOff ? 1 : 0;
            }
        }
    }
    EXPECT_GE(handedOff, 50);
}

} // namespace
} // namespace netfloor::test
