// SPDX-License-Identifier: MIT
// Runs the command as a user does, through a shell.
#pragma once

#include <string>

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

} // namespace netfloor::test
