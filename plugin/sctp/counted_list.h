// SPDX-License-Identifier: MIT
// A list whose number of elements is in a field before it.
#pragma once

#include <cstdint>

#include "frame/reader.h"

namespace netfloor::plugin::sctp {

// Reads a list of `count` elements. The count is not verified: the list ends after that many, or at a field that does
// not fit. An element is counted when it starts, so a list whose last element is cut short has its full count. Returns
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
