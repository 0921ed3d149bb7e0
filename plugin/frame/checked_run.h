// SPDX-License-Identifier: MIT
// Checked runs: productions that start with fields of fixed size, such as a protocol's header.
#pragma once

#include <cstdint>

#include "frame/block.h"
#include "frame/field_list.h"
#include "frame/reader.h"

namespace netfloor::plugin {

// So many blocks a run opens without a test of its own, as many as UDP and its hand-off have; more are tested one by
// one.
inline constexpr std::uint32_t mostRunBlocks = 4;

// Runs a production that starts with the fields from `first` to `last`, all of fixed size. A pass that reports nothing
// asks once whether they all fit, and then writes only what can be seen after them; the rare packet that is cut
// short there is read field by field, out of line.
template <const Field &first, const Field &last, auto production, class Pass>
NETFLOOR_INLINE inline void checkedRun(Reader<Pass> &reader) {
    if constexpr (!Pass::Writer::hasCheckedRuns) {
        production(reader);
    } else {
        constexpr std::uint32_t bitCount = bitsFromTo<typename Pass::Fields>(first, last);
        static_assert(bitCount != 0, "a checked run goes from a field of the catalogue to a later one");
        const DecodeState &state = *reader.state;
        const bool holds = reader.live && reader.left >= bitCount && onOctetBorder(reader.cursor) &&
                           state.fieldRecord.rangeCapacity > mostFixedElements &&
                           state.blockStarts.capacity > reader.blockDepth + mostRunBlocks;
        if (!holds) [[unlikely]] {
            return runOutOfLine<production>(reader);
        }
        // The first field would make the verdict check, and no host looks before. The run of a live reader has not
        // ended. Both are said again, so that the tests for them fall away.
        reader.check();
        reader.unchecked = false;
        reader.outcome = Outcome::running;
        reader.writer.startRun(bitCount, mostRunBlocks);
        // For all fields of the run at once: no host looks before the last of them is read.
        constexpr std::uint32_t cleared = clearedFromTo<typename Pass::Fields>(first, last);
        reader.writer.template clearFlagWords<cleared>(reader.state->fieldRecord);
        production(reader);
        reader.writer.flushRun(*reader.state);
        reader.writer.endRun();
    }
}

} // namespace netfloor::plugin
