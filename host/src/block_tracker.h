// SPDX-License-Identifier: MIT
// Keeps track of the blocks in which fields stand, from what a host sees of them when a field is reported:
// the name of the innermost block, and where each open block began. Two blocks without a name of their own that begin
// at the same bit cannot be told apart, and count as one.
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
    explicit BlockTracker(FieldNames &names) : names_(names) {}

    // Before a packet.
    void reset();

    // Moves to the block in which the field stands that is being reported; the sink gets the blocks that are closed and
    // opened on the way. The cost is that of the blocks that changed.
    void moveTo(const DecodeState &state, NamedField &field, Sink &sink) {
        const std::size_t depth = static_cast<std::size_t>(state.blockStarts.top - state.blockStarts.base);
        if (!isInnermostUnchanged(state, depth)) {
            change(state, depth, field, sink);
        }
        lastCursor_ = state.cursor;
    }

    // After the last field.
    void closeAll(Sink &sink) { closeDownTo(0, sink); }

    [[nodiscard]] std::span<const BlockView> open() const { return views_; }
    [[nodiscard]] std::uint32_t shownDepth() const { return static_cast<std::uint32_t>(shown_.size()); }

private:
    static constexpr std::uint32_t none = static_cast<std::uint32_t>(-1);

    // What belongs to an open block beside its view. Blocks are given by their place among the open ones.
    struct Level {
        bool hasField = false;        // a field stood directly in it, so that its name is known
        bool wasShown = false;        // opened in the sink
        bool isInChain = false;       // `chainParent` tells where links are shown
        std::uint32_t limitDepth = 0; // limits open when it was first seen
        std::uint32_t shownParent = none;
        std::uint32_t chainParent = none;
    };

    // What is opened after a field begins at or after the cursor of that call. So a block that begins in front of it is
    // the same as then, and so are all around it.
    [[nodiscard]] bool isInnermostUnchanged(const DecodeState &state, std::size_t depth) const {
        return depth == views_.size() && depth != 0 && levels_.back().hasField && *state.blockStarts.top < lastCursor_ &&
               views_.back().firstBit == *state.blockStarts.top;
    }

    void change(const DecodeState &state, std::size_t depth, NamedField &field, Sink &sink);
    [[nodiscard]] std::size_t levelsKept(const DecodeState &state, std::size_t depth) const;
    void truncate(std::size_t depth);
    void open(std::uint32_t firstBit, std::uint32_t limitDepth);
    void name(std::string_view name);
    void show(Sink &sink);
    void closeDownTo(std::size_t depth, Sink &sink);
    [[nodiscard]] bool isShown(std::uint32_t level) const {
        return levels_[level].hasField && !views_[level].name.empty();
    }
    [[nodiscard]] std::uint32_t depthUnder(std::uint32_t shownParent) const {
        return shownParent == none ? 0 : views_[shownParent].depth + 1;
    }

    FieldNames &names_;
    std::vector<BlockView> views_; // of the open blocks, the outermost first
    std::vector<Level> levels_;    // the same
    std::vector<BlockView> shown_; // those that are open in the sink
    std::vector<std::uint32_t> toOpen_;
    std::uint32_t lastCursor_ = 0;
    std::uint32_t nextNumber_ = 0;
};

} // namespace netfloor
