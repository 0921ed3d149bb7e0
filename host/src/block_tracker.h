// SPDX-License-Identifier: MIT
// Keeps track of the blocks in which fields stand, from what a host sees of them when a field is reported:
// the name of the innermost block, and where each open block began. Two blocks without a name of their own that begin
// at the same bit cannot be told apart, and count as one.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string_view>
#include <vector>

#include <netfloor/records.h>

#include "netfloor-host/reports.h"

namespace netfloor {

class BlockTracker {
public:
    // The innermost open block, as an index of `blocks`, to which blocks not seen before are added.
    std::size_t current(const DecodeState &state, std::vector<Block> &blocks);

private:
    struct Level {
        std::uint32_t firstBit;
        std::size_t block;
        bool named;
    };

    void open(std::uint32_t firstBit, std::vector<Block> &blocks);
    [[nodiscard]] std::size_t levelsKept(const DecodeState &state, std::size_t depth) const;

    std::vector<Level> levels_;
    std::uint32_t lastCursor_ = 0;
};

} // namespace netfloor
