// SPDX-License-Identifier: MIT
// Compares two builds of the plug-in: whether a host sees the same of both, call by call.
//
//     compare_plugins OLD.so NEW.so [--packets N] [--first N] [--seed S] [--captures DIR]... [--strict]
//
// The exit code is 0 when it does, 1 when it does not, 2 when the comparison could not be made.
#include <chrono>
#include <cstdio>
#include <exception>
#include <stdexcept>

#include <CLI/CLI.hpp>

#include "inputs.h"

namespace netfloor::compare {
namespace {

constexpr const char *passNames[] = {"TO", "MD", "MV", "XTR"};

struct Options {
    std::string oldPath, newPath;
    std::uint64_t packets = 100'000;
    std::uint64_t first = 0;
    std::uint64_t seed = 1;
    std::vector<std::string> captures = {NETFLOOR_CAPTURES};
    bool strict = false;
};

class Comparison {
public:
    explicit Comparison(const Options &options)
        : options_(options), old_(options.oldPath), new_(options.newPath), inputs_(options.captures, options.seed) {
        if (old_.handle == new_.handle) {
            throw std::runtime_error("both are the same file");
        }
    }

    // False at the first difference, which is then shown.
    bool run() {
        if (!sameExports()) {
            return false;
        }
        const auto start = std::chrono::steady_clock::now();
        const std::uint64_t from = options_.first / packetsTogether * packetsTogether;
        for (std::uint64_t number = from; number < options_.first + options_.packets; ++number) {
            if (!sameRuns(number)) {
                return false;
            }
        }
        const std::chrono::duration<double> took = std::chrono::steady_clock::now() - start;
        std::printf("no difference: %llu packets in four passes, %llu host calls and results, %zu fields, %.1f s\n",
                    static_cast<unsigned long long>(options_.packets), static_cast<unsigned long long>(events_),
                    fieldsSeen().count(), took.count());
        return true;
    }

private:
    [[nodiscard]] bool sameExports() const {
        Trace olds(Trace::Keeps::texts);
        Trace news(Trace::Keeps::texts);
        traceExports(old_, olds);
        traceExports(new_, news);
        if (!(olds == news)) {
            std::printf("DIFFERENCE in the exports\n%s", Trace::firstDifference(olds, news).c_str());
        }
        return olds == news;
    }

    void setAsLoaded() const {
        old_.setVariables(old_.asLoaded);
        new_.setVariables(new_.asLoaded);
    }

    bool sameRuns(std::uint64_t number) {
        const Input input = inputs_.input(number);
        const bool ownKeys = input.plan.keyStatus != 1;
        if (ownKeys || number % packetsTogether == 0) {
            setAsLoaded();
        }
        for (const Pass pass : {Pass::md, Pass::to, Pass::mv, Pass::xtr}) {
            if (!samePass(number, input, pass)) {
                return false;
            }
        }
        if (ownKeys) {
            setAsLoaded();
        }
        return true;
    }

    bool samePass(std::uint64_t number, const Input &input, Pass pass) {
        const Variables olds = old_.variables();
        const Variables news = new_.variables();
        const bool oldGood = netfloor::compare::run(old_, pass, input, options_.strict, oldTrace_);
        const bool newGood = netfloor::compare::run(new_, pass, input, options_.strict, newTrace_);
        events_ += oldTrace_.events();
        if (oldGood && newGood && oldTrace_ == newTrace_) {
            return true;
        }
        old_.setVariables(olds);
        new_.setVariables(news);
        show(number, input, pass);
        return false;
    }

    // Runs both once more, with texts.
    void show(std::uint64_t number, const Input &input, Pass pass) const {
        Trace olds(Trace::Keeps::texts);
        Trace news(Trace::Keeps::texts);
        const bool oldGood = netfloor::compare::run(old_, pass, input, options_.strict, olds);
        const bool newGood = netfloor::compare::run(new_, pass, input, options_.strict, news);
        const Plan &plan = input.plan;
        std::printf("DIFFERENCE in packet %llu, %s pass%s%s\n%s", static_cast<unsigned long long>(number),
                    passNames[static_cast<std::size_t>(pass)], oldGood ? "" : ", old FAILED",
                    newGood ? "" : ", new FAILED", Trace::firstDifference(olds, news).c_str());
        std::printf("packet (%s): %s\n", input.origin, test::hexText(input.packet).c_str());
        std::printf(
            "host: capacities of blocks %u, limits %u, layers %u, ranges %u, layer infos %u; refused growth %u; "
            "odd owners %d; key status %d; byte area %u; cursor %u; bits missing %u, outside %u; flags 0x%x; "
            "layer index %u; source mask 0x%x\n",
            plan.blockCapacity, plan.limitCapacity, plan.layerCapacity, plan.rangeCapacity, plan.layerInfoCapacity,
            plan.refusedGrowth, plan.oddOwners, plan.keyStatus, plan.byteAreaSize, plan.cursor, plan.missingBits,
            plan.outerBits, plan.flags, plan.layerIndex, plan.sourceMask);
        std::printf("again: --seed %llu --first %llu --packets 1%s, and the same captures\n",
                    static_cast<unsigned long long>(options_.seed), static_cast<unsigned long long>(number),
                    options_.strict ? " --strict" : "");
    }

    const Options &options_;
    const Plugin old_, new_;
    const Inputs inputs_;
    Trace oldTrace_, newTrace_;
    std::uint64_t events_ = 0;
};

} // namespace
} // namespace netfloor::compare

int main(int argumentCount, char **arguments) {
    netfloor::compare::Options options;
    CLI::App app("Compares two builds of the plug-in, call by call");
    app.add_option("OLD", options.oldPath, "the plug-in as it was")->required();
    app.add_option("NEW", options.newPath, "the plug-in as it is")->required();
    app.add_option("--packets", options.packets, "how many packets")->capture_default_str();
    app.add_option("--first", options.first, "number of the first one");
    app.add_option("--seed", options.seed, "of what is drawn")->capture_default_str();
    app.add_option("--captures", options.captures, "folders with captures, in place of those of the tests");
    app.add_flag("--strict", options.strict, "compare also what has no meaning: all storage, used or not");
    CLI11_PARSE(app, argumentCount, arguments);
    netfloor::compare::catchSignals();
    try {
        return netfloor::compare::Comparison(options).run() ? 0 : 1;
    } catch (const std::exception &error) {
        std::fprintf(stderr, "compare_plugins: %s\n", error.what());
        return 2;
    }
}
