// SPDX-License-Identifier: MIT
// A capture that is written has what was read.
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "capture/files.h"
#include "netfloor-capture/capture_writer.h"
#include "netfloor-capture/errors.h"

namespace netfloor::test {
namespace {

// Writes what was read, and reads it again.
void expectSame(const std::string &path, const std::string &copy) {
    CaptureFile capture(path);
    CaptureWriter writer(copy);
    std::vector<std::string> expected;
    CaptureTime last;
    for (CapturedPacket packet; capture.next(packet); last = *packet.time) {
        writer.write(packet);
        if (!packet.time) { // a packet without one is written with the time of the packet before
            packet.time = last;
            packet.timeDigits = 9;
        }
        expected.push_back(told(packet));
    }
    writer.finish();
    EXPECT_EQ(readAll(CaptureFile(copy)), expected) << path;
}

TEST(CaptureWriter, writesWhatWasRead) {
    for (const std::string &path : testCaptures()) {
        expectSame(path, folder() + "/written.pcapng");
    }
}

TEST(CaptureWriter, keepsNamesCommentsAndFarTimes) {
    const std::string path = folder() + "/far.pcapng";
    const std::vector<std::uint8_t> octets = {0x45, 1, 2, 3, 4};
    const std::vector<std::string_view> comments = {"one", "and another"};
    const std::vector<std::int64_t> times = {0, -1, std::int64_t{1} << 40U, 1};
    std::vector<std::string> expected;
    CaptureWriter writer(path);
    for (const std::int64_t seconds : times) {
        writer.write({.time = CaptureTime{seconds, 123456789},
                      .timeDigits = 9,
                      .linkType = 101,
                      .wireOctets = 1500,
                      .octets = octets,
                      .interfaceName = "eth0",
                      .comments = comments});
        expected.push_back(std::to_string(expected.size() + 1) + " 101 eth0 1500 9 " + std::to_string(seconds) +
                           ".123456789#one#and another " + std::string(octets.begin(), octets.end()));
    }
    writer.finish();
    EXPECT_EQ(readAll(CaptureFile(path)), expected);
    expectSame(path, folder() + "/again.pcapng");
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
    const Octets octets(60000, 0); // which no buffer holds
    CaptureWriter other("/dev/full");
    EXPECT_THROW(other.write({.linkType = 101, .octets = octets}), CaptureWriteError);
}

// A pcap file has more bits for the link type than a pcapng file.
TEST(CaptureWriter, refusesALinkTypeThatPcapngCannotHold) {
    CaptureWriter writer(folder() + "/types.pcapng");
    writer.write({.linkType = 65535});
    EXPECT_THROW(writer.write({.linkType = 65536 + 101}), CaptureWriteError);
}

} // namespace
} // namespace netfloor::test
