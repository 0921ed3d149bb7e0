// SPDX-License-Identifier: MIT
// The widths and kinds of key fields, by name.
//
// The key-field table does not say how wide a value is. The host keeps the little that it has to know here.
#pragma once

#include <string_view>

#include "netfloor-host/reports.h"

namespace netfloor {

[[nodiscard]] KeyType keyTypeOf(std::string_view fieldName);

} // namespace netfloor
