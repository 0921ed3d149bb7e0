// SPDX-License-Identifier: MIT
// The damaged packets of the captures, as tcpdump and tshark name them too, and no others.
#include <filesystem>
#include <regex>
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
        "ip6-malformed-fragments.pcap 11", // a fragment of no whole units
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
        "sctp-over-ipv6.pcap 1", // a checksum that a test wrote
        "sctp-too-small.pcap 1",
        "tcp-urgent-loopback.pcap 8",
        "tcp-urgent-loopback.pcap 11",
        "tcp-urgent-loopback.pcap 23",
        "tcp-urgent-loopback.pcap 35",
        "tcp-urgent-loopback.pcap 36",
        "tcp-urgent-loopback.pcap 56",
        "tcp-urgent-loopback.pcap 59",
    };
    const std::regex damaged("^ *([0-9]+) .* DAMAGED ");
    std::set<std::string> found;
    for (const auto &entry : std::filesystem::directory_iterator(NETFLOOR_CAPTURES)) {
        if (entry.path().extension() == ".md") {
            continue;
        }
        const Outcome outcome = shell("netfloor verify --bad '" + entry.path().string() + "'");
        std::istringstream lines(outcome.out);
        std::string line;
        std::smatch match;
        while (std::getline(lines, line)) {
            if (std::regex_search(line, match, damaged)) {
                found.insert(entry.path().filename().string() + " " + match.str(1));
            }
        }
    }
    EXPECT_EQ(found, known);
}

} // namespace
} // namespace netfloor::test
