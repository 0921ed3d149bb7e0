// SPDX-License-Identifier: MIT
// A progress bar on standard error, for who sends the results of a long capture into a file.
#pragma once

#include <chrono>
#include <cstdint>

#include "netfloor-capture/capture_file.h"

namespace netfloor::cli {

class ProgressBar {
public:
    // Shows itself only when standard error is a terminal, standard output is none, and the size is known.
    explicit ProgressBar(const CaptureFile &capture);
    ProgressBar(const ProgressBar &) = delete;
    ProgressBar &operator=(const ProgressBar &) = delete;
    ~ProgressBar();

    void packetDone(std::uint64_t packets);

private:
    using Clock = std::chrono::steady_clock;

    const CaptureFile &capture_;
    Clock::time_point next_;
    bool enabled_;
    bool shown_ = false;
};

} // namespace netfloor::cli
