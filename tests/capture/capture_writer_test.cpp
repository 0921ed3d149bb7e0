// SPDX-License-Identifier: MIT
// A capture that is written has what was read.
#include <filesystem>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "netfloor-capture/capture_file.h"
#include "netfloor-capture/capture_writer.h"
#include "netfloor-capture/errors.h"
#include "support/temporary_folder.h"

namespace netfloor::test {
namespace {

void expectSame(const std::string &expected, const std::string &written) {
    CaptureFile left(expected);
    CaptureFile right(written);
    CapturedPacket one;
    CapturedPacket other;
    while (left.next(one)) {
        ASSERT_TRUE(right.next(other)) << expected << " packet " << one.number;
        EXPECT_EQ(std::vector(one.octets.begin(), one.octets.end()),
                  std::vector(other.octets.begin(), other.octets.end()));
        EXPECT_EQ(one.wireOctets, other.wireOctets);
        EXPECT_EQ(one.linkType, other.linkType);
        EXPECT_EQ(one.interfaceName, other.interfaceName);
        EXPECT_EQ(std::vector(one.comments.begin(), one.comments.end()),
                  std::vector(other.comments.begin(), other.comments.end()));
        if (one.time) {
            EXPECT_EQ(one.time, other.time) << expected << " packet " << one.number;
            EXPECT_EQ(one.timeDigits, other.timeDigits) << expected;
        }
    }
    EXPECT_FALSE(right.next(other)) << expected;
}

TEST(CaptureWriter, writesWhatWasRead) {
    const TemporaryFolder folder;
    const std::string path = (folder.path() / "written.pcapng").string();
    for (const auto &entry : std::filesystem::directory_iterator(NETFLOOR_CAPTURES)) {
        if (!entry.path().filename().string().starts_with("README")) {
            CaptureFile capture(entry.path().string());
            CaptureWriter writer(path);
            CapturedPacket packet;
            while (capture.next(packet)) {
                writer.write(packet);
            }
            writer.finish();
            expectSame(entry.path().string(), path);
        }
    }
}

TEST(CaptureWriter, keepsNamesCommentsAndFarTimes) {
    const TemporaryFolder folder;
    const std::string path = (folder.path() / "first.pcapng").string();
    const std::string again = (folder.path() / "second.pcapng").string();
    const std::vector<std::uint8_t> octets = {0x45, 1, 2, 3, 4};
    const std::vector<std::string_view> comments = {"one", "and another"};
    {
        CaptureWriter writer(path);
        for (const std::int64_t seconds :
             {std::int64_t{0}, std::int64_t{-1}, std::int64_t{1} << 40U, std::int64_t{1}}) {
            writer.write({.time = CaptureTime{seconds, 123456789},
                          .timeDigits = 9,
                          .linkType = 101,
                          .wireOctets = 1500,
                          .octets = octets,
                          .interfaceName = "eth0",
                          .comments = comments});
        }
        writer.finish();
    }
    CaptureFile capture(path);
    CaptureWriter writer(again);
    CapturedPacket packet;
    for (const std::int64_t seconds : {std::int64_t{0}, std::int64_t{-1}, std::int64_t{1} << 40U, std::int64_t{1}}) {
        ASSERT_TRUE(capture.next(packet));
        EXPECT_EQ(packet.time, (CaptureTime{seconds, 123456789}));
        EXPECT_EQ(packet.interfaceName, "eth0");
        EXPECT_EQ(packet.comments.size(), 2U);
        writer.write(packet);
    }
    writer.finish();
    expectSame(path, again);
}

TEST(CaptureWriter, saysThatAFileCannotBeWritten) {
    EXPECT_THROW(CaptureWriter("/nowhere/there.pcapng"), CaptureWriteError);
    CaptureWriter writer("/dev/full");
    EXPECT_THROW(
        {
            writer.write({.linkType = 101});
            writer.finish();
        },
        CaptureWriteError);
}

// A pcap file has more bits for the link type than a pcapng file.
TEST(CaptureWriter, refusesALinkTypeThatPcapngCannotHold) {
    const TemporaryFolder folder;
    CaptureWriter writer(folder.path() / "far.pcapng");
    writer.write({.linkType = 65535});
    EXPECT_THROW(writer.write({.linkType = 65536 + 101}), CaptureWriteError);
}

} // namespace
} // namespace netfloor::test
