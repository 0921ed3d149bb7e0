// SPDX-License-Identifier: MIT
#include "plan.h"

#include <algorithm>
#include <charconv>
#include <filesystem>
#include <iostream>

#include "output.h"

namespace netfloor::cli {

namespace {

std::uint64_t shardOctets(const Options &options) {
    if (options.shardSize != 0) {
        return options.shardSize;
    }
    std::uint64_t all = 0;
    for (const std::string &file : options.files) {
        std::error_code error; // told when the file is read
        const std::uintmax_t octets = std::filesystem::file_size(file, error);
        all += error ? 0 : octets;
    }
    return std::max<std::uint64_t>((all + options.shards - 1) / options.shards, 1);
}

} // namespace

ExitCode showPlan(const Options &options) {
    std::vector<CapturePlan> captures;
    ExitCode code = ExitCode::good;
    const std::uint64_t octets = shardOctets(options);
    for (const std::string &file : options.files) {
        const CapturePlan &plan = captures.emplace_back(planShards(file, octets));
        if (plan.isPacked) {
            std::cerr << "netfloor: " << file
                      << " is packed with gzip, which can be read from its start alone: it is one shard.\n";
        }
        if (!plan.damage.empty()) {
            std::cerr << "netfloor: " << plan.damage << '\n';
            code = ExitCode::cutCapture;
        }
    }
    Output out(false, false);
    out.writeThrough(planText(captures));
    return code;
}

ChosenShard chooseShard(const std::string &text) {
    const std::size_t colon = text.rfind(':');
    std::uint64_t number = 0;
    const char *const end = text.data() + text.size();
    const auto [next, error] = std::from_chars(text.data() + std::min(colon + 1, text.size()), end, number);
    if (colon == std::string::npos || error != std::errc() || next != end || number == 0) {
        throw UsageError("--shard '" + text + "' is not of the form PLAN.json:3, with shards counted from 1.");
    }
    ChosenShard chosen;
    chosen.captures = readPlan(text.substr(0, colon));
    std::uint64_t left = number - 1;
    for (; chosen.capture < chosen.captures.size(); ++chosen.capture) {
        const std::size_t shards = chosen.captures[chosen.capture].shards.size();
        if (left < shards) {
            chosen.shard = left;
            return chosen;
        }
        left -= shards;
    }
    throw UsageError("--shard " + text + ": the plan has only " + std::to_string(number - 1 - left) + " shards.");
}

} // namespace netfloor::cli
