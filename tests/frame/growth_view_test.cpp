// SPDX-License-Identifier: MIT
// What a host can see while storage grows, in the middle of the grammar. A block stack with room for n elements grows
// when a block opens inside n - 1 others, and `ranges` grow for a field that fills them.
#include <algorithm>
#include <iterator>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "frame/bare_host.h"
#include "frame/example.h"

namespace netfloor::test {
namespace {

// Runs a pass, and calls `atGrowth` at each growth. Gives what the entry returned.
template <class AtGrowth>
std::int32_t runWith(Pass pass, const Octets &packet, StateOptions options, AtGrowth atGrowth) {
    BareRun *current = nullptr;
    options.allowGrowth = [&](std::size_t) { return atGrowth(*current); };
    BareRun run(packet, options);
    current = &run;
    run.nextLayer = [&run] { return run.take(run.state().bitsLeft); };
    return run.enter(pass);
}

struct VerdictCase {
    const char *name;
    Octets packet;
    StateOptions options;
    const char *growths; // the block that is open, and the verdict so far
};

StateOptions roomFor(std::uint32_t blocks, std::uint32_t ranges = 200, std::uint32_t flags = 0) {
    StateOptions options;
    options.blockCapacity = blocks;
    options.rangeCapacity = ranges;
    options.flags = flags;
    return options;
}

// A flag becomes the verdict after the next field or assignment, and before a block closes; not as one opens.
TEST(GrowthView, verdict) {
    const std::vector<VerdictCase> cases = {
        {"flag of a lower layer", hex("75"), roomFor(1, 200, 2), "Ip 1, Ip Header -52, "},
        {"limit of the chunks too long", ipv4({.protocol = 132, .payload = hex("61*12"), .headerWords = 0}), roomFor(6),
         "Common Header -52, "},
        {"TCP options without a known kind", ipv4({.protocol = 6, .payload = hex("9c 40 c3 50 00*8 70 00*7 fd*8")}),
         roomFor(20, 5), "Padding 1, "},
        {"authentication data of a negative length",
         ipv6({.nextHeader = 51, .payload = hex("06 00 00*10 9c 40 c3 50 00*16")}), roomFor(8, 33),
         "Transmission Control Protocol -52, "},
    };
    for (const VerdictCase &one : cases) {
        std::string growths;
        runWith(Pass::mv, one.packet, one.options, [&](BareRun &run) {
            growths += run.state().blockName + std::string(" ") + std::to_string(run.context().verdict) + ", ";
            return true;
        });
        EXPECT_EQ(growths, one.growths) << one.name;
    }
}

// The packet with the bits of each octet reversed, from one octet on.
Octets withBitsReversed(Octets packet, std::size_t from) {
    std::for_each(packet.begin() + static_cast<std::ptrdiff_t>(from), packet.end(), [](std::uint8_t &each) {
        std::uint8_t reversed = 0;
        for (int bit = 0; bit < 8; ++bit) {
            reversed = static_cast<std::uint8_t>(reversed << 1 | (each >> bit & 1));
        }
        each = reversed;
    });
    return packet;
}

// IPv6 addresses of SCTP parameters are read with the bits of each octet reversed, up to the end of the packet.
TEST(GrowthView, workingCopyOfAReversedAddress) {
    const Octets packet = ipv4({.protocol = 132, .payload = hex(R"(
        0b 59 0b 5a 00 00 00 2a 00 00 00 00   # SCTP
        01 00 00 3c 00 00 00 01 00 00 00 00   # INIT, tag, window
        00 01 00 01 00 00 00 01               #   streams, initial TSN
        00 06 00 14 20 01 0d b8 12*12         # IPv6 addresses
        00 06 00 14 30*16
    )")}) + hex("74 61 69");
    constexpr std::size_t firstAddress = 56;
    constexpr std::size_t secondAddress = 76;
    const auto reversedFrom = [&](std::size_t octet) { return hexText(withBitsReversed(packet, octet)); };
    const auto runWithFull = [&](Pass pass, const StateOptions &full, const std::vector<std::size_t> &growths) {
        for (const bool allowed : {true, false}) {
            SCOPED_TRACE(std::string(passName(pass)) + (allowed ? "" : " without storage"));
            StateOptions options = full;
            std::vector<std::string> atGrowths, atAddresses, atLengths;
            BareRun *current = nullptr;
            const auto copy = [&] { return hexText({current->state().data, packet.size()}); };
            options.allowGrowth = [&](std::size_t) {
                atGrowths.push_back(copy());
                return allowed;
            };
            BareRun run(packet, options);
            current = &run;
            run.afterCall = [&] {
                const std::uint32_t id = run.state().fieldRecord.fieldId;
                if (id == 856 || id == 848) {
                    (id == 856 ? atAddresses : atLengths).push_back(copy());
                }
            };
            EXPECT_EQ(run.enter(pass), allowed ? 1 : 0);
            std::vector<std::string> copies;
            std::ranges::transform(growths, std::back_inserter(copies), reversedFrom);
            copies.resize(allowed ? copies.size() : 1);
            EXPECT_EQ(atGrowths, copies);
            EXPECT_EQ(copy(), allowed ? hexText(packet) : reversedFrom(firstAddress));
            if (allowed && (pass == Pass::md || pass == Pass::to)) {
                EXPECT_EQ(atAddresses,
                          (std::vector<std::string>{reversedFrom(firstAddress), reversedFrom(secondAddress)}));
                EXPECT_EQ(atLengths, (std::vector<std::string>(2, hexText(packet))));
            }
        }
    };
    for (const Pass pass : allPasses) {
        runWithFull(pass, roomFor(12), {firstAddress}); // full when the inner block of an address opens
        runWithFull(pass, roomFor(20, 8), {firstAddress, secondAddress}); // full with the elements of an address
    }
}

// Of an address that the packet cuts, as much as there is; and of a packet longer than a length field can tell, all.
TEST(GrowthView, workingCopyOfACutAndOfALongPacket) {
    const Octets whole = ipv4({.protocol = 132, .payload = hex(R"(
        0b 59 0b 5a 00 00 00 2a 00 00 00 00  01 00 00 28 00 00 00 01 00 00 00 00
        00 01 00 01 00 00 00 01  00 06 00 14 20 01 0d b8 12*12
    )")});
    constexpr std::size_t address = 56;
    for (const Pass pass : allPasses) {
        for (std::size_t octets = 0; octets < 9; ++octets) {
            const Octets packet = shortened(whole, address + octets);
            std::string seen;
            runWith(pass, packet, roomFor(12), [&](BareRun &run) {
                seen = hexText({run.state().data, packet.size()});
                return true;
            });
            EXPECT_EQ(seen, hexText(withBitsReversed(packet, address))) << passName(pass) << ' ' << octets;
        }
        const Octets packet = whole + Octets(70000, 0x35);
        BareRun run(packet);
        bool reversed = false;
        run.afterCall = [&] {
            if (run.state().fieldRecord.fieldId == 856) {
                const Octets expected = withBitsReversed(packet, address);
                reversed = std::equal(expected.begin(), expected.end(), run.state().data);
            }
        };
        EXPECT_EQ(run.enter(pass), 1);
        EXPECT_EQ(reversed, pass == Pass::md || pass == Pass::to);
        EXPECT_TRUE(std::equal(packet.begin(), packet.end(), run.state().data));
    }
}

// The groups of an address come one by one, and room is made for each. Where it is refused, the record keeps the groups
// before it.
TEST(GrowthView, groupsOfAnAddress) {
    for (const Pass pass : allPasses) {
        for (std::uint32_t refused = 4; refused <= 8; ++refused) { // there is no growth for an eighth group
            std::string growths, expected;
            std::string groups = "528 53387 0 ";
            for (std::uint32_t count = 3; count <= std::min(refused, 7u); ++count, groups += "0 ") {
                expected += std::to_string(count) + " of Source IP Address: " + groups + '\n';
            }
            const std::int32_t result = runWith(pass, ipv6({}), roomFor(20, 4), [&](BareRun &run) {
                const FieldRecord &record = run.state().fieldRecord;
                if (run.state().cursor != 65 || record.rangeCapacity >= 8) { // not in front of the first address
                    return true;
                }
                growths += std::to_string(record.rangeCount) + " of " + record.fieldName + ": ";
                for (std::uint32_t i = 0; i < record.rangeCount; ++i) {
                    growths += std::to_string(record.ranges[i].value) + ' ';
                }
                growths += '\n';
                return record.rangeCount != refused;
            });
            EXPECT_EQ(growths, expected) << passName(pass) << " up to " << refused;
            EXPECT_TRUE(result == 0 || refused == 8);
        }
    }
}

} // namespace
} // namespace netfloor::test
