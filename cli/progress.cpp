// SPDX-License-Identifier: MIT
#include "progress.h"

#include <cstdio>
#include <string>

#include <unistd.h>

namespace netfloor::cli {

namespace {

constexpr std::size_t barColumns = 40;
constexpr std::uint64_t packetsBetweenLooks = 1024;
constexpr auto firstAfter = std::chrono::milliseconds(500);
constexpr auto every = std::chrono::milliseconds(100);

} // namespace

ProgressBar::ProgressBar(const CaptureFile &capture)
    : capture_(capture),
      next_(Clock::now() + firstAfter),
      enabled_(::isatty(STDERR_FILENO) == 1 && ::isatty(STDOUT_FILENO) == 0 && capture.progress().has_value()) {}

ProgressBar::~ProgressBar() {
    if (shown_) {
        std::fputs("\r\x1b[K", stderr);
    }
}

void ProgressBar::packetDone(std::uint64_t packets) {
    if (!enabled_ || packets % packetsBetweenLooks != 0 || Clock::now() < next_) {
        return;
    }
    next_ = Clock::now() + every;
    shown_ = true;
    const double share = capture_.progress().value_or(0);
    const auto filled = static_cast<std::size_t>(share * barColumns);
    const std::string bar = std::string(filled, '#') + std::string(barColumns - std::min(filled, barColumns), '.');
    std::fprintf(stderr, "\r[%s] %3.0f %%  %llu packets", bar.c_str(), share * 100,
                 static_cast<unsigned long long>(packets));
}

} // namespace netfloor::cli
