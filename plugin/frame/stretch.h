// SPDX-License-Identifier: MIT
// Stretches: productions that start with fields of fixed size, such as a protocol's header.
#pragma once

#include <cstdint>

#include "frame/block.h"
#include "frame/reader.h"

namespace netfloor {

// The most elements of a field of fixed size, and as many blocks as a stretch opens.
inline constexpr std::uint32_t mostFixedElements = addressGroupCount * nibblesPerGroup;
inline constexpr std::uint32_t mostStretchBlocks = 4;

// Runs a production whose first `bitCount` bits are fields of fixed size. A pass that reports nothing asks once
// whether they all fit, and then writes only what is left to be seen behind them; the rare packet that is cut
// short there is read field by field, out of line.
template <std::uint32_t bitCount, auto production, class Pass>
NETFLOOR_INLINE inline void stretch(Reader<Pass> &at) {
    if constexpr (Pass::reports) {
        production(at);
    } else {
        const bool sure = at.live && at.left >= bitCount && onOctetBorder(at.cursor) && !at.unchecked &&
                          at.state->fieldRecord.rangeCapacity > mostFixedElements &&
                          at.state->blockStarts.capacity > at.blockDepth + mostStretchBlocks;
        if (!sure) [[unlikely]] {
            return apart<production>(at);
        }
        // A live reader is never over; said again, so that the tests for it fall away.
        at.outcome = Outcome::on;
        at.inStretch = true;
        at.sureBits = bitCount;
        at.sureBlocks = mostStretchBlocks;
        production(at);
        at.settle();
        at.forget();
    }
}

} // namespace netfloor
