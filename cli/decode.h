// SPDX-License-Identifier: MIT
// From the options to the results: the run of the command.
#pragma once

#include "exit_code.h"
#include "options.h"

namespace netfloor::cli {

// Throws CaptureError, PluginError, UsageError, OutputClosed, OutputError.
[[nodiscard]] ExitCode decodeCapture(const Options &options);

} // namespace netfloor::cli
