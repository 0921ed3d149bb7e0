// SPDX-License-Identifier: MIT
// The page of `netfloor html` without a browser: its data can be read, and nothing that comes from outside can become
// markup. scripts/check-page.sh opens it in one.
#include <algorithm>
#include <filesystem>
#include <sstream>
#include <string>
#include <vector>

#include <gtest/gtest.h>
#include <nlohmann/json.hpp>

#include "cli/command.h"

namespace netfloor::test {
namespace {

using nlohmann::json;

struct Page {
    std::string data;         // of the script element that holds it
    std::vector<json> lines;  // their values
    std::string letters;      // and what they are
    std::vector<json> labels; // by index

    [[nodiscard]] const json &last(char letter) const { return lines[letters.rfind(letter)]; }
};

Page pageOf(const std::string &text) {
    const std::string start = "<script type=\"text/plain\" id=\"data\">\n";
    Page page;
    const std::size_t from = text.find(start);
    EXPECT_NE(from, std::string::npos);
    page.data = text.substr(from + start.size(), text.rfind("</script>") - from - start.size());
    EXPECT_TRUE(text.ends_with("</html>\n"));
    EXPECT_EQ(countOf(text, "<script"), 2);
    EXPECT_EQ(countOf(text, "</script"), 2);
    EXPECT_EQ(page.data.find('<'), std::string::npos);
    std::istringstream in(page.data);
    for (std::string line; std::getline(in, line);) {
        page.letters += line.front();
        page.lines.push_back(json::parse(line.substr(1)));
        if (line.front() == 'n') {
            page.labels.push_back(page.lines.back());
        }
    }
    return page;
}

// Each item has a label, is at most one level deeper than the one before, and has bits inside the packet.
void checkItems(const json &items, const json &row, std::size_t octets, std::size_t labels) {
    std::uint32_t depth = 0;
    for (const json &item : items) {
        ASSERT_GE(item.size(), 2U);
        EXPECT_LE(item[0].get<std::uint32_t>() / 4, depth + 1) << item;
        depth = item[0].get<std::uint32_t>() / 4;
        EXPECT_TRUE(item[1].is_string() || item[1].get<std::size_t>() < labels) << item;
        for (std::size_t i = 3; i < item.size(); i += 2) {
            EXPECT_GE(item[i].get<std::int64_t>(), 1) << item;
            EXPECT_LE(item[i].get<std::size_t>() - 1 + item.at(i + 1).get<std::size_t>(),
                      8 * (octets - row[8].get<std::size_t>()))
                << item;
        }
    }
}

TEST(Page, holdsEveryPacketOfEveryCapture) {
    for (const std::string &path : testCaptures()) {
        const std::string name = std::filesystem::path(path).filename();
        SCOPED_TRACE(name);
        const Outcome outcome = shell("netfloor html $C/" + name);
        const Page page = pageOf(outcome.out);
        EXPECT_EQ(outcome.err, "");
        EXPECT_EQ(page.lines.front()["files"], json({name}));
        const auto packets = static_cast<std::size_t>(std::ranges::count(page.letters, 'p'));
        EXPECT_TRUE(page.last('e')["total"].get<std::string>().starts_with(std::to_string(packets) + " packet"));
        std::size_t octets = 0;
        json items;
        for (std::size_t i = 0; i < page.lines.size(); ++i) {
            const json &line = page.lines[i];
            if (page.letters[i] == 't') {
                items = line;
            } else if (page.letters[i] == 'o') {
                const std::string text = line;
                octets = text.size() / 4 * 3 - static_cast<std::size_t>(std::ranges::count(text, '='));
            } else if (page.letters[i] == 'p') {
                checkItems(items, line, octets, page.labels.size());
            }
        }
    }
}

// The number of a type or a code, of one octet or two; and the length of a packet that was cut.
TEST(Page, tellsNumbersBesideTheirNames) {
    const Octets gre =
        ipv4({.protocol = 47, .payload = hex("0000 0800") + ipv4({.protocol = 17, .payload = udp(7, 9)})});
    writeFile("numbers.pcap", pcapFile(228, {{gre, 60}}));
    check({{"netfloor html $T/numbers.pcap", 0, "cut by the snap length to 52...\"GRE (47)...\"IP (2048)"}});
}

TEST(Page, letsNothingBecomeMarkup) {
    const std::string hostile = "</script><script>alert(1)</script><!--\"\\\x1b\xff\xc3\xa9";
    const auto option = [](std::uint16_t code, const std::string &text) {
        Octets octets = be16(code) + be16(static_cast<std::uint16_t>(text.size())) + Octets(text.begin(), text.end());
        octets.resize((octets.size() + 3) / 4 * 4);
        return octets;
    };
    Octets packet =
        pcapngPacket(0, 0, ipv4({.protocol = 17, .payload = udp(40000, 53, {hostile.begin(), hostile.end()})}));
    const Octets body = Octets(packet.begin() + 8, packet.end() - 4) + option(1, hostile) + be32(0);
    writeFile("<!--<script>.pcapng",
              pcapngSection() + pcapngInterface(228, option(2, hostile) + be32(0)) + pcapngBlock(6, body));
    const Outcome outcome = shell("netfloor html --where 'ip.ttl < 300' $T/*script*.pcapng");
    const Page page = pageOf(outcome.out);
    EXPECT_EQ(page.lines.front()["files"][0], "<!--<script>.pcapng");
    EXPECT_EQ(page.lines.front()["where"], "ip.ttl < 300");
    const std::string shown = "</script><script>alert(1)</script><!--\"\\\\x1b\\xff\xc3\xa9";
    EXPECT_EQ(countOf(page.last('t').dump(), json(shown).dump()), 2) << page.last('t'); // the comment, the interface
}

TEST(Page, tellsHowItEnded) {
    const Octets packet = ipv4({.protocol = 17, .payload = udp(40000, 53, hex("61*8"))});
    Octets damaged = packet;
    damaged[10] ^= 1; // the header checksum
    Octets file = pcapFile(228, {{packet}, {damaged}, {packet}});
    writeFile("three.pcap", file);
    file.resize(file.size() - 5);
    writeFile("cut.pcap", file);
    struct Row {
        const char *line;
        int exitCode;
        std::ptrdiff_t packets;
        const char *remark;
    };
    for (const Row &row : std::vector<Row>{
             {"netfloor html $T/three.pcap", 0, 3, ""},
             {"netfloor html --limit 3 $T/three.pcap", 0, 3, ""},
             {"netfloor html --limit 2 $T/three.pcap", 0, 2, "the first 2 packets, and there are more"},
             {"netfloor html $T/cut.pcap", 4, 2, "the 2 packets in front of it are whole"},
             {"netfloor html $T/cut.pcap $T/none.pcap $T/three.pcap", 3, 5, "No such file"},
             {"mkfifo $T/live; $N html - < $T/live > $T/out & pid=$!; exec 3> $T/live; cat $T/three.pcap >&3; "
              "for i in {1..100}; do [ \"$(grep -c '^p' $T/out)\" = 3 ] && break; sleep 0.05; done; "
              "kill -TERM $pid; wait $pid; code=$?; cat $T/out; rm $T/live; exit $code",
              143, 3, "interrupted after 3 packets"},
         }) {
        SCOPED_TRACE(row.line);
        const Outcome outcome = shell(row.line);
        const Page page = pageOf(outcome.out);
        EXPECT_EQ(outcome.exitCode, row.exitCode);
        EXPECT_EQ(std::ranges::count(page.letters, 'p'), row.packets);
        EXPECT_EQ(page.letters.back(), 'e');
        EXPECT_EQ(page.last('e')["remarks"].empty(), *row.remark == '\0');
        EXPECT_NE(page.last('e').dump().find(row.remark), std::string::npos) << page.last('e');
        EXPECT_NE(outcome.err.find(row.remark), std::string::npos) << outcome.err;
        EXPECT_NE(page.data.find("[IPv4: the header checksum is wrong, at octet 10]\",\"DAMAGED\""), std::string::npos);
    }
}

} // namespace
} // namespace netfloor::test
