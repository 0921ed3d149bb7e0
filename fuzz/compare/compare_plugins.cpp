// SPDX-License-Identifier: MIT
// Compares two builds of the plug-in: whether a host sees the same of both, call by call. The first run in which it
// does not is shown by diff.
//
// The exit code is 0 when it does, 1 when it does not, 2 when the comparison could not be made.
#include <algorithm>
#include <array>
#include <cstdio>
#include <cstdlib>
#include <exception>
#include <fstream>
#include <stdexcept>

#include <CLI/CLI.hpp>

#include "known_answers.h"
#include "support/temporary_folder.h"

namespace netfloor::compare {
namespace {

constexpr std::array passNames = {"TO", "MD", "MV", "XTR"};

struct Options {
    std::string oldPath, newPath;
    std::uint64_t packets = 100'000;
    std::uint64_t seed = 1;
    std::vector<std::string> captures = {NETFLOOR_CAPTURES};
};

// The first lines that differ, with those before them and the call that they belong to.
void show(const std::string &old, const std::string &now) {
    const test::TemporaryFolder folder;
    std::ofstream(folder.path() / "old") << old;
    std::ofstream(folder.path() / "new") << now;
    const std::string command =
        "cd " + folder.path().string() + " && diff -U 6 -F '^event' --label old --label new old new | head -n 60";
    std::fflush(stdout);
    if (std::system(command.c_str()) != 0) {
        throw std::runtime_error("diff cannot be run");
    }
}

std::string exportsText(const Plugin &plugin) {
    Trace trace(Trace::Keeps::texts);
    traceExports(plugin, trace);
    return trace.text();
}

// The digest of each run of the group.
std::vector<std::uint64_t> runDigests(Plugin &plugin, const Inputs &inputs, std::uint64_t first) {
    std::vector<std::uint64_t> digests;
    runGroup(plugin, inputs, first, Trace::Keeps::octets,
             [&](std::uint64_t, const Input &, Pass, const Trace &trace, bool good) {
                 digests.push_back(trace.digest(static_cast<std::uint64_t>(good)));
             });
    return digests;
}

// One run of the group as text, of which the packet and how it ended are printed.
std::string runText(Plugin &plugin, const Inputs &inputs, std::uint64_t first, std::ptrdiff_t wanted) {
    std::string text;
    runGroup(plugin, inputs, first, Trace::Keeps::texts,
             [&](std::uint64_t packet, const Input &input, Pass pass, const Trace &trace, bool good) {
                 if (wanted-- == 0) {
                     std::printf("%s: packet %llu (%s): %s: %s pass%s\n", plugin.path.c_str(),
                                 static_cast<unsigned long long>(packet), input.origin,
                                 test::hexText(input.packet).c_str(), passNames[static_cast<std::size_t>(pass)],
                                 good ? "" : ", FAILED");
                     text = trace.text();
                 }
             });
    return text;
}

bool areSame(const Options &options) {
    Plugin old(options.oldPath);
    Plugin now(options.newPath);
    if (old.handle == now.handle) {
        throw std::runtime_error("both are the same file");
    }
    if (exportsText(old) != exportsText(now)) {
        std::puts("DIFFERENCE in the exports");
        show(exportsText(old), exportsText(now));
        return false;
    }
    const Inputs inputs(options.captures, options.seed);
    std::size_t runs = 0;
    for (std::uint64_t first = 0; first < options.packets; first += packetsTogether) {
        const std::vector<std::uint64_t> olds = runDigests(old, inputs, first);
        const std::vector<std::uint64_t> news = runDigests(now, inputs, first);
        runs += olds.size();
        if (olds != news) {
            const auto run = std::ranges::mismatch(olds, news).in1 - olds.begin();
            std::puts("DIFFERENCE");
            show(runText(old, inputs, first, run), runText(now, inputs, first, run));
            return false;
        }
    }
    std::printf("no difference in %zu runs\n", runs);
    return true;
}

} // namespace
} // namespace netfloor::compare

int main(int argumentCount, char **arguments) {
    netfloor::compare::Options options;
    CLI::App app("Compares two builds of the plug-in, call by call");
    app.add_option("OLD", options.oldPath, "the plug-in as it was")->required();
    app.add_option("NEW", options.newPath, "the plug-in as it is")->required();
    app.add_option("--packets", options.packets, "how many packets")->capture_default_str();
    app.add_option("--seed", options.seed, "of what is drawn")->capture_default_str();
    app.add_option("--captures", options.captures, "folders with captures, in place of those of the tests");
    CLI11_PARSE(app, argumentCount, arguments);
    try {
        return netfloor::compare::areSame(options) ? 0 : 1;
    } catch (const std::exception &error) {
        std::fprintf(stderr, "compare_plugins: %s\n", error.what());
        return 2;
    }
}
