// SPDX-License-Identifier: MIT
// The first field of every packet: the version, read ahead of the header that it decides on.
#pragma once

#include "frame/field.h"

namespace netfloor::plugin {

inline constexpr Field version{150, "Version", piece(4, 7), "Version=%u"};

} // namespace netfloor::plugin
