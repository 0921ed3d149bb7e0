// SPDX-License-Identifier: MIT
// 'netfloor fields', and the page that it writes.
#include <algorithm>
#include <fstream>
#include <iterator>
#include <string>

#include <gtest/gtest.h>
#include <nlohmann/json.hpp>

#include "cli/command.h"

namespace netfloor::test {
namespace {

TEST(Fields, ShowWhatAFieldIs) {
    const struct {
        const char *line;
        const char *out;
    } cases[] = {
        {"netfloor fields Version | head -13", // by name: all of that name
         R"(Version (id 150)
  bits     4
  key      1
  display  Version=%u
  place    5-8
      0
      0 1 2 3 4 5 6 7
     +-+-+-+-+-+-+-+-+
     |a a a a|. . . .|
     +-+-+-+-+-+-+-+-+

Version (id 605)
  bits     4
)"},
        {"netfloor fields 167", // pieces, by their rank in the value
         R"(Flow Label (id 167)
  bits     20
  display  Flow Label=%u
  place    9-12, 17-24, 25-32
      0                   1                   2                   3
      0 1 2 3 4 5 6 7 8 9 0 1 2 3 4 5 6 7 8 9 0 1 2 3 4 5 6 7 8 9 0 1
     +-+-+-+-+-+-+-+-+-+-+-+-+-+-+-+-+-+-+-+-+-+-+-+-+-+-+-+-+-+-+-+-+
     |. . . . . . . . . . . .|a a a a|b b b b b b b b|c c c c c c c c|
     +-+-+-+-+-+-+-+-+-+-+-+-+-+-+-+-+-+-+-+-+-+-+-+-+-+-+-+-+-+-+-+-+
)"},
        {"netfloor fields 229 | head -9; netfloor fields 478 | grep place; netfloor fields 177 | tail -n 2",
         R"(Padding Data (id 229)
  bits     variable
  display  Padding Data=%-["%x"] (Hex)
  place    1-4, as often as the packet tells, 4 bits apart
      0
      0 1 2 3 4 5 6 7
     +-+-+-+-+-+-+-+-+
     |. . . .|a a a a|
     +-+-+-+-+-+-+-+-+
  place    1-8, 1 to 16 times, 8 bits apart
  display  Routing Type=%x
  place    not told
)"},
        {"netfloor fields 247 | tail -n 7; netfloor fields 'UDP Source Port' | grep -A 1 values", // ranges, a default
         R"(    1       Destination Unreachable
    2       Packet Too Big
    3       Time Exceeded
    4       Parameter Problem
    5-127   Undefined
    128     Echo Request
    129     Echo Reply
  values
    other   %u
)"},
    };
    for (const auto &[line, out] : cases) {
        const Outcome outcome = shell(line);
        EXPECT_EQ(outcome.out, out) << line;
        EXPECT_EQ(outcome.err, "") << line;
    }
}

TEST(Fields, AreListedInEachForm) {
    const Outcome list = shell("netfloor fields");
    EXPECT_EQ(std::ranges::count(list.out, '\n'), 383);
    EXPECT_NE(list.out.find("\n 384        16    41  TCP Source Port "), std::string::npos);
    EXPECT_NE(list.out.find("\n381 fields, 102 key fields among them\n"), std::string::npos);

    const auto all = nlohmann::json::parse(shell("netfloor fields --json").out);
    ASSERT_EQ(all.size(), 381U);
    const auto protocol = nlohmann::json::parse(shell("netfloor fields --json 295").out);
    EXPECT_EQ(protocol.size(), 1U);
    EXPECT_EQ(protocol[0], *std::ranges::find_if(all, [](const auto &field) { return field["id"] == 295; }));
    EXPECT_EQ(protocol[0]["values"].back(), nlohmann::json({{"from", 138}, {"to", 252}, {"name", "Unassigned"}}));
    EXPECT_EQ(protocol[0]["layout"], nlohmann::json({{"pieces", {{1, 8}}}, {"count", 1}, {"step", 8}}));

    const struct {
        const char *line;
        int exitCode;
        const char *err;
    } refused[] = {
        {"netfloor fields 'No Such Field'", 2, "no field of that name or id"},
        {"netfloor fields 151", 2, "no field of that name or id"},
        {"netfloor fields --json --markdown", 2, "excludes"},
        {"netfloor fields --plugin $T/absent.so", 5, "no such file"},
    };
    for (const auto &[line, exitCode, err] : refused) {
        const Outcome outcome = shell(line);
        EXPECT_EQ(outcome.exitCode, exitCode) << line;
        EXPECT_NE(outcome.err.find(err), std::string::npos) << outcome.err;
        EXPECT_EQ(outcome.out, "") << line;
    }
}

TEST(Fields, PageOfReferenceIsCurrent) {
    std::ifstream file(NETFLOOR_CAPTURES "/../../docs/fields.md");
    const std::string page((std::istreambuf_iterator<char>(file)), std::istreambuf_iterator<char>());
    EXPECT_TRUE(shell("netfloor fields --markdown").out == page)
        << "docs/fields.md is not what 'netfloor fields --markdown' writes: write it anew";
}

} // namespace
} // namespace netfloor::test
