// SPDX-License-Identifier: MIT
#include "block_tracker.h"

#include <algorithm>

#include "netfloor-host/testing.h"

namespace netfloor {

void BlockTracker::reset() {
    truncate(0);
    shown_.clear();
    lastCursor_ = 0;
    nextNumber_ = 0;
}

void BlockTracker::truncate(std::size_t depth) {
    views_.resize(depth);
    levels_.resize(depth);
}

void BlockTracker::change(const DecodeState &state, std::size_t depth, NamedField &field, Sink &sink) {
    truncate(levelsKept(state, depth));
    const std::uint32_t limitDepth = depthOf(state.limits);
    while (views_.size() < depth) {
        open(state.blockStarts.base[views_.size() + 1], limitDepth);
    }
    if (views_.empty()) {
        closeAll(sink);
        return;
    }
    const std::string_view blockName = state.blockName;
    if (levels_.back().hasField && views_.back().name != blockName) {
        truncate(depth - 1);
        open(state.blockStarts.base[depth], limitDepth);
    }
    if (!levels_.back().hasField) {
        name(names_.blockName(field, blockName));
    }
    show(sink);
}

// How many of the known blocks are still open: see isInnermostUnchanged.
std::size_t BlockTracker::levelsKept(const DecodeState &state, std::size_t depth) const {
    std::size_t kept = std::min(depth, views_.size());
    for (std::size_t level = kept; level-- > 0;) {
        const std::uint32_t firstBit = state.blockStarts.base[level + 1];
        if (views_[level].firstBit != firstBit) {
            kept = level;
        } else if (firstBit < lastCursor_) {
            break;
        }
    }
    return kept;
}

void BlockTracker::open(std::uint32_t firstBit, std::uint32_t limitDepth) {
    Level level;
    level.limitDepth = limitDepth;
    if (!views_.empty()) {
        const auto parent = static_cast<std::uint32_t>(views_.size() - 1);
        const Level &around = levels_[parent];
        level.shownParent = isShown(parent) ? parent : around.shownParent;
        if (around.isInChain && around.limitDepth == limitDepth) {
            level.isInChain = true;
            level.chainParent = around.chainParent;
        }
        if (!around.hasField) {
            level.chainParent = level.isInChain ? level.chainParent : level.shownParent;
            level.isInChain = true;
            level.shownParent = level.chainParent;
        }
    }
    levels_.push_back(level);
    views_.push_back({{}, nextNumber_++, firstBit, depthUnder(level.shownParent), false});
}

// Gives the innermost block its name. Where one of that name is shown around it, it takes its place.
void BlockTracker::name(std::string_view name) {
    Level &innermost = levels_.back();
    innermost.hasField = true;
    views_.back().name = name;
    if (name.empty()) {
        return;
    }
    for (std::uint32_t level = innermost.shownParent; level != none; level = levels_[level].shownParent) {
        if (views_[level].name == name) {
            innermost.shownParent = levels_[level].shownParent;
            break;
        }
    }
    views_.back().depth = depthUnder(innermost.shownParent);
}

// Opens the innermost block in the sink, and the blocks around it that are not open there.
void BlockTracker::show(Sink &sink) {
    const auto innermost = static_cast<std::uint32_t>(views_.size() - 1);
    std::uint32_t level = isShown(innermost) ? innermost : levels_[innermost].shownParent;
    toOpen_.clear();
    std::size_t common = 0;
    for (; level != none; level = levels_[level].shownParent) {
        const BlockView &view = views_[level];
        if (view.depth < shown_.size() && shown_[view.depth].number == view.number) {
            common = view.depth + 1;
            break;
        }
        toOpen_.push_back(level);
    }
    closeDownTo(common, sink);
    for (std::size_t i = toOpen_.size(); i-- > 0;) {
        BlockView &view = views_[toOpen_[i]];
        view.continued = levels_[toOpen_[i]].wasShown;
        levels_[toOpen_[i]].wasShown = true;
        shown_.push_back(view);
        sink.blockOpened(view);
    }
}

void BlockTracker::closeDownTo(std::size_t depth, Sink &sink) {
    while (shown_.size() > depth) {
        const BlockView closed = shown_.back();
        shown_.pop_back();
        sink.blockClosed(closed);
    }
}

} // namespace netfloor
