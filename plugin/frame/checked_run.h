// SPDX-License-Identifier: MIT
// Checked runs: productions that start with fields of fixed size, such as a protocol's header.
#pragma once

#include <cstdint>

#include "frame/block.h"
#include "frame/field_list.h"
#include "frame/reader.h"

namespace netfloor::plugin {

// Whether a run can start at the cursor: on an octet border, with room for all that it opens and for any field of
// fixed size. A run that is going on has found the room.
template <class Pass>
[[nodiscard]] NETFLOOR_INLINE inline bool canRun(const Reader<Pass> &reader) {
    if (reader.writer.isInRun()) {
        return onOctetBorder(reader.writer.bit());
    }
    const DecodeState &state = *reader.state;
    return onOctetBorder(reader.cursor) && state.fieldRecord.rangeCapacity > mostFixedElements &&
           state.blockStarts.capacity > reader.blockDepth + runBlocks &&
           state.limits.capacity > reader.limitDepth + runLimits;
}

// In a run, after the bits from the start of `first` to the end of `last` were found to be left.
template <const Field &first, const Field &last, class Pass>
NETFLOOR_INLINE inline void expectFields(Reader<Pass> &reader) {
    constexpr std::uint32_t bitCount = bitsFromTo<typename Pass::Fields>(first, last);
    static_assert(bitCount != 0, "a checked run goes from a field of the catalogue to a later one");
    reader.writer.checkBits(bitCount);
    // For all fields at once: no host looks before the last of them is read.
    constexpr std::uint32_t cleared = clearedFromTo<typename Pass::Fields>(first, last);
    reader.writer.template clearInRun<cleared>(reader.state->fieldRecord);
}

// Runs a production that starts with the fields from `first` to `last`, all of fixed size. A pass that reports nothing
// asks once whether they all fit, and then writes only what can be seen after the production; the rare packet that is
// cut short there is read field by field, by `slowly`, out of line. A run inside another one goes on with it.
template <const Field &first, const Field &last, auto production, auto slowly = production, class Pass>
NETFLOOR_INLINE inline void checkedRun(Reader<Pass> &reader) {
    if constexpr (!Pass::Writer::hasCheckedRuns) {
        production(reader);
    } else {
        constexpr std::uint32_t bitCount = bitsFromTo<typename Pass::Fields>(first, last);
        if (!reader.live || reader.left < bitCount || !canRun(reader)) [[unlikely]] {
            return runOutOfLine<slowly>(reader);
        }
        const bool isOutermost = !reader.writer.isInRun();
        if (isOutermost) {
            // The first field would make the verdict check, and no host looks before. The run of a live reader has not
            // ended. Both are said again, so that the tests for them fall away.
            reader.check();
            reader.unchecked = false;
            reader.outcome = Outcome::running;
            reader.writer.startRun(octetsFrom(reader.data, reader.cursor));
        }
        expectFields<first, last>(reader);
        production(reader);
        if (isOutermost) {
            reader.leaveRun();
        }
    }
}

} // namespace netfloor::plugin
