// SPDX-License-Identifier: MIT
// Damaged and hostile captures: their messages, and the bound of the memory that they take.
#include <fstream>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "capture/files.h"
#include "netfloor-capture/capture_file.h"
#include "netfloor-capture/filter.h"

namespace netfloor::test {
namespace {

const Octets ethernet = hex("ff*6 02*6 0800") + ipv4({.protocol = 17, .payload = udp(1, 53, hex("61*8"))});

Octets pcapRecord(std::uint32_t captured, const Octets &octets) {
    return be32(1) + be32(2) + be32(captured) + be32(captured) + octets;
}

Octets pcapngRecord(std::uint32_t captured, std::uint32_t blockOctets) {
    return be32(6) + be32(blockOctets) + hex("00*12") + be32(captured) + be32(captured);
}

struct Ending {
    std::uint64_t packets = 0;
    std::uint64_t lost = 0; // number of the packet that is damaged; 0: none is
    std::uint64_t position = 0;
    std::string sentence;
};

Ending endingOf(const std::string &path) {
    Ending ending;
    try {
        CaptureFile capture(path);
        CapturedPacket packet;
        while (capture.next(packet)) {
            ending.packets = packet.number;
        }
    } catch (const CaptureDamage &damage) {
        ending.lost = damage.packetNumber();
        ending.position = damage.position();
        ending.sentence = damage.what();
    } catch (const CaptureError &error) {
        ending.sentence = error.what();
    }
    return ending;
}

TEST(Damage, isReportedWithItsPlaceAfterThePacketsBeforeIt) {
    const Octets pcap = Numbers{true}.pcapHead(0xa1b2c3d4, 65535, 1) + pcapRecord(50, ethernet);
    const Octets pcapng = pcapngSection() + pcapngInterface(1, {}) + pcapngPacket(0, 1, ethernet);
    const std::uint64_t end = pcap.size();
    const std::uint64_t blockEnd = pcapng.size();
    const Octets oversized = pcapngBlock(1, hex("0001 0000 00000000") + Octets(1024 * 1024, 0));
    struct Row {
        Octets file;
        std::uint64_t position;
        const char *reason;
    };
    const std::vector<Row> rows = {
        {pcap + pcapRecord(262145, {}), end, "a length of 262145 octets, where 262144 is the limit, in packet 2"},
        {pcap + pcapRecord(0xffffffff, hex("00*40")), end, "a length of 4294967295 octets"},
        {pcap + pcapRecord(262144, hex("00*40")), end,
         "cut off at octet 146, in packet 2, which begins at octet 90 of the file"},
        {pcapng + hex("0000"), blockEnd, "cut off at octet"},
        {pcapng + pcapngRecord(50, 32) + be32(32), blockEnd, "a packet larger than its block"},
        {pcapng + hex("00000006 00000014 00*8 00000014"), blockEnd, "a packet block that is too short"},
        {pcapng + pcapngRecord(17 << 20, (17 << 20) + 32), blockEnd, "a length of 17825792 octets, where 16777216"},
        {pcapng + pcapngRecord(0, (2 << 20) + 32), blockEnd, "with 2097152 octets of options"},
        {pcapng + oversized, blockEnd, "an interface description of 1048596 octets"},
        {pcapng + hex("00000001 00000010 00000000 00000010"), blockEnd, "description that is too short"},
        {pcapng + pcapngPacket(9, 0, {}), blockEnd, "an interface that is not described"},
        {pcapng + hex("00000005 fffffffc 00*20"), blockEnd, "a block of 4294967292 octets"},
        {pcapng + hex("00000005 00000010 00*4 00000014"), blockEnd, "two lengths differ"},
        {pcapng + hex("0a0d0d0a 0000001c 11111111"), blockEnd, "a section header without a byte order"},
    };
    for (const Row &row : rows) {
        SCOPED_TRACE(row.reason);
        const Ending ending = endingOf(writeFile("damaged", row.file));
        EXPECT_EQ(ending.packets, 1U);
        EXPECT_EQ(ending.lost, 2U);
        EXPECT_EQ(ending.position, row.position);
        EXPECT_NE(ending.sentence.find(row.reason), std::string::npos) << ending.sentence;
        EXPECT_NE(ending.sentence.find("the 1 packet in front of it is whole. Copy or take"), std::string::npos);
    }
}

// Wherever a file ends, the packets in front are given, and the end is damage unless a record ends there.
TEST(Damage, isWhereverAFileIsCut) {
    const Octets blocks = pcapngSection() + pcapngInterface(1, hex("0002 0003 61626300 0000 0000")) +
                          pcapngPacket(0, 1, ethernet) + pcapngBlock(5, hex("00*8")) + // statistics
                          pcapngBlock(3, be32(50) + ethernet) +
                          pcapngBlock(2, hex("00*12") + be32(5) + be32(5) + hex("0102030405")) +
                          pcapngInterface(1, {}) + pcapngSection();
    const Octets records = Numbers{true}.pcapHead(0xa1b2c3d4, 65535, 1) + pcapRecord(50, ethernet) + pcapRecord(0, {});
    struct Row {
        Octets file;
        std::size_t wholeAt; // as many places
        std::uint64_t packets;
    };
    for (const Row &row : std::vector<Row>{{blocks, 8, 3}, {records, 3, 2}}) {
        std::size_t whole = 0;
        std::uint64_t before = 0;
        for (std::size_t size = 0; size <= row.file.size(); ++size) {
            SCOPED_TRACE(size);
            const Octets cut(row.file.begin(), row.file.begin() + static_cast<std::ptrdiff_t>(size));
            const Ending ending = endingOf(writeFile("cut", cut));
            EXPECT_TRUE(ending.packets == before || ending.packets == before + 1) << ending.packets;
            before = ending.packets;
            whole += ending.sentence.empty() ? 1 : 0;
            if (ending.lost != 0) {
                EXPECT_EQ(ending.lost, before + 1);
                EXPECT_NE(ending.sentence.find("cut off at octet " + std::to_string(size)), std::string::npos)
                    << ending.sentence;
            }
        }
        EXPECT_EQ(before, row.packets);
        EXPECT_EQ(whole, row.wholeAt);
    }
}

// A packet that is as large as its capture allows is no damage.
TEST(Damage, isNoLargePacket) {
    const std::uint32_t size = std::uint32_t{3} << 20;
    const Octets file = Numbers{true}.pcapHead(0xa1b2c3d4, 4 << 20, 1) + pcapRecord(size, Octets(size, 7));
    EXPECT_EQ(endingOf(writeFile("large", file)).packets, 1U);
    const Octets blocks = pcapngSection() + pcapngInterface(1, {}) + pcapngPacket(0, 1, Octets(size, 7));
    EXPECT_EQ(endingOf(writeFile("large", blocks)).packets, 1U);
}

// Of the process, by its name in /proc/self/status.
long statusKiB(const std::string &name) {
    std::ifstream status("/proc/self/status");
    for (std::string word; status >> word;) {
        long number = 0;
        if (word == name + ":" && status >> number) {
            return number;
        }
    }
    return -1;
}

bool resetPeak() {
    return (std::ofstream("/proc/self/clear_refs") << "5" << std::flush).good();
}

#ifdef __SANITIZE_ADDRESS__
constexpr long mostKiB = 96L * 1024; // the sanitizer keeps what is freed for a while
#else
constexpr long mostKiB = 24L * 1024;
#endif

// Small files that unpack to much data, or announce much. The bound holds for any capture.
TEST(Memory, staysBounded) {
    const Octets section = pcapngSection();
    const Octets interface = pcapngInterface(1, {});
    const Octets chatty = pcapngInterface(1, hex("0002 f000") + Octets(0xf000, 'x'));
    const Octets packet = pcapngPacket(0, 1, ethernet);
    Octets interfaces; // 1000 of them
    for (int i = 0; i < 1000; ++i) {
        interfaces.insert(interfaces.end(), interface.begin(), interface.end());
    }
    const Octets zeros(std::size_t{1} << 20, 0);
    const Octets comment = pcapngBlock(0x0bad, Octets((32U << 20) - 12, 0));
    const Octets anySnap = Numbers{true}.pcapHead(0xa1b2c3d4, 0, 1);
    struct Row {
        const char *what;
        std::string path;
        std::uint64_t packets;
        const char *sentence;
    };
    const std::vector<Row> rows = {
        {"interfaces", writePacked("a", section, interfaces, 4000, packet), 1, ""},
        {"an interface that is not kept",
         writePacked("b", section, interfaces, 300, packet + pcapngPacket(299'999, 1, ethernet)), 1,
         "interface 299999, where 262144 is the limit, in packet 2"},
        {"names and comments", writePacked("c", section, chatty, 2000, packet), 1, ""},
        {"other blocks", writePacked("d", section + interface, comment, 4, packet), 1, ""},
        {"a length that is not there", writePacked("e", anySnap + pcapRecord(16 << 20, {}), zeros, 15), 0, "cut off"},
        {"empty packets", writePacked("f", anySnap, zeros, 64), 4'194'304, ""},
    };
    for (const Row &row : rows) {
        SCOPED_TRACE(row.what);
        if (!resetPeak()) {
            GTEST_SKIP() << "this system does not measure the peak of memory";
        }
        const long before = statusKiB("VmRSS");
        const Ending ending = endingOf(row.path);
        EXPECT_LT(statusKiB("VmHWM") - before, mostKiB);
        EXPECT_EQ(ending.packets, row.packets);
        EXPECT_NE(ending.sentence.find(row.sentence), std::string::npos) << ending.sentence;
    }
}

struct Filtered {
    std::vector<std::uint64_t> packets; // that passed
    std::uint64_t refused = 0;
    bool refusedAll = false;
};

Filtered filterAll(const std::string &expression, const Octets &file) {
    CaptureFile capture(writeFile("filtered", file));
    PacketFilter filter(expression);
    Filtered result;
    for (CapturedPacket packet; capture.next(packet);) {
        if (filter.passes(packet)) {
            result.packets.push_back(packet.number);
        }
    }
    for (const auto &[linkType, refused] : filter.refused()) {
        result.refused += refused.packets;
    }
    result.refusedAll = filter.refusedAll();
    return result;
}

// A link type for which the expression does not compile loses its own packets, and no others.
TEST(Filter, leavesOutOnlyWhatItCannotFilter) {
    constexpr std::uint16_t unknown = 147; // for private use
    const Octets ip(ethernet.begin() + 14, ethernet.end());
    const Octets interfaces = pcapngSection() + pcapngInterface(unknown, {}) + pcapngInterface(1, {}) +
                              pcapngInterface(101, {}); // libpcap has another number for the last
    const Octets mixed = interfaces + pcapngPacket(0, 1, ip) + pcapngPacket(1, 1, ethernet) + pcapngPacket(2, 1, ip) +
                         pcapngPacket(0, 1, ip) + pcapngPacket(1, 1, hex("00*60"));
    const Filtered some = filterAll("udp dst port 53", mixed);
    EXPECT_EQ(some.packets, (std::vector<std::uint64_t>{2, 3}));
    EXPECT_EQ(some.refused, 2U);
    EXPECT_FALSE(some.refusedAll);

    EXPECT_EQ(filterAll("ether dst ff:ff:ff:ff:ff:ff", mixed).packets,
              std::vector<std::uint64_t>{2}); // of one type alone
    EXPECT_TRUE(filterAll("udp", interfaces + pcapngPacket(0, 1, ip)).refusedAll);
    EXPECT_THROW((void)filterAll("no such", mixed), FilterError);
    EXPECT_THROW((void)filterAll("udp port", interfaces + pcapngPacket(1, 1, ethernet)), FilterError);
}

} // namespace
} // namespace netfloor::test
