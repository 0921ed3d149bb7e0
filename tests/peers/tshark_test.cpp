// SPDX-License-Identifier: MIT
// Real captures, compared with what tshark says of them: every value of every pair of fields in every packet.
//
// Captures of another folder are compared with
//     NETFLOOR_PEER_CAPTURES=FOLDER build/tests/test_peers
#include <algorithm>
#include <cstdlib>
#include <set>
#include <string>
#include <string_view>
#include <vector>

#include <gtest/gtest.h>

#include "netfloor-capture/capture_file.h"
#include "netfloor-capture/link_layer.h"
#include "netfloor-host/value_text.h"
#include "peers/known_differences.h"
#include "peers/packet.h"
#include "peers/pairs.h"
#include "peers/peer_output.h"
#include "support/captures.h"
#include "support/runs.h"

namespace netfloor::test {
namespace {

constexpr std::uint32_t nextHeaderId = 220;
constexpr std::uint32_t ipv6Protocol = 41;

std::string ourText(Form form, const FieldReport &field, std::span<const std::uint8_t> packet) {
    switch (form) {
    case Form::number: return std::to_string(field.value);
    case Form::words: return std::to_string(field.value * 4);
    case Form::eighths: return std::to_string(field.value / 8);
    case Form::backwards: return std::to_string(__builtin_bswap32(field.value));
    case Form::ipv4: return ipv4Text(field.value);
    case Form::ipv6: break;
    }
    const auto address = ipv6Address(field, packet);
    return address ? ipv6Text(*address) : "no IPv6 address";
}

// Our values of all pairs, in the order of the pairs.
std::vector<Values> ourValues(const Packet &packet) {
    std::vector<Values> values(pairs.size());
    std::uint32_t header = ipv6Protocol; // of the next field; "Next Header" is the first field in each header but IPv6
    std::uint32_t next = ipv6Protocol;
    for (const FieldReport &field : packet.md.fields) {
        if (field.id == nextHeaderId) {
            header = next;
            next = field.value;
        }
        for (std::size_t i = 0; i < pairs.size(); ++i) {
            const Pair &pair = pairs[i];
            if (std::find(pair.ids.begin(), pair.ids.end(), field.id) != pair.ids.end() &&
                pair.header.value_or(header) == header) {
                values[i].push_back(ourText(pair.form, field, packet.octets));
            }
        }
    }
    return values;
}

// A number in any notation as decimal, a truth value as a number, other texts as they are.
std::string theirText(const std::string &text) {
    if (text == "True" || text == "False") {
        return text == "True" ? "1" : "0";
    }
    char *end = nullptr;
    const unsigned long long number = std::strtoull(text.c_str(), &end, 0);
    return end == text.c_str() || *end != '\0' ? text : std::to_string(number);
}

// A line a packet, with the values in the order of the pairs.
std::vector<std::string> tsharkLines(const std::string &capture) {
    // Each packet as it is on the wire: nothing reassembled, nothing computed. tshark counts the blocks of pcapng that
    // are no packets as packets of raw data.
    std::string command =
        "tshark -n -r '" + capture + "' -Y '!(frame.protocols == \"data\")' -T fields -E separator=/t";
    for (const char *const off : {"ip.defragment", "ipv6.defragment", "ip.decode_tos_as_diffserv", "ip.tso_support",
                                  "tcp.desegment_tcp_streams", "tcp.relative_sequence_numbers", "sctp.reassembly"}) {
        command += std::string(" -o ") + off + ":FALSE";
    }
    for (const Pair &pair : pairs) {
        command += " -e " + std::string(pair.peer);
    }
    return linesOf(command + " 2>/dev/null");
}

class Comparison {
public:
    void addCapture(const std::string &file) {
        SCOPED_TRACE(file);
        const std::vector<std::string> lines = tsharkLines(file);
        reported_.clear();
        CaptureFile capture(file);
        std::size_t packets = 0;
        for (CapturedPacket captured; capture.next(captured); ++packets) {
            const NetworkPart network = findNetworkPart(captured.linkType, captured.octets);
            if (network.isIp()) {
                ASSERT_LT(packets, lines.size());
                SCOPED_TRACE("packet " + std::to_string(captured.number));
                const Runs runs = runAll(network.octets); // checks the key fields and the other passes against MD
                addPacket({runs.md, network.octets, captured.isCut()}, lines[packets]);
            }
        }
        EXPECT_EQ(packets, lines.size());
    }

    // Each pair must have been compared, and each known difference must have been used; else a row checks nothing.
    void expectAllUsed() const {
        for (std::size_t i = 0; i < pairs.size(); ++i) {
            EXPECT_GT(compared_[i], 0U) << pairs[i].peer << " has never been compared";
        }
        for (const KnownDifference &known : knownDifferences) {
            EXPECT_TRUE(used_.contains(&known)) << "never used: " << known.why;
        }
    }

private:
    void addPacket(const Packet &packet, std::string_view line) {
        const std::vector<Values> ours = ourValues(packet);
        std::vector<Values> theirs;
        for (const std::string &cell : split(std::string(line) + '\t', '\t')) {
            theirs.push_back(split(cell, ','));
            std::transform(theirs.back().begin(), theirs.back().end(), theirs.back().begin(), theirText);
        }
        for (std::size_t i = 0; i < pairs.size(); ++i) {
            if (ours[i] == theirs.at(i)) {
                compared_[i] += ours[i].size();
                continue;
            }
            const Difference difference{pairs[i].peer, ours[i], theirs[i]};
            if (!explained(packet, difference) && reported_.insert(pairs[i].peer).second) {
                ADD_FAILURE() << pairs[i].peer << ": ours " << testing::PrintToString(ours[i]) << ", tshark's "
                              << testing::PrintToString(theirs[i])
                              << "; others of this pair in this capture are not reported";
            }
        }
    }

    [[nodiscard]] bool explained(const Packet &packet, const Difference &difference) {
        for (const KnownDifference &known : knownDifferences) {
            const bool concerns = std::any_of(known.peers.begin(), known.peers.end(), [&](std::string_view start) {
                return difference.peer.starts_with(start);
            });
            if (concerns && known.applies(packet, difference)) {
                used_.insert(&known);
                return true;
            }
        }
        return false;
    }

    std::vector<std::size_t> compared_ = std::vector<std::size_t>(pairs.size()); // values, by pair
    std::set<const KnownDifference *> used_;
    std::set<std::string_view> reported_; // pairs with a difference in this capture
};

TEST(Tshark, agreesOnRealCaptures) {
    if (!isInstalled("tshark")) {
        GTEST_SKIP() << "tshark is not installed";
    }
    const char *const other = std::getenv("NETFLOOR_PEER_CAPTURES");
    Comparison comparison;
    for (const std::string &file : other == nullptr ? testCaptures() : testCaptures(other)) {
        comparison.addCapture(file);
    }
    if (other == nullptr) {
        comparison.expectAllUsed();
    }
}

} // namespace
} // namespace netfloor::test
