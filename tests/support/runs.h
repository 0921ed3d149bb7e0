// SPDX-License-Identifier: MIT
// Runs of the passes, and what they reported as lines of text.
//
//     const Runs runs = runAll(ipv4({.protocol = 17, .payload = udp(53, 40000)}));
//     EXPECT_EQ(shortLines(runs.to), expected(R"(
//         150 "4"
//         152 "5*4 octets"
//         ...
//     )"));
//
// Prefer runAll to a run of one pass: the octets end at an inaccessible page, and a disagreement between the four
// passes fails the test.
//
// One line a report (lines):
//
//     MD   150 |2 Ip Header| "Version" "Version=4" 5-8
//          id, depth and name of the innermost block, field name, text, bit ranges. Ranges of one width that
//          follow one another are joined: "33-48/8" is 33-40 and 41-48. " order 8" where bits were reversed.
//     TO   150 "4"                            TO id, text
//     MV   verdict -52 flags 0x10
//     XTR  row 0 Version=4                    addresses in their usual form
//
// Reports of the host's own owner of a next layer have no line.
#pragma once

#include <array>
#include <span>
#include <string>
#include <string_view>

#include "netfloor-host/testing.h"
#include "support/packets.h"

namespace netfloor::test {

// The plug-in under test: the one of this build, or the one that the variable NETFLOOR_TEST_PLUGIN names.
[[nodiscard]] const char *pluginPath();

// The plug-in under test, loaded once, with the owners that come with the host: they take all as data.
[[nodiscard]] Host &sharedHost();

// The same plug-in loaded anew: owners and key-field set-up of its own.
[[nodiscard]] Host freshHost();

struct Runs {
    Report md, to, mv, xtr;
    [[nodiscard]] std::array<const Report *, 4> all() const { return {&md, &to, &mv, &xtr}; }
};

// One pass, over octets that end at an inaccessible page. In the XTR pass the report is that of the plug-in
// alone, which stops at a hand-off; a second run, which goes on with the owner, gives the hand-offs.
[[nodiscard]] Report runPass(Pass pass, std::span<const std::uint8_t> packet, const TestRunOptions &options = {},
                             Host &host = sharedHost());

// The four passes, each over octets that end at an inaccessible page. Fails the test where they disagree: cursor, bits
// left, depth of the stacks, layers, hand-offs, number of fields and texts, the flags that all passes raise, the
// verdict, and for each key field a field of that name and value in MD.
Runs runAll(std::span<const std::uint8_t> packet, const TestRunOptions &options = {}, Host &host = sharedHost());

// All that a report holds, as lines, see above.
[[nodiscard]] std::string lines(const Report &report);

// MD in the form of TO: 150 "Version=4". The other passes as `lines`.
[[nodiscard]] std::string shortLines(const Report &report);

// The lines of `text` that start with `word`, or have it in quotes, for tests of a few fields.
[[nodiscard]] std::string linesWith(std::string_view text, std::string_view word);

// The lines from the first one on that starts with `word`, so that a test need not repeat the headers before it.
[[nodiscard]] std::string linesFrom(std::string_view text, std::string_view word);

// The lines joined into one: 884 "0"; 808 "4"
[[nodiscard]] std::string oneLine(std::string_view lines);

// The verdict's line: "verdict -52 flags 0x10".
[[nodiscard]] std::string verdictLine(const Report &report);

// hand-off key 53 protocol 17 port 53 at 225 bits 96 octets 12 preceding 28
[[nodiscard]] std::string handOffLines(const Report &report);

// layer 1 of 1: 1-224          number, decoder id, first and last bit
[[nodiscard]] std::string layerLines(const Report &report);

// Turns expected lines, as a test writes them, into the form of the functions above: without indentation, empty lines,
// and comments, which are lines that start with '#'. A text that ends with a bracket needs a raw string like
// R"x(...)x".
[[nodiscard]] std::string expected(std::string_view text);

} // namespace netfloor::test
