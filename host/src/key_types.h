// SPDX-License-Identifier: MIT
// The widths and kinds of key fields.
//
// The key-field table does not say how wide a value is. The field tables say it, for the field of the same name.
#pragma once

#include <span>
#include <vector>

#include <netfloor/descriptors.h>
#include <netfloor/records.h>

#include "netfloor-host/reports.h"

namespace netfloor {

// A row without a field has no value; it counts as a number.
[[nodiscard]] std::vector<KeyType> keyTypesOf(std::span<const KeyFieldRow> rows, NetfloorGetTable getTable);

} // namespace netfloor
