// SPDX-License-Identifier: MIT
#include "block_tracker.h"

#include <algorithm>
#include <cstring>
#include <utility>

#include "netfloor-host/testing.h"

namespace netfloor {

BlockTracker::BlockTracker(FieldNames &names) : names_(names), views_(room_), levels_(room_), shown_(shownRoom_) {
    toOpen_.reserve(shownRoom_);
}

void BlockTracker::reset() {
    depth_ = 0;
    shownDepth_ = 0;
    lastCursor_ = 0;
    nextNumber_ = 0;
}

void BlockTracker::change(const DecodeState &state, std::uint32_t depth, NamedField &field, Sink &sink) {
    if (depth == 0) {
        depth_ = 0;
        return closeAll(sink);
    }
    const std::uint32_t kept = levelsKept(state, depth);
    const bool isThere = kept == depth && levels_[depth - 1].hasField;
    const auto hasItsName = [&] { return std::strcmp(views_[depth - 1].name.data(), state.blockName) == 0; };
    if (isThere && (isOld(state.blockStarts.base[depth]) || hasItsName())) {
        if (std::exchange(depth_, depth) == depth) {
            return;
        }
    } else {
        // What is there has another name: another block, which begins at the same bit.
        for (depth_ = isThere ? kept - 1 : kept; depth_ < depth;) {
            open(state.blockStarts.base[depth_ + 1], depthOf(state.limits));
        }
        name(names_.blockName(field, state.blockName));
    }
    show(sink);
}

// How many of the known blocks are still open.
std::uint32_t BlockTracker::levelsKept(const DecodeState &state, std::uint32_t depth) const {
    std::uint32_t kept = std::min(depth, depth_);
    for (std::uint32_t level = kept; level-- > 0;) {
        const std::uint32_t firstBit = state.blockStarts.base[level + 1];
        if (views_[level].firstBit != firstBit) {
            kept = level;
        } else if (isOld(firstBit)) {
            break;
        }
    }
    return kept;
}

// Inside its caller, as the others: one of two fields opens a block.
[[gnu::always_inline]] inline void BlockTracker::open(std::uint32_t firstBit, std::uint32_t limitDepth) {
    if (depth_ == room_) {
        room_ *= 2;
        views_.resize(room_);
        levels_.resize(room_);
    }
    Level level;
    level.limitDepth = limitDepth;
    if (depth_ != 0) {
        const std::uint32_t parent = depth_ - 1;
        const Level &around = levels_[parent];
        level.shownParent = isShown(parent) ? parent : around.shownParent;
        if (around.isInChain && around.limitDepth == limitDepth) {
            level.isInChain = true;
            level.chainParent = around.chainParent;
        }
        if (!around.hasField && !beginsWithItsParent(parent)) {
            level.chainParent = level.isInChain ? level.chainParent : level.shownParent;
            level.isInChain = true;
            level.shownParent = level.chainParent;
        }
    }
    levels_[depth_] = level;
    views_[depth_] = {{}, nextNumber_++, firstBit, depthUnder(level.shownParent), false};
    ++depth_;
}

// A block that begins where the block shown around it begins is part of that block, and no later link.
bool BlockTracker::beginsWithItsParent(std::uint32_t level) const {
    const std::uint32_t shownParent = levels_[level].shownParent;
    return shownParent != none && views_[shownParent].firstBit == views_[level].firstBit;
}

// Gives the innermost block its name. Where a block of that name is shown around it, it takes the place of that one.
inline void BlockTracker::name(std::string_view name) {
    Level &innermost = levels_[depth_ - 1];
    BlockView &view = views_[depth_ - 1];
    innermost.hasField = true;
    view.name = name;
    if (name.empty()) {
        return;
    }
    for (std::uint32_t level = innermost.shownParent; level != none; level = levels_[level].shownParent) {
        // Each name is stored once, so that equal names have one address.
        if (views_[level].name.data() == name.data()) {
            innermost.shownParent = levels_[level].shownParent;
            break;
        }
    }
    view.depth = depthUnder(innermost.shownParent);
}

// Opens the innermost block in the sink, and the blocks around it that are not open there.
[[gnu::always_inline]] inline void BlockTracker::show(Sink &sink) {
    const std::uint32_t target = isShown(depth_ - 1) ? depth_ - 1 : levels_[depth_ - 1].shownParent;
    if (target == none || isOpenInSink(target)) {
        return closeDownTo(depthUnder(target), sink);
    }
    std::uint32_t level = levels_[target].shownParent;
    for (toOpen_.clear(); level != none && !isOpenInSink(level); level = levels_[level].shownParent) {
        toOpen_.push_back(level);
    }
    closeDownTo(depthUnder(level), sink);
    for (std::size_t i = toOpen_.size(); i-- > 0;) {
        openInSink(toOpen_[i], sink);
    }
    openInSink(target, sink);
}

inline void BlockTracker::openInSink(std::uint32_t level, Sink &sink) {
    if (shownDepth_ == shownRoom_) {
        shownRoom_ *= 2;
        shown_.resize(shownRoom_);
    }
    BlockView &view = views_[level];
    view.continued = levels_[level].wasShown;
    levels_[level].wasShown = true;
    shown_[shownDepth_++] = view;
    sink.blockOpened(view);
}

void BlockTracker::closeDownTo(std::uint32_t depth, Sink &sink) {
    while (shownDepth_ > depth) {
        sink.blockClosed(shown_[--shownDepth_]);
    }
}

} // namespace netfloor
