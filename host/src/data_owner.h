// SPDX-License-Identifier: MIT
// The name under which a host reports octets that no owner decodes.
#pragma once

#include <string_view>

namespace netfloor {

inline constexpr std::string_view dataName = "data";

} // namespace netfloor
