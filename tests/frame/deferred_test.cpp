// SPDX-License-Identifier: MIT
// MV and XTR put off what they write. Wherever the host looks it sees what MD, which writes at once, shows there.
#include <algorithm>
#include <cstddef>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "frame/bare_host.h"
#include "frame/example.h"

namespace netfloor::test {
namespace {

constexpr std::uint32_t sentinel = 0xdeadbeef;

// Room on the two stacks. There is more, up to an element that must not be written.
struct Room {
    std::uint32_t blocks = 60;
    std::uint32_t limits = 30;
    std::uint32_t bits = 0; // that the layer below has left for the packet; 0: all
};

// A run, and all that the host can see where storage grows, at each hand-off and at the end.
class Looks {
public:
    Looks(Pass pass, const Octets &packet, const Room &room) : run_(packet, options(room)) {
        run_.xtr.byteAreaOffset = offsetof(KeyRoom, addresses);
        run_.xtr.byteAreaSize = sizeof run_.keys.addresses;
        run_.nextLayer = [this] {
            look("hand-off");
            refill(run_.state()); // another layer uses the same elements
            return run_.take(std::min(run_.state().bitsLeft, 32u));
        };
        run_.enter(pass);
        look(run_.state().layerHandedOff == 1 && pass == Pass::xtr ? "hand-off" : "end");
    }

    std::vector<std::string> seen;

private:
    StateOptions options(const Room &room) {
        StateOptions options;
        options.blockCapacity = room.blocks + 1;
        options.limitCapacity = room.limits + 1;
        options.prepare = [room](DecodeState &state) {
            if (room.bits != 0) {
                state.bitsLeft = state.limits.base[0] = room.bits;
            }
            for (BitStack *const stack : {&state.blockStarts, &state.limits}) {
                stack->base[--stack->capacity] = sentinel;
            }
            refill(state);
        };
        options.allowGrowth = [this](std::size_t octets) {
            look("growth to " + std::to_string(octets));
            grown_ = true;
            return true;
        };
        return options;
    }

    static void refill(DecodeState &state) {
        std::for_each_n(state.fieldRecord.ranges, state.fieldRecord.rangeCapacity,
                        [](BitRange &range) { range.flagWord = 90; });
        state.fieldRecord.rangeCount = 0;
    }

    void look(const std::string &when) {
        const DecodeState &state = run_.state();
        std::string text = when + ": " + describe(state);
        for (const BitStack *const stack : {&state.blockStarts, &state.limits}) {
            const bool kept = grown_ || stack->base[stack->capacity] == sentinel;
            text += " | " + (depthOf(*stack) < stack->capacity ? stackText(*stack) : "full") + " of " +
                    std::to_string(stack->count) + (kept ? "" : ", written past its end");
        }
        seen.push_back(text);
    }

