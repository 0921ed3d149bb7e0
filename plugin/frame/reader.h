// SPDX-License-Identifier: MIT
// The reader: what every production works on.
//
// A production is a function template over the pass. It gets a Reader and says what the wire says: opens
// blocks, reads fields, peeks, narrows the limit. It never asks which pass it runs in.
//
// A Reader is a value. What is inlined keeps it in registers; `runOutOfLine` runs a production on a copy.
#pragma once

#include <cstdint>
#include <string_view>

#include "frame/growth.h"
#include "frame/pass.h"
#include "frame/position.h"
#include "netfloor/records.h"

namespace netfloor::plugin {

template <DecodingPass Pass>
class Reader : public Position {
public:
    typename Pass::Context *context;
    DecodeState *state;
    std::uint8_t *data;
    typename Pass::Writer writer;

    NETFLOOR_INLINE explicit Reader(typename Pass::Context &passContext)
        : context(&passContext), state(passContext.decodeState) {
        takeState();
    }

    // Goes on where another reader is, after which nothing of a checked run is put off.
    NETFLOOR_INLINE Reader(typename Pass::Context &passContext, const Position &position)
        : Position(position.position()), context(&passContext), state(passContext.decodeState), data(state->data) {}

    NETFLOOR_INLINE static typename Pass::Variables &variables() { return Pass::variables; }

    // The last condition of the grammar, and the bits of its last step. They live in the state.
    NETFLOOR_INLINE void setCondition(bool holds) { writer.setCondition(*state, holds); }

    NETFLOOR_INLINE void setAdvance(std::int32_t bitCount) { writer.setAdvance(*state, bitCount); }

    // Keeps a condition of the grammar as the last one, and gives it back.
    NETFLOOR_INLINE bool test(bool holds) {
        if (!ended()) {
            setCondition(holds);
        }
        return holds;
    }

    // Raises a flag, if the pass does.
    NETFLOOR_INLINE void raise(Flag flag) {
        if (ended() || !Pass::raises(flag)) {
            return;
        }
        writer.raise(*state, flag == Flag::limitTooLong   ? NETFLOOR_FLAG_LIMIT_TOO_LONG
                             : flag == Flag::bitsLeftOver ? NETFLOOR_FLAG_BITS_LEFT_OVER
                                                          : NETFLOOR_FLAG_EXPECTATION);
        unchecked = true;
    }

    // The verdict check: a flag that is set becomes the verdict, in the pass that gives one. It is made after each
    // field and each assignment of the grammar that a flag can precede, before a block closes, and when the first is
    // open.
    NETFLOOR_INLINE void check() {
        if (unchecked) {
            Pass::giveVerdict(*context);
            unchecked = false;
        }
    }

    // Ends the run where the host's storage does not suffice, with the state as it is there.
    NETFLOOR_INLINE void cutOff() {
        Reader copy = *this; // what is put off stays so, for those who read on: they have no effect
        copy.giveState();
        end(Outcome::cutOff);
    }

    // Ends the run: nothing has an effect from here on.
    NETFLOOR_INLINE void end(Outcome how) {
        live = false;
        outcome = how;
    }

    // Takes over what the state says: at the entry, and after a hand-off.
    NETFLOOR_INLINE void takeState() {
        data = state->data;
        cursor = state->cursor;
        left = state->bitsLeft;
        blockDepth = static_cast<std::uint32_t>(state->blockStarts.top - state->blockStarts.base);
        limitDepth = static_cast<std::uint32_t>(state->limits.top - state->limits.base);
        fieldBlock = {};
        unchecked = state->flags != 0;
        writer.reset();
    }

    // Gives the state all that the reader holds: wherever the host can look.
    NETFLOOR_INLINE void giveState() {
        writer.flush(*this, *state, data);
        state->blockStarts.top = state->blockStarts.base + blockDepth;
        state->limits.top = state->limits.base + limitDepth;
        state->cursor = cursor;
        state->bitsLeft = left;
    }

    // Ends a checked run: what follows is checked and written one by one.
    NETFLOOR_INLINE void leaveRun() {
        writer.flushRun(*state);
        writer.endRun();
    }

    // Goes on where a production that ran out of line left off.
    NETFLOOR_INLINE void resumeAt(const Position &position) {
        static_cast<Position &>(*this) = position.position();
        data = state->data;
        writer.endRun();
    }

    // Opens the block that `block` names. False when the stack cannot grow.
    NETFLOOR_INLINE bool openBlock() {
        writer.nameBlock(*this, *state);
        if (writer.pushedBlockInRun(*state, blockDepth + 1, cursor)) {
            ++blockDepth;
        } else {
            writer.flushRun(*state);
            if (!push(state->blockStarts, blockDepth, cursor)) {
                return false;
            }
        }
        return true;
    }

