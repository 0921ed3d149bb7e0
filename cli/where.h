// SPDX-License-Identifier: MIT
// The option --where.
#pragma once

#include <string>

#include "netfloor-host/condition.h"

namespace netfloor::cli {

// The condition of a text. Throws UsageError, which shows the place of a mistake.
[[nodiscard]] Condition parseWhere(const std::string &text);

} // namespace netfloor::cli
