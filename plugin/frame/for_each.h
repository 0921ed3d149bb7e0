// SPDX-License-Identifier: MIT
// Loops of a known number of rounds, which compilers do not leave as loops.
#pragma once

#include <cstddef>
#include <cstdint>
#include <utility>

#include "frame/inline.h"

namespace netfloor::plugin {

// Calls `visit` with the number of each round, as a constant.
template <std::size_t count, class Visit>
NETFLOOR_INLINE constexpr void forEach(Visit visit) {
    [&]<std::size_t... i>(std::index_sequence<i...>) NETFLOOR_INLINE {
        (visit.template operator()<i>(), ...);
    }
    (std::make_index_sequence<count>{});
}

} // namespace netfloor::plugin
