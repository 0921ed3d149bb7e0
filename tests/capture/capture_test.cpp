// SPDX-License-Identifier: MIT
// Good captures: the packets of each format, and what reading them costs.
#include <optional>
#include <string>
#include <vector>

#include <gtest/gtest.h>
#include <unistd.h>

#include "capture/allocations.h"
#include "capture/files.h"
#include "netfloor-capture/capture_file.h"
#include "netfloor-capture/filter.h"
#include "netfloor-capture/link_layer.h"
#include "netfloor-capture/time_text.h"

namespace netfloor::test {
namespace {

std::string timeOf(const CapturedPacket &packet) {
    return packet.time ? std::to_string(packet.time->seconds) + "+" + std::to_string(packet.time->nanoseconds) : "none";
}

TEST(Pcap, isReadInEachForm) {
    struct Form {
        std::uint32_t magic;
        std::uint8_t digits;
        const char *secondTime; // of 1,011,041 units: a file may have more than a second in them
    };
    const std::vector<Form> forms = {
        {0xa1b2c3d4, 6, "8+11041000"}, {0xa1b23c4d, 9, "7+1011041"}, {0xa1b2cd34, 6, "8+11041000"}};
    for (const Form &form : forms) {
        for (const bool bigEndian : {true, false}) {
            for (const bool packed : {true, false}) {
                SCOPED_TRACE(std::to_string(form.magic) + (bigEndian ? " big" : " little") + (packed ? " gzip" : ""));
                const Numbers n{bigEndian};
                const Octets more = form.magic == 0xa1b2cd34 ? hex("00*8") : Octets();
                const Octets file = n.pcapHead(form.magic, 65535, 0xf0000001) + n.u32(0xfffffffe) + n.u32(5) +
                                    n.u32(3) + n.u32(60) + more + hex("010203") + n.u32(7) + n.u32(1'011'041) +
                                    n.u32(0) + n.u32(0) + more;
                CaptureFile capture(packed ? writePacked("form.gz", file) : writeFile("form", file));
                CapturedPacket packet;
                ASSERT_TRUE(capture.next(packet));
                EXPECT_EQ(hexText(packet.octets), "01 02 03");
                EXPECT_EQ(packet.wireOctets, 60U);
                EXPECT_TRUE(packet.isCut());
                EXPECT_EQ(packet.position, 24U);
                EXPECT_EQ(packet.linkType, 1);
                EXPECT_EQ(packet.timeDigits, form.digits);
                EXPECT_EQ(packet.time->seconds, 0xfffffffe);
                ASSERT_TRUE(capture.next(packet));
                EXPECT_EQ(packet.position, 24U + 16 + more.size() + 3);
                EXPECT_EQ(timeOf(packet), form.secondTime);
                EXPECT_FALSE(capture.next(packet));
                EXPECT_FALSE(capture.next(packet));
            }
        }
    }
}

TEST(Pcap, oldVersionsHaveTheLengthsInTheOtherOrder) {
    const Numbers n{true};
    for (const std::uint32_t minor : {2U, 3U}) {
        Octets file = n.pcapHead(0xa1b2c3d4, 65535, 1) + n.u32(0) + n.u32(0) + n.u32(9) + n.u32(2) + hex("0102");
        file[7] = static_cast<std::uint8_t>(minor);
        EXPECT_EQ(readAll(CaptureFile(writeFile("old", file))), std::vector<std::string>{"1 1  9 6 0.0 \1\2"});
    }
}

TEST(Pcapng, timesFollowTheInterface) {
    constexpr std::uint64_t all = ~std::uint64_t{0};
    struct Row {
        const char *resolution;
        const char *offset;
        std::uint64_t units;
        const char *expected;
        int digits;
    };
    const std::vector<Row> rows = {
        {"06", "00*8", 1'500'000, "1+500000000", 6},
        {"00", "00*8", 3, "3+0", 0},
        {"03", "00*8", 3'007, "3+7000000", 3},
        {"09", "0000000000000064", 1'000'000'007, "101+7", 9},
        {"0c", "ffffffffffffffff", 1'000'000'007'999, "0+7", 9}, // finer than a nanosecond, and one second less
        {"13", "00*8", all, "1+844674407", 9},
        {"14", "00*8", all, "0+184467440", 9},
        {"1d", "00*8", all, "0+0", 9},
        {"7f", "00*8", all, "0+0", 9},
        {"80", "00*8", 3, "3+0", 0},
        {"8a", "00*8", 5 * 1024 + 512, "5+500000000", 4},
        {"a2", "00*8", (std::uint64_t{1} << 34) - 1, "0+999999999", 9},
        {"bf", "00*8", all, "1+999999999", 9},
        {"c0", "00*8", all, "0+999999999", 9},
        {"ff", "00*8", all, "0+0", 9},
        {"00", "00*8", all, "none", 0}, // more seconds than 64 bits hold
        {"06", "7fffffffffffffff", 1'000'000, "none", 6},
        {"06", "7fffffffffffffff", 1, "9223372036854775807+1000", 6},
        {"06", "8000000000000000", 1'000'000, "-9223372036854775807+0", 6},
        {"00", "8000000000000000", all, "9223372036854775807+0", 0},
    };
    for (const Row &row : rows) {
        SCOPED_TRACE(std::string(row.resolution) + " " + row.expected);
        const Octets options = hex("0009 0001") + hex(row.resolution) + hex("000000 000e 0008") + hex(row.offset);
        CaptureFile capture(writeFile("times", pcapngSection() + pcapngInterface(1, options) +
                                                   pcapngPacket(0, row.units, hex("0102"))));
        CapturedPacket packet;
        ASSERT_TRUE(capture.next(packet));
        EXPECT_EQ(timeOf(packet), row.expected);
        EXPECT_EQ(packet.timeDigits, row.digits);
    }
}

// A length that is no multiple of four: the padding is there and not counted, or it is not there.
TEST(Pcapng, blocksOfOddLengthAreReadWithANote) {
    const Octets before = pcapngSection() + pcapngInterface(1, {});
    const Octets head = hex("00*12") + be32(5) + be32(5) + hex("0102030405");
    const Octets packet = be32(6) + be32(37) + head;
    for (const Octets &padding : {Octets(), hex("00*3")}) {
        SCOPED_TRACE(hexText(padding));
        const Octets unknown = be32(0x0bad) + be32(15) + hex("010203") + Octets(padding.size() / 3, 0) + be32(15);
        CaptureFile capture(
            writeFile("odd", before + packet + padding + be32(37) + unknown + pcapngPacket(0, 1, hex("0607"))));
        CapturedPacket read;
        ASSERT_TRUE(capture.next(read));
        EXPECT_EQ(hexText(read.octets), "01 02 03 04 05");
        ASSERT_TRUE(capture.next(read));
        EXPECT_EQ(hexText(read.octets), "06 07");
        EXPECT_FALSE(capture.next(read));
        EXPECT_NE(capture.note().find("lengths of 2 blocks"), std::string::npos) << capture.note();
        EXPECT_NE(capture.note().find("octet " + std::to_string(before.size())), std::string::npos) << capture.note();
    }
}

TEST(Pcapng, namesAndCommentsComeWithThePacket) {
    const Octets named = pcapngInterface(1, hex("0002 0004 65746830"));
    const Octets body = hex("00*12") + be32(3) + be32(3) + hex("01020300");
    const Octets comments = hex("0001 0002 68690000 0002 0004 00000000 0001 0003 61626300 0000 0000");
    const std::vector<std::string> packets = readAll(
        CaptureFile(writeFile("named", pcapngSection() + named + pcapngBlock(6, body + comments) +
                                           pcapngBlock(6, body) + pcapngBlock(6, body + hex("0001 0009 6869")))));
    // The second has no options, and that of the third ends after its block.
    EXPECT_EQ(packets, (std::vector<std::string>{"1 1 eth0 3 6 0.0#hi#abc \1\2\3", "2 1 eth0 3 6 0.0 \1\2\3",
                                                 "3 1 eth0 3 6 0.0 \1\2\3"}));
}

TEST(Times, areWrittenWithoutOverflow) {
    constexpr std::int64_t most = INT64_MAX;
    constexpr std::int64_t least = INT64_MIN;
    struct Row {
        CaptureTime first;
        CaptureTime time;
        std::uint8_t digits;
        const char *sinceFirst;
        const char *utc;
    };
    const std::vector<Row> rows = {
        {{5, 999'999'999}, {7, 1}, 6, "1.000000", "1970-01-01T00:00:07.000000Z"},
        {{5, 999'999'999}, {7, 1}, 9, "1.000000002", "1970-01-01T00:00:07.000000001Z"},
        {{7, 1}, {5, 999'999'999}, 9, "-1.000000002", "1970-01-01T00:00:05.999999999Z"},
        {{least, 0}, {most, 999'999'999}, 9, "18446744073709551615.999999999", "9223372036854775807.999999999"},
        {{most, 0}, {least, 1}, 9, "-18446744073709551614.999999999", "-9223372036854775808.000000001"},
        {{0, 0}, {18446744073204, 126'329'000}, 6, "18446744073204.126329", "586524-01-19T07:53:24.126329Z"},
    };
    for (const Row &row : rows) {
        SCOPED_TRACE(row.sinceFirst);
        for (const auto &[form, expected] :
             {std::pair{TimeForm::sinceFirst, row.sinceFirst}, {TimeForm::utc, row.utc}}) {
            TimeText times(form);
            times.see({}); // a packet without a time is no first one
            times.see({.time = row.first, .timeDigits = row.digits});
            EXPECT_EQ(times.text({.time = row.time}), expected);
            EXPECT_EQ(times.text({}), "");
        }
    }
    EXPECT_EQ((CaptureTime{-1, 5}.inNanoseconds()), -999'999'995);
    EXPECT_EQ((CaptureTime{most / 1'000'000'000, 999'999'999}.inNanoseconds()), std::nullopt);
}

// Nothing is allocated for a packet, in any format of capture, link layer, filter and time text included.
TEST(Reading, allocatesNothingOnceItRuns) {
    const Octets ethernet = hex("ff*6 02*6 0800") + ipv4({.protocol = 17, .payload = udp(1, 53, hex("61*8"))});
    const std::vector<Octets> kinds = {ethernet, hex("ff*6 02*6 0806 00*46"), hex("ff*6 02*6 1234 00*46"), hex("ff*9")};
    std::vector<PcapPacket> packets;
    Octets blocks = pcapngSection() + pcapngInterface(1, {}) + pcapngInterface(101, {});
    for (std::uint32_t i = 0; i < 4000; ++i) {
        packets.push_back({kinds[i % kinds.size()]});
        const Octets block = pcapngPacket(i % 2, std::uint64_t{i} * 1'000'000, packets.back().octets);
        blocks.insert(blocks.end(), block.begin(), block.end());
    }
    const Octets pcap = pcapFile(1, packets);
    for (const std::string &path : {writeFile("many.pcap", pcap), writePacked("many.gz", pcap),
                                    writeFile("many.pcapng", blocks), writePacked("many.pcapng.gz", blocks)}) {
        SCOPED_TRACE(path);
        CaptureFile capture(path);
        PacketFilter filter("udp port 53");
        TimeText sinceFirst(TimeForm::sinceFirst);
        TimeText utc(TimeForm::utc);
        CapturedPacket packet;
        std::optional<std::uint64_t> before;
        std::size_t ip = 0;
        while (capture.next(packet)) {
            if (packet.number == 8) { // each kind has come twice
                before = allocations();
            }
            (void)filter.passes(packet);
            ip += findNetworkPart(packet.linkType, packet.octets).isIp() ? 1 : 0;
            (void)sinceFirst.text(packet);
            (void)utc.text(packet);
        }
        EXPECT_EQ(allocations(), before);
        EXPECT_EQ(packet.number, 4000U);
        EXPECT_GE(ip, 1000U);
    }
}

TEST(Reading, followsAFileThatGrowsOrShrinks) {
    const Octets octets = pcapFile(1, std::vector<PcapPacket>(1000, {hex("61*1000")}));
    const std::string path = writeFile("changing", octets);
    const auto readTo = [&](std::size_t newSize) {
        CaptureFile capture(path);
        CapturedPacket packet;
        EXPECT_TRUE(capture.next(packet));
        EXPECT_EQ(::truncate(path.c_str(), static_cast<off_t>(newSize)), 0);
        double last = capture.progress().value();
        while (capture.next(packet)) {
            EXPECT_GE(capture.progress().value(), last);
            last = capture.progress().value();
        }
        EXPECT_LE(last, 1.0);
        return packet.number;
    };
    EXPECT_EQ(readTo(octets.size() + 2 * 16), 1002U); // two packets of no octets
    EXPECT_THROW((void)readTo(24 + 1016 * 500 + 50), CaptureDamage);
    EXPECT_EQ(readTo(24 + 1016 * 400), 400U);
}

} // namespace
} // namespace netfloor::test
