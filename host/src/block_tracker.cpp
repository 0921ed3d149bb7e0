// SPDX-License-Identifier: MIT
#include "block_tracker.h"

#include <algorithm>

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

void BlockTracker::moveTo(const DecodeState &state, NamedField &field, Sink &sink) {
    const std::uint32_t depth = depthOf(state.blockStarts);
    firstBit_ = *state.blockStarts.top;
    if (depth == 0) {
        depth_ = 0;
        return closeAll(sink);
    }
    const std::uint32_t kept = levelsKept(state, depth);
    const bool isThere = kept == depth && levels_[depth - 1].hasField;
    if (isThere && (isOld(firstBit_) || hasItsName(state, depth - 1))) {
        depth_ = depth;
    } else {
        // What is there has another name: another block, which begins at the same bit.
        depth_ = isThere ? kept - 1 : kept;
        open(state, depth);
        name(names_.blockName(field, state.blockName));
    }
    show(levels_[depth - 1].shown, sink);
}

bool BlockTracker::isStillOpen(const DecodeState &state) const {
    return depth_ != 0 && levelsKept(state, depth_) == depth_ && hasItsName(state, depth_ - 1);
}

// How many of the known blocks are still open.
inline std::uint32_t BlockTracker::levelsKept(const DecodeState &state, std::uint32_t depth) const {
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

// Up to this depth. Inside its caller, as the others: one of three fields opens a block.
[[gnu::always_inline]] inline void BlockTracker::open(const DecodeState &state, std::uint32_t depth) {
    if (depth > room_) {
        room_ = 2 * depth;
        views_.resize(room_);
        levels_.resize(room_);
    }
    const std::uint32_t limitDepth = depthOf(state.limits);
    while (depth_ < depth) {
        Level &level = levels_[depth_];
        level.hasField = false;
        level.wasShown = false;
        level.limitDepth = limitDepth;
        level.chainParent = noChain;
        level.shownParent = depth_ == 0 ? none : shownParentIn(depth_ - 1, level);
        level.shown = level.shownParent;
        BlockView &view = views_[depth_];
        view.name = {};
        view.number = nextNumber_++;
        view.firstBit = state.blockStarts.base[++depth_];
        view.depth = depthUnder(level.shownParent);
        view.continued = false;
    }
}

// Where a new block in this one is shown, which may make it a link of a chain.
[[gnu::always_inline]] inline std::uint32_t BlockTracker::shownParentIn(std::uint32_t parent, Level &level) const {
    const Level &around = levels_[parent];
    if (around.chainParent != noChain && around.limitDepth == level.limitDepth) {
        level.chainParent = around.chainParent;
    }
    if (around.hasField || beginsWithItsParent(parent)) {
        return around.shown;
    }
    if (level.chainParent == noChain) {
        level.chainParent = around.shown;
    }
    return level.chainParent;
}

// A block that begins where the block shown around it begins is part of that block, and no later link.
inline bool BlockTracker::beginsWithItsParent(std::uint32_t level) const {
    const std::uint32_t shownParent = levels_[level].shownParent;
    return shownParent != none && views_[shownParent].firstBit == views_[level].firstBit;
}

// Gives the innermost block its name. Where a block of that name is shown around it, it takes the place of that one.
[[gnu::always_inline]] inline void BlockTracker::name(std::string_view name) {
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
    innermost.shown = depth_ - 1;
    view.depth = depthUnder(innermost.shownParent);
}

// Makes this block the innermost one that is open in the sink.
[[gnu::always_inline]] inline void BlockTracker::show(std::uint32_t target, Sink &sink) {
    if (target == none || isOpenInSink(target)) {
        return closeDownTo(depthUnder(target), sink);
    }
    const std::uint32_t parent = levels_[target].shownParent;
    if (parent != none && !isOpenInSink(parent)) {
        showAllAround(target, sink);
    }
    closeDownTo(views_[target].depth, sink);
    openInSink(target, sink);
}

// Opens the blocks around this one that are not open in the sink.
void BlockTracker::showAllAround(std::uint32_t target, Sink &sink) {
    std::uint32_t level = levels_[target].shownParent;
    for (toOpen_.clear(); level != none && !isOpenInSink(level); level = levels_[level].shownParent) {
        toOpen_.push_back(level);
    }
    closeDownTo(depthUnder(level), sink);
    for (std::size_t i = toOpen_.size(); i-- > 0;) {
        openInSink(toOpen_[i], sink);
    }
}

[[gnu::always_inline]] inline void BlockTracker::openInSink(std::uint32_t level, Sink &sink) {
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
