// SPDX-License-Identifier: MIT
// Growth of the host's arrays, through hs_Realloc: rare, and so out of line.
#pragma once

#include <cstdint>

#include "netfloor/host.h"
#include "netfloor/records.h"

namespace netfloor::plugin {

// Doubles the room of a stack until it holds its count. False, with the flag raised, where that fails.
[[gnu::cold, gnu::noinline]] inline bool growStack(DecodeState &state, BitStack &stack) {
    while (stack.count >= stack.capacity) {
        const std::uint32_t capacity = stack.capacity * 2;
        void *const grown = capacity == 0 ? nullptr : hs_Realloc(stack.base, capacity * sizeof *stack.base);
        if (grown == nullptr) {
            state.flags |= NETFLOOR_FLAG_NO_STACK;
            return false;
        }
        stack.base = static_cast<std::uint32_t *>(grown);
        stack.top = stack.base + stack.count;
        stack.capacity = capacity;
    }
    return true;
}

// Makes room for `elements` bit ranges. False, with the flag raised, where that fails.
[[gnu::cold, gnu::noinline]] inline bool growRanges(DecodeState &state, std::uint32_t elements) {
    FieldRecord &record = state.fieldRecord;
    void *const grown = hs_Realloc(record.ranges, elements * sizeof *record.ranges);
    if (grown == nullptr) {
        state.flags |= NETFLOOR_FLAG_NO_RANGES;
        return false;
    }
    record.ranges = static_cast<BitRange *>(grown);
    record.rangeCapacity = elements;
    return true;
}

} // namespace netfloor::plugin
