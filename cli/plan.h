// SPDX-License-Identifier: MIT
// The command `plan`, which cuts captures into shards, and the option --shard, which names one of them. A plan is JSON,
// so that programs that hand out work can read it.
#pragma once

#include <string>
#include <vector>

#include "exit_code.h"
#include "netfloor-capture/shards.h"
#include "options.h"

namespace netfloor::cli {

// Writes the plan. Throws CaptureError, UsageError, OutputClosed, OutputError.
[[nodiscard]] ExitCode showPlan(const Options &options);

// One shard, and what is known of the captures around it.
struct ChosenShard {
    std::vector<CapturePlan> captures;
    std::size_t capture = 0; // of these
    std::size_t shard = 0;   // of that capture
};

// "PLAN.json:3". Throws UsageError.
[[nodiscard]] ChosenShard chooseShard(const std::string &text);

// A plan as JSON, a line for each shard. Throws UsageError for a file whose name is no UTF-8.
[[nodiscard]] std::string planText(const std::vector<CapturePlan> &captures);

// The captures of a plan, each with at least one shard. Throws UsageError with a sentence that begins with `name`.
[[nodiscard]] std::vector<CapturePlan> readPlan(const std::string &name);

} // namespace netfloor::cli
