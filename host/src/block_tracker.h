// SPDX-License-Identifier: MIT
// Keeps track of the blocks around the fields. When a field is reported, a host sees the name of the innermost block,
// and where each open block began. Two blocks without a name of their own that begin at the same bit look the same,
// and count as one.
//
// It also decides how they are shown; netfloor-host/sink.h describes the rules.
#pragma once

#include <cstddef>
#include <cstdint>
#include <span>
#include <string_view>
#include <vector>

#include <netfloor/records.h>

#include "field_names.h"
#include "netfloor-host/sink.h"

namespace netfloor {

class BlockTracker {
public:
    explicit BlockTracker(FieldNames &names);

    // Before a packet.
    void reset();

    // Moves to the block of the field that is being reported, and tells whether another one may be open now. The sink
    // gets the blocks that are closed and opened for that. The cost grows with the number of blocks that changed.
    [[nodiscard]] bool moveTo(const DecodeState &state, NamedField &field, Sink &sink) {
        const auto depth = static_cast<std::uint32_t>(state.blockStarts.top - state.blockStarts.base);
        const std::uint32_t firstBit = *state.blockStarts.top;
        const bool isSame = depth == depth_ && firstBit == firstBit_ && isOld(firstBit);
        if (!isSame) {
            change(state, depth, field, sink);
            firstBit_ = firstBit;
        }
        lastCursor_ = state.cursor;
        return !isSame;
    }

    // After the last field.
    void closeAll(Sink &sink) { closeDownTo(0, sink); }

    [[nodiscard]] std::span<const BlockView> open() const { return {views_.data(), depth_}; }
    [[nodiscard]] std::uint32_t shownDepth() const { return shownDepth_; }

private:
    static constexpr std::uint32_t none = static_cast<std::uint32_t>(-1);

    // What belongs to an open block in addition to its view. Blocks are given by their index among the open ones.
    struct Level {
        bool hasField = false;        // a field was read directly in it, so that its name is known
        bool wasShown = false;        // opened in the sink
        bool isInChain = false;       // `chainParent` is where its links are shown
        std::uint32_t limitDepth = 0; // limits open when it was first seen
        std::uint32_t shownParent = none;
        std::uint32_t chainParent = none;
    };

    // Whether a block that begins at this bit was open when the field before was reported, and all around it: what is
    // opened after a field begins at or after the cursor of that call.
    [[nodiscard]] bool isOld(std::uint32_t firstBit) const { return firstBit < lastCursor_; }

    void change(const DecodeState &state, std::uint32_t depth, NamedField &field, Sink &sink);
    [[nodiscard]] std::uint32_t levelsKept(const DecodeState &state, std::uint32_t depth) const;
    void open(std::uint32_t firstBit, std::uint32_t limitDepth);
    [[nodiscard]] bool beginsWithItsParent(std::uint32_t level) const;
    void name(std::string_view name);
    void show(Sink &sink);
    void openInSink(std::uint32_t level, Sink &sink);
    void closeDownTo(std::uint32_t depth, Sink &sink);
    [[nodiscard]] bool isShown(std::uint32_t level) const {
        return levels_[level].hasField && !views_[level].name.empty();
    }
    [[nodiscard]] bool isOpenInSink(std::uint32_t level) const {
        const BlockView &view = views_[level];
        return view.depth < shownDepth_ && shown_[view.depth].number == view.number;
    }
    [[nodiscard]] std::uint32_t depthUnder(std::uint32_t shownParent) const {
        return shownParent == none ? 0 : views_[shownParent].depth + 1;
    }

    FieldNames &names_;

    static constexpr std::uint32_t usualDepth = 32;

    // Room that only grows, and how much of it is in use.
    std::uint32_t room_ = usualDepth;
    std::uint32_t shownRoom_ = usualDepth;
    std::vector<BlockView> views_; // of the open blocks, the outermost first
    std::vector<Level> levels_;    // the same
    std::vector<BlockView> shown_; // those that are open in the sink
    std::uint32_t depth_ = 0;
    std::uint32_t shownDepth_ = 0;

    std::vector<std::uint32_t> toOpen_;
    // Of the field before: where its block begins, and the cursor.
    std::uint32_t firstBit_ = 0;
    std::uint32_t lastCursor_ = 0;
    std::uint32_t nextNumber_ = 0;
};

} // namespace netfloor
