// SPDX-License-Identifier: MIT
// Runs the command as a user does, through a shell.
#pragma once

#include <string>
#include <string_view>
#include <vector>

#include "support/captures.h"

namespace netfloor::test {

struct Outcome {
    int exitCode = -1;
    std::string out;
    std::string err;
};

// A shell line in which `netfloor` is the command, $C the folder of the test captures, $P the plug-in,
// $T folder() and $N the command's file.
[[nodiscard]] Outcome shell(const std::string &line);

// What a line gives. "..." divides a text into parts, which stand in the output in this order. Empty: nothing is
// written.
struct Case {
    std::string line;
    int exitCode = 0;
    const char *out = "";
    const char *err = "";
    const char *absent = ""; // stands in neither
    long lines = -1;         // of standard output, where their number matters
};
void check(const std::vector<Case> &cases);

// A line that writes exactly this to standard output.
struct ExactCase {
    std::string line;
    const char *out;
};
void checkExact(const std::vector<ExactCase> &cases);

// How often the part stands in the text.
[[nodiscard]] std::size_t countOf(std::string_view text, std::string_view part);

} // namespace netfloor::test
