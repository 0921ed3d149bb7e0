// SPDX-License-Identifier: MIT
// The version, which is the first field of every packet and decides which header follows.
#pragma once

#include "frame/field.h"
#include "frame/field_list.h"

namespace netfloor::plugin {

inline constexpr Field version{150, "Version", piece(4, 7), "%n=%u"};

using VersionRows = Rows<FieldList<version>, FieldList<version>>;

} // namespace netfloor::plugin
