// SPDX-License-Identifier: MIT
// Stretches: productions that start with fields of fixed size, such as a protocol's header.
#pragma once

#include <cstdint>

#include "frame/block.h"
#include "frame/field_list.h"
#include "frame/reader.h"

namespace netfloor::plugin {

// The most elements of a field of fixed size.
inline constexpr std::uint32_t mostFixedElements = addressGroupCount * nibblesPerGroup;

// So many blocks a stretch opens without a test of its own, as many as UDP and its hand-off have; more take the usual
// road.
inline constexpr std::uint32_t mostStretchBlocks = 4;

// Runs a production that starts with the fields from `first` to `last`, all of fixed size. A pass that reports nothing
// asks once whether they all fit, and then writes only what is left to be seen behind them; the rare packet that is cut
// short there is read field by field, out of line.
template <const Field &first, const Field &last, auto production, class Pass>
NETFLOOR_INLINE inline void checkedRun(Reader<Pass> &reader) {
    if constexpr (Pass::reports) {
        production(reader);
    } else {
        constexpr std::uint32_t bitCount = bitsFromTo<typename Pass::Fields>(first, last);
        static_assert(bitCount != 0, "a checked run goes from a field of the catalogue to a later one");
        const bool sure = reader.live && reader.left >= bitCount && onOctetBorder(reader.cursor) && !reader.unchecked &&
                          reader.state->fieldRecord.rangeCapacity > mostFixedElements &&
                          reader.state->blockStarts.capacity > reader.blockDepth + mostStretchBlocks;
        if (!sure) [[unlikely]] {
            return runOutOfLine<production>(reader);
        }
        // A live reader is never over; said again, so that the tests for it fall away.
        reader.outcome = Outcome::on;
        reader.inStretch = true;
        reader.sureBits = bitCount;
        reader.sureBlocks = mostStretchBlocks;
        production(reader);
        reader.settle();
        reader.forget();
    }
}

} // namespace netfloor::plugin
