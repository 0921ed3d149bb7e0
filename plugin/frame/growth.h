// SPDX-License-Identifier: MIT
// Growth of the host's arrays, through hs_Realloc: rare, and so out of line.
#pragma once

#include <cstddef>
#include <cstdint>

#include "frame/bits.h"
#include "frame/field_record.h"
#include "netfloor/host.h"
#include "netfloor/records.h"

namespace netfloor::plugin {

// Calls hs_Realloc. Inside an address of reversed bits, which starts at the bit `reversedFrom` (0: there is none), the
// host sees the working copy reversed; where the run ends there, it stays so.
[[nodiscard]] inline void *grow(const DecodeState &state, std::uint32_t reversedFrom, void *array, std::size_t octets) {
    if (reversedFrom == 0) {
        return hs_Realloc(array, octets);
    }
    reverseOctets(state.data, reversedFrom, state.totalBits);
    void *const grown = hs_Realloc(array, octets);
    if (grown != nullptr) {
        reverseOctets(state.data, reversedFrom, state.totalBits);
    }
    return grown;
}

// Doubles the room of a stack until it holds its count. False, with the flag raised, where that fails.
[[gnu::cold, gnu::noinline]] inline bool growStack(DecodeState &state, BitStack &stack, std::uint32_t reversedFrom) {
    while (stack.count >= stack.capacity) {
        const std::uint32_t capacity = stack.capacity * 2;
        void *const grown =
            capacity == 0 ? nullptr : grow(state, reversedFrom, stack.base, capacity * sizeof *stack.base);
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

// Makes room for `elements` bit ranges, if there is none. False, with the flag raised, where that fails.
[[gnu::cold, gnu::noinline]] inline bool growRanges(DecodeState &state, std::uint32_t elements,
                                                    std::uint32_t reversedFrom) {
    FieldRecord &record = state.fieldRecord;
    if (elements < record.rangeCapacity) {
        return true;
    }
    void *const grown = grow(state, reversedFrom, record.ranges, elements * sizeof *record.ranges);
    if (grown == nullptr) {
        state.flags |= NETFLOOR_FLAG_NO_RANGES;
        return false;
    }
    record.ranges = static_cast<BitRange *>(grown);
    record.rangeCapacity = elements;
    return true;
}

// The same for an address in groups at the cursor: room is made for each group as it comes.
[[gnu::cold, gnu::noinline]] inline bool growRangesForGroups(DecodeState &state) {
    FieldRecord &record = state.fieldRecord;
    for (std::uint32_t group = 0; group < addressGroupCount; ++group) {
        if (!growRanges(state, group + 1, 0)) {
            return false;
        }
        record.ranges[group].value = groupAt(state.data, state.cursor + group * groupBits);
        record.rangeCount = group + 1;
    }
    return true;
}

} // namespace netfloor::plugin
