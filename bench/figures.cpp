// SPDX-License-Identifier: MIT
#include "figures.h"

#include <algorithm>
#include <array>
#include <cstdio>
#include <vector>

namespace netfloor::bench {

bool Figures::ReportContext(const Context & /*context*/) {
    return true;
}

void Figures::ReportRuns(const std::vector<Run> &runs) {
    for (const Run &run : runs) {
        const std::string &name = run.run_name.function_name;
        const std::size_t bar = name.find('|');
        const auto packets = run.counters.find("packets");
        if (run.error_occurred || bar == std::string::npos || packets == run.counters.end()) {
            std::fprintf(stderr, "not measured: %s %s\n", name.c_str(), run.error_message.c_str());
            continue;
        }
        const FigureKey key = {name.substr(0, bar), name.substr(bar + 1)};
        const double figure = run.GetAdjustedCPUTime() / packets->second;
        if (run.run_type == Run::RT_Iteration) {
            const auto [place, first] = fastest_.try_emplace(key, figure);
            place->second = std::min(place->second, figure);
        } else if (run.aggregate_name == "median") {
            medians_[key] = figure;
        } else if (run.aggregate_name == "cv") {
            spread_ = std::max(spread_, run.cpu_accumulated_time);
        }
    }
}

double Figures::of(Statistic statistic, std::string_view set, std::string_view what) const {
    const auto &figures = statistic == Statistic::median ? medians_ : fastest_;
    const auto found = figures.find({std::string(set), std::string(what)});
    return found == figures.end() ? 0 : found->second;
}

bool runAll(int argc, char **argv, Figures &figures) {
    // A later option on the command line overrides an earlier one.
    std::array<std::string, 3> defaults = {"--benchmark_enable_random_interleaving=true", "--benchmark_repetitions=9",
                                           "--benchmark_min_time=0.05"};
    std::vector<char *> arguments = {argv[0]};
    for (std::string &argument : defaults) {
        arguments.push_back(argument.data());
    }
    arguments.insert(arguments.end(), argv + 1, argv + argc);
    int count = static_cast<int>(arguments.size());
    benchmark::Initialize(&count, arguments.data());
    if (benchmark::ReportUnrecognizedArguments(count, arguments.data())) {
        return false;
    }
    benchmark::RunSpecifiedBenchmarks(&figures);
    benchmark::Shutdown();
    return true;
}

void printFigure(double figure, int decimals) {
    if (figure > 0) {
        std::printf("%9.*f", decimals, figure);
    } else {
        std::printf("%9s", "-");
    }
}

} // namespace netfloor::bench
