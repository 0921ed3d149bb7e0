// SPDX-License-Identifier: MIT
// The shards of a capture have its packets, each once, and nothing else has.
#include <algorithm>
#include <filesystem>
#include <string>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

#include "capture/files.h"
#include "netfloor-capture/capture_file.h"

namespace netfloor::test {
namespace {

// Tries shards of a 1st, 2nd, 7th and 64th of the file.
void check(const std::string &path) {
    SCOPED_TRACE(path);
    const std::vector<std::string> whole = readAll(CaptureFile(path), true);
    for (const std::uint64_t count : {1U, 2U, 7U, 64U}) {
        SCOPED_TRACE(count);
        const std::uint64_t octets = (std::filesystem::file_size(path) + count - 1) / count;
        const CapturePlan plan = planShards(path, octets);
        EXPECT_LE(plan.shards.size(), count);
        std::vector<std::string> joined;
        for (std::size_t i = 0; i < plan.shards.size(); ++i) {
            const auto part = readAll(CaptureFile(plan, i), true);
            EXPECT_EQ(part.size(), plan.shards[i].packets + (plan.damage.empty() || plan.shards[i].end ? 0 : 1));
            joined.insert(joined.end(), part.begin(), part.end());
        }
        EXPECT_EQ(joined, whole);
    }
}

TEST(Shards, haveThePacketsOfTheCapture) {
    std::ranges::for_each(testCaptures(), check);
    for (const std::uint32_t magic : {0xa1b2c3d4U, 0xa1b23c4dU, 0xa1b2cd34U}) {
        for (const bool bigEndian : {false, true}) {
            const Numbers numbers{bigEndian};
            Octets file = numbers.pcapHead(magic, 65535, 1);
            for (std::uint32_t i = 0; i < 200; ++i) {
                const Octets octets(i % 60, static_cast<std::uint8_t>(i));
                file = file + numbers.u32(i) + numbers.u32(999) + numbers.u32(i % 60) + numbers.u32(100) +
                       (magic == 0xa1b2cd34U ? hex("00*8") : Octets()) + octets;
            }
            check(writeFile("numbers.pcap", file));
            check(writeFile("damaged.pcap", Octets(file.begin(), file.end() - 30)));
        }
    }
    // Sections, interfaces described between packets, blocks without one, and damage after the last whole packet.
    Octets blocks;
    for (std::uint32_t section = 0; section < 3; ++section) {
        blocks = blocks + pcapngSection() + pcapngInterface(1, hex("0002 0003 61626300 0000 0000"));
        for (std::uint32_t i = 0; i < 30; ++i) {
            blocks = blocks + pcapngPacket(i / 10, i, Octets(i, 1)) + pcapngBlock(5, hex("00*8")) +
                     (i % 10 == 9 ? pcapngInterface(101, hex("0009 0001 09 000000 0000 0000")) : Octets());
        }
    }
    check(writeFile("sections.pcapng", blocks));
    check(writeFile("unknown.pcapng", blocks + pcapngPacket(9, 0, {})));
    check(writeFile("empty.pcapng", pcapngSection()));
}

TEST(Shards, areRefusedWhereTheFileHasChanged) {
    const std::vector<PcapPacket> packets(100, {hex("61*60")});
    const Octets octets = pcapFile(1, packets);
    const std::string path = writeFile("planned.pcap", octets);
    CapturePlan plan = planShards(path, 2000);
    ASSERT_EQ(plan.shards.size(), 4U);
    const auto reason = [&](std::size_t shard) -> std::string {
        try {
            return readAll(CaptureFile(plan, shard)).back();
        } catch (const CaptureError &error) {
            return error.what();
        }
    };
    // Of another plan: no packet that is not the shard's is given.
    Shard &second = plan.shards[1];
    const Shard sound = second;
    second.end = *sound.end + 8;
    EXPECT_NE(reason(1).find("; the reading is at octet " + std::to_string(*sound.end) + " after packet " +
                             std::to_string(plan.shards[2].begin.packets)),
              std::string::npos)
        << reason(1);
    second = sound;
    second.packets -= 1;
    EXPECT_NE(reason(1).find("has changed since it was planned"), std::string::npos) << reason(1);

    second = sound;
    const std::uint64_t last =
        std::exchange(plan.shards[3].begin.position, std::uint64_t{1} << 63U); // no file is so long
    EXPECT_NE(reason(3).find("Invalid argument"), std::string::npos) << reason(3);
    plan.shards[3].begin.position = last;

    plan.file.modified -= 1;
    EXPECT_NE(reason(0).find("another time of change"), std::string::npos) << reason(0);
    Octets other = octets;
    other[5] ^= 1U;
    writeFile("planned.pcap", other);
    EXPECT_NE(reason(0).find("begins with other octets"), std::string::npos) << reason(0);
    writeFile("planned.pcap", octets + hex("00"));
    EXPECT_NE(reason(3).find("octets and has " + std::to_string(octets.size() + 1)), std::string::npos) << reason(3);

    CapturePlan sections = planShards(std::string(NETFLOOR_CAPTURES) + "/icmp-types.pcapng", 500);
    sections.sections.front().interfaces.front() += 4;
    EXPECT_THROW((void)CaptureFile(sections, 1), CaptureError);

    const CapturePlan packed = planShards(writePacked("packed.gz", octets), 100);
    EXPECT_TRUE(packed.isPacked);
    EXPECT_EQ(packed.shards.size(), 1U);
    EXPECT_EQ(readAll(CaptureFile(packed, 0)), readAll(CaptureFile(writeFile("again.pcap", octets))));
    EXPECT_THROW((void)planShards("/dev/null", 100), CaptureError);
}

} // namespace
} // namespace netfloor::test
