// SPDX-License-Identifier: MIT
#include "block_tracker.h"

#include <algorithm>

#include "netfloor-host/packet_state.h"

namespace netfloor {

// How many of the known levels are still open. What was opened after the last call begins at or behind the
// cursor of that call, so an equal level in front of it is the same block, and so are all below it.
std::size_t BlockTracker::levelsKept(const DecodeState &state, std::size_t depth) const {
    std::size_t kept = std::min(depth, levels_.size());
    for (std::size_t level = kept; level-- > 0;) {
        const std::uint32_t firstBit = state.blockStarts.base[level + 1];
        if (levels_[level].firstBit != firstBit) {
            kept = level;
        } else if (firstBit < lastCursor_) {
            break;
        }
    }
    return kept;
}

void BlockTracker::open(std::uint32_t firstBit, std::vector<Block> &blocks) {
    const std::size_t parent = levels_.empty() ? Block::none : levels_.back().block;
    levels_.push_back({firstBit, blocks.size(), false});
    blocks.push_back({{}, parent, firstBit});
}

std::size_t BlockTracker::current(const DecodeState &state, std::vector<Block> &blocks) {
    const std::size_t depth = depthOf(state.blockStarts);
    levels_.resize(levelsKept(state, depth), Level{});
    while (levels_.size() < depth) {
        open(state.blockStarts.base[levels_.size() + 1], blocks);
    }
    lastCursor_ = state.cursor;
    if (levels_.empty()) {
        return Block::none;
    }
    const std::string_view name = state.blockName;
    if (levels_.back().named && blocks[levels_.back().block].name != name) {
        levels_.pop_back();
        open(state.blockStarts.base[depth], blocks);
    }
    Level &innermost = levels_.back();
    if (!innermost.named) {
        innermost.named = true;
        blocks[innermost.block].name = name;
    }
    return innermost.block;
}

} // namespace netfloor
