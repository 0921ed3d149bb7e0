// SPDX-License-Identifier: MIT
// The host around the plug-in: storage, blocks, layers, owners of next layers.
#include <algorithm>
#include <cstdint>
#include <functional>
#include <stdexcept>
#include <string>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

#include "support/runs.h"

namespace netfloor::test {
namespace {

constexpr Pass allPasses[] = {Pass::md, Pass::to, Pass::mv, Pass::xtr};

Octets udpPacket(std::uint16_t destinationPort, const Octets &payload) {
    return ipv4({.protocol = 17, .payload = udp(40000, destinationPort, payload)});
}

const Octets twelveOctets = hex("00*12");

// The tree of blocks follows the plug-in's, and two blocks of one name stay two.
TEST(Host, reportsTheBlocksOfFields) {
    Host host = freshHost();
    const Report report = host.run(Pass::md, udpPacket(40001, twelveOctets));
    const auto blockOf = [&](std::string_view name) { return report.field(name)->block; };

    EXPECT_EQ(report.path(*report.field("Version")), "Ip Header");
    EXPECT_EQ(report.path(*report.field("Protocol")), "Ip Header/IPv4 Header/Extra/Protocol");
    EXPECT_EQ(report.path(*report.field("DF"), " > "), "Ip Header > IPv4 Header > Extra > Flag and Fragment Offset");
    EXPECT_EQ(report.path(*report.field("data")), "Ip Header/IPv4 Header/Extra/User Datagram Protocol/NEXT LAYER");
    EXPECT_EQ(blockOf("Identification"), blockOf("Destination Address")) << "Extra goes on after Protocol";
    EXPECT_EQ(report.blocks[blockOf("Identification")].firstBit, 33U);
    EXPECT_EQ(report.blockName(*report.field("Checksum")), "") << "the block after the ports has no name";
    EXPECT_EQ(report.blocks[blockOf("Checksum")].parent, blockOf("UDP Source Port"));
}

struct EndOfRun final : Sink {
    void end(const PassEnd &end) override {
        octets = end.state.totalBits / 8;
        bitsLeft = end.bitsLeft;
    }
    std::uint32_t octets = 0;
    std::uint32_t bitsLeft = 0;
};

// A capture file may hold megabytes after a packet. The plug-in gets what an IP header can reach, and they count as
// left.
TEST(Host, handsOverWhatAnIpHeaderCanReach) {
    const std::pair<Octets, std::uint32_t> cases[] = {
        // and the octets that are read
        {udpPacket(40001, twelveOctets), 40},
        {ipv6({.nextHeader = 59, .payload = Octets(65535, 0x61)}), 40 + 65535},
        // a jumbo payload (RFC 2675)
        {ipv6({.nextHeader = 0, .payload = hex("3b 00 c2 04 00 02 00 08") + Octets(0x20000, 0), .payloadLength = 0}),
         40},
    };
    Host host = freshHost();
    for (const auto &[beginning, read] : cases) {
        for (const Pass pass : allPasses) {
            Octets packet = beginning;
            packet.resize(1'000'000);
            EndOfRun seen;
            EXPECT_EQ(host.run(pass, packet, seen), Ending::complete);
            EXPECT_EQ(seen.octets, 40u + 65535u);
            const bool stops = pass == Pass::xtr && packet[0] >> 4 == 4; // at the hand-off
            EXPECT_EQ(seen.bitsLeft, stops ? 0 : (packet.size() - read) * 8);
        }
    }
}

TEST(Host, listsLayersAndHandOffs) {
    Host host = freshHost();
    const Octets packet = udpPacket(40001, twelveOctets);
    for (const std::uint32_t capacity : {0U, 1U, 7U}) {
        TestRunOptions options;
        options.layerInfoCapacity = capacity;
        options.layerNumber = 3;
        options.decoderId = 42;
        for (const Pass pass : {Pass::md, Pass::to}) {
            const Report report = host.run(pass, packet, options);
            EXPECT_EQ(report.layers, (std::vector<LayerRecord>{{1, 224, 42, 3}, {225, 320, 0, 4}, {321, 320, 42, 4}}));
            EXPECT_EQ(report.layerNumber, 4);
            EXPECT_EQ(report.decoderId, 42U);
        }
    }
    for (const Pass pass : allPasses) {
        const Report report = host.run(pass, packet);
        EXPECT_EQ(handOffLines(report), "hand-off key 17 protocol 0 port 0 at 225 bits 96 octets 12 preceding 28\n");
        EXPECT_EQ(host.run(pass, udpPacket(7000, twelveOctets)).handOffs.front().port, 7000U);
        EXPECT_EQ(report.handOffs.front().consumedBits, 96U);
        EXPECT_EQ(report.bitsLeft, 0U);
        EXPECT_EQ(report.ending, Ending::complete);
    }
}

// What a caller of the boundary sees of an XTR stop.
TEST(Host, doesNotFollowAnXtrStopOnRequest) {
    Host host = freshHost();
    TestRunOptions options;
    options.followStop = false;
    const Report report = host.run(Pass::xtr, udpPacket(7000, twelveOctets), options);
    EXPECT_EQ(report.result, 1);
    EXPECT_TRUE(report.layerHandedOff);
    EXPECT_EQ(report.bitsLeft, 96U);
    EXPECT_EQ(report.cursor, 225U);
    EXPECT_TRUE(report.handOffs.empty());
    EXPECT_GT(report.blockDepth, 2U);
}

TEST(Owners, areFoundByKeyAndProtocolThenKeyThenProtocol) {
    std::string asked;
    const auto named = [&asked](const char *name) {
        return [&asked, name](NextLayer &) {
            asked = name;
            return Handled::yes;
        };
    };
    Host host = freshHost();
    OwnerRegistry &owners = host.owners();
    owners.setDefault(named("default"));
    owners.addProtocol(17, named("UDP"));
    owners.add(7000, named("7000"));
    owners.add(7001, 17, named("7001 in UDP"));
    owners.add(7001, 6, named("7001 in TCP"));
    owners.add(7001, named("7001"));

    const std::pair<std::uint16_t, std::string_view> cases[] = {
        {7000, "7000"},    {7001, "7001 in UDP"},
        {7002, "UDP"},     {9000, "UDP"}, // no port is low: the key is the protocol
        {3452, "default"},                // a hand-off that names no protocol
    };
    for (const auto &[port, owner] : cases) {
        for (const Pass pass : allPasses) {
            asked.clear();
            static_cast<void>(host.run(pass, udpPacket(port, twelveOctets)));
            EXPECT_EQ(asked, owner) << port << " in " << passName(pass);
        }
    }
}

TEST(Owners, seeTheirPayloadAndMayLeaveBits) {
    Host host = freshHost();
    Octets seen;
    host.owners().add(7000, [&](NextLayer &next) {
        seen.assign(next.payload().begin(), next.payload().end());
        EXPECT_EQ(next.packet().size(), 40U + 3);
        EXPECT_EQ(next.preDecodeContext() == nullptr, next.pass() == Pass::xtr);
        EXPECT_EQ(next.xtrContext() == nullptr, next.pass() != Pass::xtr);
        next.take(16, "head", "Head", "Head");
        return Handled::yes;
    });
    const Octets payload = hex("01 02 03 04 05 06 07 08 09 0a 0b 0c");
    for (const Pass pass : allPasses) {
        // Three octets after the datagram are no payload.
        const Report report = host.run(pass, udpPacket(7000, payload) + hex("ee ee ee"));
        EXPECT_EQ(seen, payload);
        EXPECT_EQ(report.handOffs.front().consumedBits, 16U);
        // The end of the enclosing limit skips what is left, and the MV pass raises a flag for it.
        EXPECT_EQ(report.flags, pass == Pass::mv ? 0x10U : 0U);
        EXPECT_EQ(report.verdict.fault(), pass == Pass::mv);
        EXPECT_EQ(report.field("head") != nullptr, pass == Pass::md);
    }
}

// An owner that runs the plug-in again learns that another one has refused.
TEST(Owners, refuseAndThrow) {
    Host host = freshHost();
    bool ran = true;
    host.owners().add(6999, [&](NextLayer &next) {
        ran = next.runPlugin();
        return Handled::yes;
    });
    host.owners().add(7000, [](NextLayer &) { return Handled::refused; });
    host.owners().add(7001, [](NextLayer &) -> Handled { throw std::runtime_error("no such owner"); });
    for (const Pass pass : allPasses) {
        const Report report = host.run(pass, udpPacket(7000, twelveOctets));
        EXPECT_EQ(report.ending, Ending::cutOff);
        EXPECT_TRUE(report.handOffs.front().refused);
        EXPECT_EQ(report.flags, 0U);
        EXPECT_EQ(host.run(pass, udpPacket(6999, udpPacket(7000, twelveOctets))).ending, Ending::complete);
        EXPECT_FALSE(std::exchange(ran, true));
        EXPECT_THROW(static_cast<void>(host.run(pass, udpPacket(7001, twelveOctets))), std::runtime_error);
        EXPECT_EQ(host.run(pass, udpPacket(7002, twelveOctets)).ending, Ending::complete);
    }
}

// IPv4 in UDP in IPv4 and so on: an owner runs the plug-in again, in each pass.
TEST(Owners, runThePluginAgain) {
    Host host = freshHost();
    host.owners().add(7000, [](NextLayer &next) {
        if (next.runPlugin()) {
            return Handled::yes;
        }
        return takeAsData(next);
    });
    constexpr std::uint32_t levels = 5;
    Octets packet = udpPacket(40001, twelveOctets);
    for (std::uint32_t level = 1; level < levels; ++level) {
        packet = udpPacket(7000, packet);
    }
    for (const Pass pass : allPasses) {
        const Report report = host.run(pass, packet);
        EXPECT_EQ(report.ending, Ending::complete);
        EXPECT_EQ(report.bitsLeft, 0U);
        ASSERT_EQ(report.handOffs.size(), levels);
        EXPECT_EQ(report.handOffs.front().nesting, levels - 1) << "the innermost ends first";
        EXPECT_EQ(report.layerIndex, levels - 1);
        EXPECT_EQ(report.verdict.value, 0);
        EXPECT_EQ(std::ranges::count(report.fields, "Version", &FieldReport::name), pass == Pass::md ? levels : 0);

        RunOptions shallow;
        shallow.mostNesting = 2;
        EXPECT_EQ(host.run(pass, packet, shallow).handOffs.size(), 3U);
    }
    const Report keys = host.run(Pass::xtr, packet);
    EXPECT_EQ(keyText(*keys.key("UDP Destination Port")), "40001") << "the innermost value stays";
    const Report fields = host.run(Pass::md, packet);
    EXPECT_EQ(std::ranges::count(fields.blocks, "User Datagram Protocol", &Block::name), levels);
}

// An owner that takes 16 octets first puts the head of a DATA chunk before the payload.
TEST(Owners, takeTheUserDataOfAnSctpChunk) {
    const struct {
        std::string_view chunk;
        std::uint32_t taken; // octets after the head
        std::string_view text;
    } cases[] = {
        {"00 03 0014  00*12  aaaaaaaa  05 00 0004", 4, "Data=4 octets"},
        {"00 03 0011  00*12  aa 000000  05 00 0004", 4, "Data=1 octet"}, // with its padding
        {"00 03 0013  00*12  aaaaaa", 3, "Data=3 octets"},               // the padding is missing
        {"00 03 0100  00*12  aaaaaaaa", 4, "Data=4 octets"},             // cut short
        {"00 03 0010  00*12  aaaaaaaa aa", 0, ""},                       // no user data
        {"00 03 000f  00*12  aaaaaaaa aa", 5, "Data=5 octets"},          // no length of a DATA chunk
        {"06 03 0014  00*12  aaaaaaaa aa", 5, "Data=5 octets"},          // an ABORT chunk
    };
    for (const auto &[chunk, taken, text] : cases) {
        Host host = freshHost();
        host.owners().add(7000, [](NextLayer &next) {
            next.consume(16 * 8);
            return takeSctpUserData(next);
        });
        for (const Pass pass : allPasses) {
            const Report report = host.run(pass, udpPacket(7000, hex(chunk)));
            EXPECT_EQ(report.handOffs.front().consumedBits, (16 + taken) * 8) << chunk;
            if (pass == Pass::md) {
                const auto *const data = report.field("data");
                EXPECT_EQ(data == nullptr ? "" : data->text, text) << chunk;
            }
        }
    }
}

// Every single growth from the smallest storage on is refused in turn: the pass is cut off, says why, and no storage is
// lost. With all of them the report is the usual one.
TEST(Storage, growsAndCutsOffWhenThatIsRefused) {
    Host host = freshHost();
    const Octets packet = udpPacket(7000, twelveOctets);
    for (const Pass pass : allPasses) {
        std::uint32_t flagsSeen = 0;
        std::uint32_t allowed = 0;
        for (bool refused = true; refused; ++allowed) {
            refused = false;
            std::uint32_t asked = 0;
            TestRunOptions options;
            options.state.blockCapacity = options.state.limitCapacity = 1;
            options.state.layerCapacity = options.state.rangeCapacity = 1;
            options.state.allowGrowth = [&](std::size_t) {
                refused = asked++ == allowed;
                return !refused;
            };
            const Report report = host.run(pass, packet, options);
            EXPECT_EQ(report.ending, refused ? Ending::cutOff : Ending::complete);
            EXPECT_EQ(report.flags == 0, !refused);
            EXPECT_TRUE(refused || lines(report) == lines(host.run(pass, packet)));
            flagsSeen |= report.flags;
        }
        EXPECT_EQ(flagsSeen, 0x70000000U) << passName(pass);
        EXPECT_GT(allowed, 4U);
    }
}

TEST(Storage, takesStatesThatFitThePacket) {
    Host host = freshHost();
    const Octets packet = hex("45");
    const std::function<void(StateOptions &)> misfits[] = {
        [](StateOptions &state) { state.totalBits = 9; },
        [](StateOptions &state) { state.cursor = 0; },
        [](StateOptions &state) { state.cursor = 10; },
        [](StateOptions &state) { state.limitCapacity = 0; },
    };
    for (const auto &change : misfits) {
        TestRunOptions options;
        change(options.state);
        EXPECT_THROW(static_cast<void>(host.run(Pass::md, packet, options)), std::invalid_argument);
    }
    TestRunOptions flagged;
    flagged.state.flags = 0x2;
    EXPECT_EQ(host.run(Pass::mv, packet, flagged).verdict.value, -52);
    EXPECT_EQ(host.run(Pass::md, {}, TestRunOptions()).result, 1) << "an empty packet is a packet";
}

} // namespace
} // namespace netfloor::test
