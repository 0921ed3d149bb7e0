// SPDX-License-Identifier: MIT
// Counts what the whole program allocates.
#pragma once

#include <cstdint>
#include <optional>

namespace netfloor::test {

// Blocks that this thread has been given so far; none under a sanitizer, which has an allocator of its own.
[[nodiscard]] std::optional<std::uint64_t> allocations();

} // namespace netfloor::test
