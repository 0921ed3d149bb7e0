// SPDX-License-Identifier: MIT
// The key fields of real captures against what tshark says of the same packets, packet by packet.
//
// Some fields mean something else by design and are not compared:
//  - the little-endian readings (TCP timestamps, SPI, IPv6 Identification, the sequence numbers of ESP and AH);
//  - "Sequence Number" where it is not TCP's, as several protocols share its row;
//  - what follows an IPv6 header of options with more than one option: only the first one is read, and what stands
//    behind it is taken for the next header;
//  - fields that an inner header of a tunnel has overwritten;
//  - the destination of a source route, for which tshark gives the last address of the route.
#include <array>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <map>
#include <memory>
#include <string>
#include <vector>

#include <gtest/gtest.h>

namespace {

using Row = std::vector<std::string>;

std::vector<std::string> outputOf(const std::string &command) {
    std::vector<std::string> lines;
    const std::unique_ptr<FILE, int (*)(FILE *)> pipe(popen(command.c_str(), "r"), pclose);
    std::array<char, 65536> line{};
    while (pipe != nullptr && std::fgets(line.data(), line.size(), pipe.get()) != nullptr) {
        lines.emplace_back(line.data());
        lines.back().pop_back();
    }
    return lines;
}

Row split(const std::string &line, char separator) {
    Row row(1);
    for (const char character : line) {
        if (character == separator) {
            row.emplace_back();
        } else {
            row.back() += character;
        }
    }
    return row;
}

// A key field, tshark's name of it, and the octets in a unit of each.
struct Pair {
    const char *key;
    const char *peer;
    unsigned unit = 1;
    unsigned peerUnit = 1;
};

// tshark gives each field of a packet as often as it finds it; the first one is that of the outermost header.
constexpr std::array pairs = {
    Pair{"Version", "ip.version"},
    Pair{"Total Length", "ip.len"},
    Pair{"Identification", "ip.id"},
    Pair{"Time to Live", "ip.ttl"},
    Pair{"Protocol", "ip.proto"},
    Pair{"Source Address", "ip.src"},
    Pair{"Destination Address", "ip.dst"},
    Pair{"DF", "ip.flags.df"},
    Pair{"MF", "ip.flags.mf"},
    Pair{"Fragment Offset", "ip.frag_offset", 1, 8},
    Pair{"UDP Source Port", "udp.srcport"},
    Pair{"UDP Destination Port", "udp.dstport"},
    Pair{"TCP Source Port", "tcp.srcport"},
    Pair{"TCP Destination Port", "tcp.dstport"},
    Pair{"Acknowledgement Number", "tcp.ack_raw"},
    Pair{"Data Offset", "tcp.hdr_len", 4, 1},
    Pair{"RST", "tcp.flags.reset"},
    Pair{"SYN", "tcp.flags.syn"},
    Pair{"FIN", "tcp.flags.fin"},
    Pair{"Code", "icmp.code"},
    Pair{"ICMP Sequence Number", "icmp.seq"},
    Pair{"GRE Protocol", "gre.proto"},
    Pair{"GRE Key", "gre.key"},
    Pair{"SCTP Source Port Number", "sctp.srcport"},
    Pair{"SCTP Destination Port Number", "sctp.dstport"},
    Pair{"SCTP Chunk Type", "sctp.chunk_type"},
    Pair{"TSN", "sctp.data_tsn_raw"},
    Pair{"Payload Length", "ipv6.plen"},
    Pair{"Source IP Address", "ipv6.src"},
    Pair{"Destination IP Address", "ipv6.dst"},
    Pair{"ICMP Message Type", "icmp.type"},
    Pair{"ICMP Message Type", "icmpv6.type"},
    Pair{"Sequence Number", "tcp.seq_raw"},
};

// Whether tshark's first field is the one that the row holds.
bool comparable(const std::string &key, const std::map<std::string, std::string> &ours, bool hasOptions) {
    const auto is = [&](const char *name, const char *value) {
        const auto found = ours.find(name);
        return found != ours.end() && found->second == value;
    };
    const auto has = [&](const char *name) {
        const auto found = ours.find(name);
        return found != ours.end() && !found->second.empty();
    };
    const bool behindOptions =
        has("Option Type") && !key.ends_with("IP Address") && key != "Payload Length" && key != "Version";
    const bool tunnelled = is("Protocol", "4") || is("Protocol", "55") || is("Next Header", "41");
    const bool flags = key == "DF" || key == "MF" || key == "Fragment Offset";
    const bool addresses = key.ends_with("IP Address") || key == "Payload Length" || key == "Version";
    const bool routed = hasOptions && key == "Destination Address";
    return !behindOptions && !routed && !(tunnelled && (flags || addresses)) &&
           (key != "Sequence Number" || is("Protocol", "6"));
}

// A number in any notation and unit as decimal in octets; other texts as they are.
std::string normal(const std::string &text, unsigned unit) {
    char *end = nullptr;
    const unsigned long long number = std::strtoull(text.c_str(), &end, 0);
    return end == text.c_str() || *end != '\0' ? text : std::to_string(number * unit);
}

class Captures : public testing::TestWithParam<std::string> {};

TEST_P(Captures, keyFieldsAgreeWithTshark) {
    if (std::system("tshark --version >/dev/null 2>&1") != 0) {
        GTEST_SKIP() << "tshark is not installed";
    }
    std::string command =
        "tshark -n -r '" + GetParam() +
        "' -o ip.defragment:FALSE -o ipv6.defragment:FALSE -o tcp.desegment_tcp_streams:FALSE -T fields "
        "-E separator=/t -E occurrence=f -e frame.number -e ip.hdr_len";
    for (const Pair &pair : pairs) {
        command += std::string(" -e ") + pair.peer;
    }
    const std::vector<std::string> peer = outputOf(command + " 2>/dev/null");
    const std::vector<std::string> own = outputOf(std::string(NETFLOOR_COMMAND) + " keys '" + GetParam() + "'");
    ASSERT_GT(own.size(), 1U);
    const Row header = split(own[0], ',');
    int compared = 0;
    for (std::size_t line = 1; line < own.size(); ++line) {
        const Row row = split(own[line], ',');
        std::map<std::string, std::string> ours;
        for (std::size_t column = 0; column < row.size(); ++column) {
            ours[header[column]] = row[column];
        }
        const Row theirs = split(peer.at(std::stoul(row[0]) - 1), '\t');
        const bool hasOptions = theirs.at(1) != "20";
        for (std::size_t pair = 0; pair < pairs.size(); ++pair) {
            const std::string &value = ours[pairs[pair].key];
            const std::string &other = theirs.at(pair + 2);
            if (value.empty() || other.empty() || !comparable(pairs[pair].key, ours, hasOptions)) {
                continue;
            }
            ++compared;
            EXPECT_EQ(normal(value, pairs[pair].unit), normal(other, pairs[pair].peerUnit))
                << "packet " << row[0] << ", " << pairs[pair].key;
        }
    }
    EXPECT_GT(compared, 0) << "nothing to compare";
}

std::vector<std::string> captures() {
    std::vector<std::string> files;
    for (const auto &entry : std::filesystem::directory_iterator(NETFLOOR_CAPTURES)) {
        // tshark counts the statistics blocks of this one as packets, so that the numbers do not match.
        const bool countedOtherwise = entry.path().filename() == "pcapng-big-endian-two-interfaces.pcapng";
        if (entry.path().extension() != ".md" && !countedOtherwise) {
            files.push_back(entry.path());
        }
    }
    return files;
}

INSTANTIATE_TEST_SUITE_P(Real, Captures, testing::ValuesIn(captures()), [](const auto &name) {
    std::string stem = std::filesystem::path(name.param).stem();
    for (char &character : stem) {
        character = std::isalnum(static_cast<unsigned char>(character)) != 0 ? character : '_';
    }
    return stem;
});

} // namespace