    bool grown_ = false;
    BareRun run_;
};

void compare(const Octets &packet, const Room &room = {}) {
    const Looks md(Pass::md, packet, room);
    const Looks mv(Pass::mv, packet, room);
    const Looks xtr(Pass::xtr, packet, room);
    const auto isStop = [](const std::string &text) { return text.starts_with("hand-off") || text.starts_with("end"); };
    const auto stop = std::ranges::find_if(md.seen, isStop);
    EXPECT_EQ(mv.seen, md.seen) << "MV over " << hexText(packet);
    EXPECT_EQ(xtr.seen, std::vector<std::string>(md.seen.begin(), stop + 1)) << "XTR over " << hexText(packet);
}

Octets tcp(const Octets &options) {
    return ipv4({.protocol = 6,
                 .payload = hex("0035 9c40 01020304 05060708") +
                            Octets{static_cast<std::uint8_t>((5 + options.size() / 4) << 4)} +
                            hex("12 7210 beef 0007") + options + hex("61*8")});
}

// Any of them comes after a layer that has changed the elements.
std::vector<Octets> packetsAfterAnOwner() {
    std::vector<Octets> packets;
    for (const char *const chunk : {
             "04 07 000c 0002 0008 01020304", // information of an unknown type, of which only the type is peeked
             "05 07 000c 0001 0008 01020304",
             "03 07 001c 00000001 00010000 0001 0001 0002 0003 00000005",
             "02 07 0034 00000001 00010000 0002 0003 00000004 0006 0014 20010db8 00*11 01 000b 000c 61*8", // a row
                                                                                                           // after it
             "06 ff 000c 0001 0008 0007 0000",
             "0a 07 0008 01020304",
         }) {
        packets.push_back(
            ipv4({.protocol = 132,
                  .payload = hex("0035 9c40 00*8  00 03 0014 00000001 0002 0003 0000000a 61626364") + hex(chunk)}));
    }
    return packets;
}

TEST(DeferredWriter, showsWhatMdShowsAfterAnOwner) {
    for (const Octets &packet : packetsAfterAnOwner()) {
        compare(packet);
        compare(shortened(packet, packet.size() - 2));
    }
}

// An address that lies past the limit is shown, and not kept: the step back over it is the last one.
TEST(DeferredWriter, showsTheStepBackOverAnAddress) {
    compare(shortened(ipv6({.nextHeader = 41, .payload = ipv6({})}), 79)); // too short for a checked run
    compare(ipv6({.nextHeader = 41,
                  .payload = ipv6({.nextHeader = 43, .payload = hex("3b 02 00 01 00*4 61*8")}),
                  .payloadLength = std::uint16_t{56}}) +
            hex("62*8"));
}

// An address in groups is the last field where its nibbles are past the limit. It shows what other fields have left in
// its elements: nibbles of padding, and of an address.
TEST(DeferredWriter, showsWhatIsLeftInTheElementsOfAnAddress) {
    const std::string toRouting = " 2b 00 01 ";
    const std::string toOptions = " 3c 00 01 ";
    for (const std::string &front :
         {std::string(), toRouting + "02 00*2", toRouting + "03 00*3", toRouting + "04 00*4",
          toOptions + "04 00*4" + toRouting + "03 00*3", toOptions + "03 00*3" + toRouting + "02 00*2"}) {
        const Octets headers = hex(front) + hex("3b 06 00 03 00*4 21*40");
        const std::uint8_t first = front.empty() ? 43 : front.starts_with(" 3c") ? 0 : 60;
        const Octets packet = ipv6({.nextHeader = first, .payload = headers});
        for (const std::size_t missing : {28u, 12u}) { // in the first address, and in the second
            compare(shortened(packet, packet.size() - missing) + hex("33*16"));
        }
        compare(packet);
        compare(ipv6({}), {.bits = 312}); // nothing of the packet before is shown in the destination address
    }
}

// A run asks for its room once. It takes no more than that, and all that it has where it needs it.
TEST(DeferredWriter, keepsToTheRoomOnTheStacks) {
    // The last option is followed by a look for another one, and no padding.
    const Octets withOptions = ipv4({.protocol = 17, .payload = udp(40000, 53, hex("6162")), .options = hex("01*4")});
    for (const Octets &packet : {tcp(hex("01*20")), tcp(hex("01 00*3 01 00*3 01 00*7")), tcp(hex("02 04 05b4 01*12")),
                                 tcp(hex("01 01 08 0a 00*8")), withOptions, examplePacket(),
                                 ipv6({.nextHeader = 6, .payload = hex("0035 9c40 00*8 a0 12 00*6 01*20")}),
                                 ipv6({.nextHeader = 17, .payload = udp(53, 53, hex("61*12"))})}) {
        for (std::uint32_t blocks = 1; blocks < 34; ++blocks) {
            compare(packet, {.blocks = blocks});
        }
        for (std::uint32_t limits = 1; limits < 12; ++limits) {
            compare(packet, {.limits = limits});
        }
    }
}

} // namespace
} // namespace netfloor::test
