// SPDX-License-Identifier: MIT
// Collects the figures of one run, so that ratios can be given: in ns a packet, the median of all repetitions and the
// fastest one. On a quiet machine the two are close; on a busy one the fastest is nearer to the cost of the code alone.
#pragma once

#include <map>
#include <string>
#include <string_view>
#include <utility>

#include <benchmark/benchmark.h>

namespace netfloor::bench {

// What was run over which set of packets.
using FigureKey = std::pair<std::string, std::string>;

enum class Statistic { median, fastest };

class Figures : public benchmark::BenchmarkReporter {
public:
    bool ReportContext(const Context &context) override;
    void ReportRuns(const std::vector<Run> &runs) override;

    // 0 where nothing was measured.
    [[nodiscard]] double of(Statistic statistic, std::string_view set, std::string_view what) const;

    // Spread of the repetitions: standard deviation over mean, the greatest of all figures.
    [[nodiscard]] double spread() const { return spread_; }

private:
    std::map<FigureKey, double> medians_;
    std::map<FigureKey, double> fastest_;
    double spread_ = 0;
};

// Registers `what` over `set`: `body` is called once an iteration, and runs all the packets of the set.
template <class Body>
void measure(std::string_view set, std::string_view what, std::size_t packets, Body body) {
    const std::string name = std::string(set) + "|" + std::string(what);
    benchmark::RegisterBenchmark(name.c_str(), [packets, body](benchmark::State &state) {
        for (auto _ : state) {
            body();
            benchmark::ClobberMemory();
        }
        state.counters["packets"] = static_cast<double>(packets);
    });
}

// Runs all that was registered: nine repetitions of each, interleaved, unless the arguments say otherwise.
// False where an argument is unknown.
[[nodiscard]] bool runAll(int argc, char **argv, Figures &figures);

// A figure in a column of 9, a dash where there is none.
void printFigure(double figure, int decimals);

} // namespace netfloor::bench