    NETFLOOR_INLINE void closeBlock() {
        check();
        --blockDepth;
        writer.poppedBlock();
        writer.popped(state->blockStarts, 1);
    }

    // Closes so many blocks, before which the writer had room for `blockRoom`.
    NETFLOOR_INLINE void closeBlocks(std::uint32_t count, std::uint32_t blockRoom) {
        if (count > 0) {
            check();
        }
        blockDepth -= count;
        writer.setBlockRoom(blockRoom);
        writer.popped(state->blockStarts, count);
    }

    // Opens a limit of so many bits. False where it reaches past the bits left, and so narrows nothing.
    NETFLOOR_INLINE bool openLimit(std::uint32_t bitCount) {
        const bool narrows = bitCount <= left;
        writer.checkBits(0);
        setAdvance(static_cast<std::int32_t>(bitCount));
        if (narrows) {
            left = bitCount;
        } else {
            raise(Flag::limitTooLong);
        }
        const std::uint32_t lastBit = cursor + left - 1;
        if (writer.pushedLimitInRun(*state, limitDepth + 1, lastBit)) {
            ++limitDepth;
        } else {
            writer.flushRun(*state);
            push(state->limits, limitDepth, lastBit);
        }
        return narrows;
    }

    NETFLOOR_INLINE void closeLimit() {
        --limitDepth;
        writer.poppedLimit();
        writer.popped(state->limits, 1);
        left = state->limits.base[limitDepth] - cursor + 1;
    }

    // Skips what is left of the innermost limit.
    NETFLOOR_INLINE void skipRest() {
        if (left != 0) {
            cursor += left;
            writer.skipped(left);
            left = 0;
            raise(Flag::bitsLeftOver);
        }
    }

    // Makes room for so many elements of a field of this name, whose elements are still to be read; without a name the
    // record stays that of the field before. False when the ranges cannot grow.
    NETFLOOR_INLINE bool roomFor(std::uint32_t elements, const char *name) {
        if (hasRoom(elements)) [[likely]] {
            return true;
        }
        // Growth works on a copy, so that the reader itself can stay in registers.
        Reader copy = *this;
        if (!copy.makeRoom(elements, name)) {
            end(Outcome::cutOff);
            return false;
        }
        return true;
    }

    // The same for an address in groups, which come one by one.
    NETFLOOR_INLINE bool roomForGroups(std::string_view name) {
        if (hasRoom(addressGroupCount)) [[likely]] {
            return true;
        }
        Reader copy = *this;
        if (!copy.makeRoomForGroups(name.data())) {
            end(Outcome::cutOff);
            return false;
        }
        return true;
    }

private:
    // A pass that puts off what it writes says no also where the ranges are so few that they may grow for a field of
    // fixed size: then each field is written, as the host sees its elements while a later field grows.
    [[nodiscard]] NETFLOOR_INLINE bool hasRoom(std::uint32_t elements) const {
        const std::uint32_t capacity = state->fieldRecord.rangeCapacity;
        if constexpr (Pass::Writer::hasCheckedRuns) {
            return (elements < mostFixedElements ? mostFixedElements : elements) < capacity;
        }
        return elements < capacity;
    }

    NETFLOOR_INLINE bool push(BitStack &stack, std::uint32_t &depth, std::uint32_t bit) {
        ++depth;
        stack.count = depth;
        writer.pushed(stack);
        if (depth >= stack.capacity) [[unlikely]] {
            Reader copy = *this;
            if (!copy.makeRoom(stack)) {
                end(Outcome::cutOff);
                return false;
            }
        }
        stack.base[depth] = bit;
        return true;
    }

    // What these do after giveState has a function of its own, without the reader: the copy for which they are called
    // would otherwise keep the original out of the registers.

    [[gnu::cold, gnu::noinline]] bool makeRoom(BitStack &stack) {
        giveState();
        writer.flushFlagWords(state->fieldRecord);
        return growStack(*state, stack, variables().reversedFrom);
    }

    [[gnu::cold, gnu::noinline]] bool makeRoom(std::uint32_t elements, const char *name) {
        giveState();
        writer.flushFlagWords(state->fieldRecord);
        if (name != nullptr) {
            beginRecord(state->fieldRecord, name);
        }
        return growRanges(*state, elements, variables().reversedFrom);
    }

    [[gnu::cold, gnu::noinline]] bool makeRoomForGroups(const char *name) {
        giveState();
        writer.flushFlagWords(state->fieldRecord);
        beginRecord(state->fieldRecord, name);
        return growRangesForGroups(*state);
    }
};

} // namespace netfloor::plugin
