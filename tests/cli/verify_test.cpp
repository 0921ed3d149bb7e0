// SPDX-License-Identifier: MIT
// The damaged packets of the captures, and no others. tcpdump or tshark name all of them but three, which say why.
#include <filesystem>
#include <set>
#include <sstream>
#include <string>

#include <gtest/gtest.h>

#include "cli/command.h"

namespace netfloor::test {
namespace {

TEST(Verify, callsDamagedWhatIsDamaged) {
    const std::set<std::string> known = {
        "ip4-header-length-invalid.pcap 1",
        "ip6-malformed-fragments.pcap 11", // a fragment of no whole units, which tshark lets pass
        "ip6-next-header-malformed.pcap 1",
        "ip6-zero-length-ah.pcap 5", // octets where tshark shows an authentication header without a word on it
        "malformed-too-small.pcap 1",
        "malformed-too-small.pcap 2",
        "malformed-too-small.pcap 3",
        "malformed-too-small.pcap 4",
        "malformed-too-small.pcap 5",
        "malformed-too-small.pcap 6",
        "malformed-too-small.pcap 7",
        "malformed-too-small.pcap 8",
        "malformed-truncated-header.pcap 1",
        "sctp-over-ipv6.pcap 1", // a checksum that a test wrote; tshark does not check it unless asked
        "sctp-too-small.pcap 1",
        "tcp-urgent-loopback.pcap 8",
        "tcp-urgent-loopback.pcap 11",
        "tcp-urgent-loopback.pcap 23",
        "tcp-urgent-loopback.pcap 35",
        "tcp-urgent-loopback.pcap 36",
        "tcp-urgent-loopback.pcap 56",
        "tcp-urgent-loopback.pcap 59",
    };
    std::set<std::string> found;
    for (const auto &entry : std::filesystem::directory_iterator(NETFLOOR_CAPTURES)) {
        if (entry.path().extension() == ".md") {
            continue;
        }
        const Outcome outcome = shell("netfloor verify --bad '" + entry.path().string() + "'");
        std::istringstream lines(outcome.out);
        std::string line;
        while (std::getline(lines, line)) {
            if (line.find(" DAMAGED ") != std::string::npos) {
                std::string number;
                std::istringstream(line) >> number;
                found.insert(entry.path().filename().string() + " " + number);
            }
        }
    }
    EXPECT_EQ(found, known);
}

} // namespace
} // namespace netfloor::test
