// SPDX-License-Identifier: MIT
// The hand-off to the next layer: the choice of its key, the records at the hand-off, and the state after it.
#include <algorithm>
#include <cstddef>
#include <limits>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "frame/bare_host.h"
#include "frame/example.h"
#include "support/runs.h"

namespace netfloor::test {
namespace {

constexpr std::uint32_t unset = 0xabcdef;

struct KeyCase {
    std::uint16_t source, destination;
    std::uint32_t port, key, protocol;
};

TEST(HandOffKey, goesByThePorts) {
    const std::vector<KeyCase> cases = {
        // a well-known source port
        {53, 3452, 53, 53, 17},
        {0, 0, 0, 0, 17},
        {1023, 40000, 1023, 1023, 17},
        // 3452 on either side names no protocol
        {3452, 53, 3452, 3452, 0},
        {3452, 3452, 3452, 3452, 0},
        {1024, 3452, 3452, 3452, 0},
        {40000, 3452, 3452, 3452, 0},
        // a destination port below 9000
        {2000, 2001, 2001, 2001, 17},
        {1024, 0, 0, 0, 17},
        {8999, 8999, 8999, 8999, 17},
        {9000, 8999, 8999, 8999, 17},
        {3451, 3453, 3453, 3453, 17},
        // a source port below 9000
        {1024, 40000, 1024, 1024, 17},
        {2000, 9000, 2000, 2000, 17},
        {8999, 9000, 8999, 8999, 17},
        // neither is: the protocol is the key
        {9000, 9000, unset, 17, 0},
        {65535, 65535, unset, 17, 0},
        // a server of RADIUS answers under its own port (RFC 2865, RFC 2866)
        {1812, 40000, 1812, 1812, 17},
        {1812, 53, 1812, 1812, 17},
        {1813, 3452, 1813, 1813, 17},
        {1811, 53, 53, 53, 17},
        {1814, 53, 53, 53, 17},
        {40000, 1812, 1812, 1812, 17},
    };
    for (const KeyCase &one : cases) {
        SCOPED_TRACE(std::to_string(one.source) + " to " + std::to_string(one.destination));
        TestRunOptions options;
        options.state.prepare = [](DecodeState &state) { state.scratch[NETFLOOR_NEXT_LAYER_PORT] = unset; };
        const Octets datagram = udp(one.source, one.destination, hex("61*5"));
        const Runs runs = runAll(ipv4({.protocol = 17, .payload = datagram}), options);
        EXPECT_EQ(handOffLines(runs.md), "hand-off key " + std::to_string(one.key) + " protocol " +
                                             std::to_string(one.protocol) + " port " + std::to_string(one.port) +
                                             " at 225 bits 40 octets 5 preceding 28\n");
        EXPECT_EQ(runs.xtr.key("UDP Destination Port")->number, one.destination); // as it was sent
        EXPECT_EQ(runs.mv.flags, 0u);
    }
}

std::string frameText(const DecodeState &state) {
    const LayerFrame &frame = state.layerFrames[state.layerIndex];
    return "frame " + std::to_string(state.layerIndex) + " from " + std::to_string(frame.firstBit) + " key " +
           std::to_string(frame.nextLayerKey) + " protocol " + std::to_string(frame.nextLayerProtocol) +
           " handed off " + std::to_string(state.layerHandedOff);
}

std::string openText(const DecodeState &state) {
    return "blocks " + stackText(state.blockStarts) + " (" + std::to_string(state.blockStarts.count) + "), limits " +
           stackText(state.limits) + " (" + std::to_string(state.limits.count) + "), \"" + state.blockName + '"';
}

// In the XTR pass the host takes over where the others call it.
TEST(HandOff, whatTheNextLayerFinds) {
    for (const Pass pass : allPasses) {
        SCOPED_TRACE(passName(pass));
        BareRun run(examplePacket());
        bool called = false;
        const auto check = [&] {
            called = true;
            EXPECT_EQ(frameText(run.state()), "frame 0 from 1 key 53 protocol 17 handed off 1");
            EXPECT_EQ(openText(run.state()),
                      "blocks 1 1 1 1 33 161 193 225 225 (8), limits 344 320 (1), \"NEXT LAYER\"");
            EXPECT_EQ(run.state().cursor, 225u);
            EXPECT_EQ(run.state().bitsLeft, 96u);
            EXPECT_EQ(run.contextBitsLeft(pass), 96u);
            const bool lists = pass == Pass::md || pass == Pass::to;
            EXPECT_EQ(run.context().layerInfoCount, lists ? 1u : 0u);
            EXPECT_EQ(run.layerInfo[0].lastBit, lists ? 224u : 0u);
            EXPECT_EQ(run.context().layerNumber, pass == Pass::xtr ? 1 : 2);
            return 0;
        };
        run.nextLayer = check;
        EXPECT_EQ(run.enter(pass), 1);
        EXPECT_EQ(called, pass != Pass::xtr);
        if (pass == Pass::xtr) {
            check();
            continue;
        }
        const std::uint32_t mode = pass == Pass::md ? 1 : pass == Pass::mv ? 2 : 0;
        EXPECT_EQ(run.modes, std::vector<std::uint32_t>{mode});
    }
}

// What the next layer leaves is skipped up to the datagram's end. The layer that goes on gets a record of its own.
TEST(HandOff, whatComesBack) {
    for (const Pass pass : passesThatHandOn) {
        SCOPED_TRACE(passName(pass));
        for (const std::uint32_t taken : {0u, 32u, 95u, 96u}) {
            BareRun run(examplePacket());
            run.nextLayer = [&] {
                run.context().decoderId = 99;
                run.context().layerNumber = 5;
                return run.take(taken);
            };
            EXPECT_EQ(run.enter(pass), 1);
            EXPECT_EQ(run.state().cursor, 321u);
            EXPECT_EQ(run.contextBitsLeft(pass), 24u);
            EXPECT_EQ(run.context().decoderId, 7u);
            EXPECT_EQ(run.context().layerNumber, 5);
            EXPECT_EQ(run.state().flags, pass == Pass::mv && taken < 96 ? 0x10u : 0u);
            EXPECT_EQ(run.context().verdict, pass == Pass::mv && taken < 96 ? -52 : 1);
            if (pass != Pass::mv) {
                EXPECT_EQ(run.context().layerInfoCount, 2u);
                const LayerInfoRecord &layer = run.layerInfo[1];
                EXPECT_EQ(layer.firstBit, 225 + taken);
                EXPECT_EQ(layer.lastBit, 320u);
                EXPECT_EQ(layer.decoderId, 7u);
                EXPECT_EQ(layer.layerNumber, 5u);
            }
        }
    }
}

// The walk over the chunks of SCTP goes on at the cursor and the bits that the next layer leaves, wherever they are.
// What they tell past the packet is not read.
struct LeftCase {
    const char *name;
    std::uint32_t cursor, bitsLeft;
    std::size_t handOffs;
    std::ptrdiff_t chunks;
    std::uint32_t flagsOfMv;
};

TEST(HandOff, chunksGoOnWhereTheNextLayerStops) {
    const Octets packet = ipv4({.protocol = 132, .payload = hex(R"(
        0b 59 0b 5a 00 00 00 2a 00 00 00 00                     # SCTP
        00 03 00 14 00 00 00 01 00 00 00 01 00 00 00 03 61*4    # DATA at bit 257, user data at 385
        08 00 00 04                                             # SHUTDOWN ACK
    )")}) + hex("08 00 00 04"); // at 449, past the datagram; the packet ends at 480
    const std::vector<LeftCase> cases = {
        {"after its payload", 417, 32, 1, 2, 0},          {"back at the chunk", 257, 192, 2, 2, 0x10},
        {"back before the chunks", 161, 288, 1, 2, 0x10}, // where the octet of a port is taken for a chunk
        {"past the datagram", 449, 32, 1, 2, 0x10},       {"bits past the packet", 449, 1000, 1, 2, 0x10},
        {"past the packet", 481, 64, 1, 1, 0x10},         {"far past the packet", 0x80000000, 0x80000000, 1, 1, 0x10},
        {"before the packet", 0, 480, 1, 1, 0x10},
    };
    for (const LeftCase &one : cases) {
        for (const Pass pass : passesThatHandOn) {
            SCOPED_TRACE(std::string(passName(pass)) + ": " + one.name);
            BareRun run(packet);
            run.nextLayer = [&] {
                run.state().cursor = one.cursor;
                run.state().bitsLeft = one.bitsLeft;
                return 0;
            };
            EXPECT_EQ(run.enter(pass), 1);
            EXPECT_EQ(run.modes.size(), one.handOffs);
            EXPECT_EQ(run.state().cursor, 449u);
            EXPECT_EQ(run.contextBitsLeft(pass), 32u);
            EXPECT_EQ(run.state().flags, pass == Pass::mv ? one.flagsOfMv : 0);
            if (pass == Pass::md) {
                EXPECT_EQ(
                    std::ranges::count_if(run.seen, [](auto &field) { return field.id == 802 || field.id == 805; }),
                    one.chunks);
            }
        }
    }
}

// A chunk that is counted with less than nothing: a next layer that always goes back to it does not hold the walk.
TEST(HandOff, chunksEndThoughTheNextLayerAlwaysGoesBack) {
    const Octets packet = ipv4({.protocol = 132, .payload = hex(R"(
        0b 59 0b 5a 00 00 00 2a 00 00 00 00                     # SCTP
        02 00 00 18 00 00 00 01 00 00 00 00 00*8 00 0b 01 04    # INIT ACK with a host name of 256 octets
        61*256
        00 03 00 14 00 00 00 01 00 00 00 01 00 00 00 03 61*4    # DATA
    )")});
    for (const Pass pass : passesThatHandOn) {
        BareRun run(packet);
        run.nextLayer = [&] {
            const std::uint32_t back = run.state().cursor - 257;
            run.state().cursor -= back;
            run.state().bitsLeft += back;
            return run.modes.size() < 1000 ? 0 : -1;
        };
        EXPECT_EQ(run.enter(pass), 1);
        EXPECT_GE(run.modes.size(), 2u);
    }
}

TEST(HandOff, aNegativeResultCutsThePassOff) {
    for (const Pass pass : passesThatHandOn) {
        for (const std::int32_t result : {std::numeric_limits<std::int32_t>::min(), -1, 0, 1, 1000}) {
            BareRun run(examplePacket());
            run.nextLayer = [&] {
                run.context().decoderId = 99;
                run.take(96);
                return result;
            };
            const bool refused = result < 0;
            EXPECT_EQ(run.enter(pass), refused ? 0 : 1);
            EXPECT_EQ(run.state().flags, 0u);
            EXPECT_EQ(run.context().verdict, 1);
            EXPECT_EQ(run.context().decoderId, refused ? 99u : 7u);
            EXPECT_EQ(run.contextBitsLeft(pass), refused ? 96u : 24u);
            EXPECT_EQ(run.context().layerNumber, 2);
            EXPECT_EQ(run.context().layerInfoCount, pass == Pass::mv ? 0u : refused ? 1u : 2u);
            EXPECT_EQ(openText(run.state()),
                      refused ? "blocks 1 1 1 1 33 161 193 225 225 (8), limits 344 320 (1), \"NEXT LAYER\""
                              : "blocks 1 (8), limits 344 (1), \"NEXT LAYER\"");
        }
    }
}

// The port of the next layer is not written where the block around the choice finds no room.
TEST(HandOff, noRoomForTheChoice) {
    for (const Pass pass : allPasses) {
        StateOptions options;
        options.blockCapacity = 7;
        options.allowGrowth = [](std::size_t) { return false; };
        BareRun run(examplePacket(), options);
        run.state().scratch[NETFLOOR_NEXT_LAYER_PORT] = unset;
        EXPECT_EQ(run.enter(pass), 0);
        EXPECT_EQ(run.state().scratch[NETFLOOR_NEXT_LAYER_OCTETS], 12u);
        EXPECT_EQ(run.state().scratch[NETFLOOR_NEXT_LAYER_PORT], unset);
    }
}

// Packets in packets, by way of the host. The pass has one set of variables: the decoder id that it writes back into
// the context is that of the innermost entry.
TEST(HandOff, entriesInsideOneAnother) {
    Octets packet = ipv4({.protocol = 17, .payload = udp(2000, 2001, hex("61*12"))});
    packet = ipv4({.protocol = 17, .payload = udp(3452, 9, packet)});
    packet = ipv4({.protocol = 17, .payload = udp(1812, 3452, packet)});
    for (const Pass pass : passesThatHandOn) {
        SCOPED_TRACE(passName(pass));
        BareRun run(packet);
        std::vector<std::string> frames;
        run.nextLayer = [&] {
            frames.push_back(frameText(run.state()));
            if (frames.size() == 3) {
                return run.take(96);
            }
            run.context().decoderId = static_cast<std::uint32_t>(50 + frames.size());
            EXPECT_EQ(run.enter(pass), 1);
            return 0;
        };
        EXPECT_EQ(run.enter(pass), 1);
        EXPECT_EQ(frames, (std::vector<std::string>{"frame 0 from 1 key 1812 protocol 17 handed off 1",
                                                    "frame 1 from 225 key 3452 protocol 0 handed off 1",
                                                    "frame 2 from 449 key 2001 protocol 17 handed off 1"}));
        EXPECT_EQ(run.state().cursor, 8 * packet.size() + 1);
        EXPECT_EQ(run.contextBitsLeft(pass), 0u);
        EXPECT_EQ(run.state().flags, 0u);
        EXPECT_EQ(stackText(run.state().blockStarts), "1");
        EXPECT_EQ(run.context().decoderId, 52u);
        if (pass == Pass::mv) {
            continue;
        }
        EXPECT_EQ(run.seen.size(), 3 * 22u);
        std::string layers;
        for (std::uint32_t i = 0; i < run.context().layerInfoCount; ++i) {
            const LayerInfoRecord &layer = run.layerInfo[i];
            layers += std::to_string(layer.layerNumber) + " of " + std::to_string(layer.decoderId) + ": " +
                      std::to_string(layer.firstBit) + '-' + std::to_string(layer.lastBit) + '\n';
        }
        EXPECT_EQ(layers, expected(R"(
            1 of 7: 1-224
            2 of 51: 225-448
            3 of 52: 449-672
            4 of 52: 769-768
            4 of 52: 769-768
            4 of 52: 769-768
        )"));
    }
}

// The host may enter the XTR pass again at the stop, on the stacks as they are.
TEST(HandOff, extractionGoesOnAtTheStop) {
    const Octets inner = ipv4({.protocol = 17, .payload = udp(2000, 2001, hex("61*12")), .identification = 0x77});
    const Octets packet = ipv4({.protocol = 17, .payload = udp(53, 53, inner)});
    BareRun run(packet);
    EXPECT_EQ(run.enter(Pass::xtr), 1);
    EXPECT_EQ(run.enter(Pass::xtr), 1);
    EXPECT_EQ(frameText(run.state()), "frame 1 from 225 key 2001 protocol 17 handed off 1");
    EXPECT_EQ(openText(run.state()), "blocks 1 1 1 1 33 161 193 225 225 225 225 225 257 385 417 449 449 (16), "
                                     "limits 544 544 544 (2), \"NEXT LAYER\"");
    EXPECT_EQ(run.xtr.bitsLeft, 96u);
    EXPECT_NE(run.keyText().find("2=77 00\n"), std::string::npos); // the later store wins
}

} // namespace
} // namespace netfloor::test
