// SPDX-License-Identifier: MIT
// The exports that need no packet.
#pragma once

#include <string>

#include "plugin.h"

namespace netfloor::compare {

// In what the descriptions of the fields and the formatter of two plug-ins differ; empty when they are the same.
[[nodiscard]] std::string exportDifferences(const Plugin &before, const Plugin &after);

} // namespace netfloor::compare
