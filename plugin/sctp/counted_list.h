// SPDX-License-Identifier: MIT
// A list whose elements are counted by a field in front of it.
#pragma once

#include <cstdint>

#include "frame/reader.h"

namespace netfloor::plugin::sctp {

// Reads a list of `count` elements. The count is believed as it stands: the list ends at it, or where a field does
// not fit. An element counts once it is begun, so a list whose last element is cut short has its full count. Gives
// whether that is so.
template <class Pass, class Element>
NETFLOOR_INLINE inline bool countedList(Reader<Pass> &reader, std::int32_t count, Element element) {
    std::int32_t begun = 0;
    while (reader.live && begun < count) {
        ++begun;
        element();
    }
    if (begun != count) {
        reader.raise(Flag::count);
    }
    reader.test(true);
    return begun > 0 && begun == count && !reader.live;
}

} // namespace netfloor::plugin::sctp
