// SPDX-License-Identifier: MIT
// What an object of `json` can have, as a JSON schema (draft 7).
#pragma once

#include <cstdint>

#include "netfloor-analysis/columns.h"

namespace netfloor::cli {

// Rises when a key goes away or changes its meaning.
inline constexpr std::uint32_t packetSchemaNumber = 1;

// JSON has objects inside one another, so it needs no value of the row around and none that stands for another one.
[[nodiscard]] inline bool isInJson(const Column &column) {
    return !column.isRepeated && !column.isEitherOf;
}

// Throws OutputClosed, OutputError.
void showPacketSchema();

} // namespace netfloor::cli
