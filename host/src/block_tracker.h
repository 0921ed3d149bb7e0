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
#include "netfloor-host/testing.h"

namespace netfloor {

class BlockTracker {
public:
    explicit BlockTracker(FieldNames &names);

    // Before a packet.
    void reset();

    // For each field that is being reported, first: whether it is in the same block as the field before.
    [[nodiscard]] bool isAt(const DecodeState &state) const {
        const std::uint32_t firstBit = *state.blockStarts.top;
        return firstBit == firstBit_ && depthOf(state.blockStarts) == depth_ && (isOld(firstBit) || isStillOpen(state));
    }
    // Second: if it is not, moves to its block. The sink gets the blocks that are closed and opened for that. The cost
    // grows with the number of blocks that changed.
    void moveTo(const DecodeState &state, NamedField &field, Sink &sink);
    // Third.
    void passField(const DecodeState &state) { lastCursor_ = state.cursor; }

    // After the last field.
    void closeAll(Sink &sink) { closeDownTo(0, sink); }

    [[nodiscard]] std::span<const BlockView> open() const { return {views_.data(), depth_}; }
    [[nodiscard]] std::uint32_t shownDepth() const { return shownDepth_; }

private:
    static constexpr std::uint32_t none = static_cast<std::uint32_t>(-1);
    static constexpr std::uint32_t noChain = none - 1;

    // What belongs to an open block in addition to its view. Blocks are given by their index among the open ones.
    struct Level {
        bool hasField = false;        // a field was read directly in it, so that its name is known
        bool wasShown = false;        // opened in the sink
        std::uint32_t limitDepth = 0; // limits open when it was first seen
        std::uint32_t shownParent = none;
        std::uint32_t shown = none;          // itself, if it is shown, or else shownParent
        std::uint32_t chainParent = noChain; // where the links of its chain are shown
    };

    // Whether a block that begins at this bit was open when the field before was reported, and all around it: what is
    // opened after a field begins at or after the cursor of that call.
    [[nodiscard]] bool isOld(std::uint32_t firstBit) const { return firstBit < lastCursor_; }

    // Whether the blocks that are open, as many as before, are the same ones, although the innermost one begins at the
    // cursor: single bits of an octet are read before the cursor moves on.
    [[nodiscard]] bool isStillOpen(const DecodeState &state) const;
    [[nodiscard]] bool hasItsName(const DecodeState &state, std::uint32_t level) const {
        return isBlockName(state.blockName, views_[level].name);
    }
    [[nodiscard]] std::uint32_t levelsKept(const DecodeState &state, std::uint32_t depth) const;
    void open(const DecodeState &state, std::uint32_t depth);
    [[nodiscard]] std::uint32_t shownParentIn(std::uint32_t parent, Level &level) const;
    [[nodiscard]] bool beginsWithItsParent(std::uint32_t level) const;
    void name(std::string_view name);
    void show(std::uint32_t target, Sink &sink);
    void showAllAround(std::uint32_t target, Sink &sink);
    void openInSink(std::uint32_t level, Sink &sink);
    void closeDownTo(std::uint32_t depth, Sink &sink);
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
