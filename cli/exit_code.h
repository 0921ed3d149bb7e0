// SPDX-License-Identifier: MIT
// How the command ends. The numbers stand in --help and in the README.
#pragma once

#include <cstdint>
#include <stdexcept>

namespace netfloor::cli {

enum class ExitCode : std::uint8_t {
    good = 0,           // also when whoever reads the output has had enough
    damagedPackets = 1, // verify: at least one packet is damaged
    usage = 2,          // an option, a filter or a packet number that makes no sense
    noCapture = 3,      // the file is missing, empty or no capture
    cutCapture = 4,     // the capture ends in the middle of a packet; all whole packets were decoded
    noPlugin = 5,       // the plug-in is missing or no plug-in
    noOutput = 6,       // the output cannot be written
    fault = 7,          // a fault of the command itself: an exception that nobody foresaw
    noMemory = 8,       // memory ran out
};

// The code of a run over several captures is the worst of theirs.
[[nodiscard]] constexpr ExitCode worse(ExitCode left, ExitCode right) {
    for (const ExitCode code : {ExitCode::usage, ExitCode::noCapture, ExitCode::cutCapture, ExitCode::damagedPackets}) {
        if (left == code || right == code) {
            return code;
        }
    }
    return ExitCode::good;
}

// What was asked for makes no sense. what() is a sentence for the user.
class UsageError : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

} // namespace netfloor::cli
