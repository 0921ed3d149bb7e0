// SPDX-License-Identifier: MIT
// The reader: what every production works on.
//
// A production is a function template over the pass. It gets a Reader and says what the wire says: opens
// blocks, reads fields, looks ahead, narrows the limit. It never asks which pass it runs in.
//
// Two questions are kept apart. `live` says whether the grammar can still read: a field that does not fit
// clears it, later fields are skipped, and blocks close in the normal way. `outcome` says whether the run
// itself goes on. Once it is over, nothing has an effect any more, neither fields nor the closing of blocks,
// so that productions need no test for it: they run out.
//
// A Reader is a value. The hot road is inlined and keeps it in registers; `apart` runs a production out of
// line on a copy.
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <string_view>

#include "frame/field.h"
#include "frame/field_record.h"
#include "netfloor/host.h"
#include "netfloor/records.h"

namespace netfloor::plugin {

// What a production may find wrong. The pass decides whether it raises the mark.
enum class Flag : std::uint8_t {
    expectation,  // a fixed value was not met: all passes
    count,        // a list ended with another count than it should have: MV pass
    limitTooLong, // a length reaches behind the bits left: MV pass
    bitsLeftOver, // bits that no field covers inside a length: MV pass
};

// Whether the run goes on.
enum class Outcome : std::uint8_t {
    on,
    stopped, // at a hand-off, from which the host goes on by itself
    cutOff,  // storage ran out, or the host refused
};

// The name of a block: a literal, whose length is known where it is written.
struct BlockName {
    const char *text = nullptr;
    std::size_t size = 0;

    BlockName() = default;
    template <std::size_t octets>
    consteval BlockName(const char (&literal)[octets]) : text(literal), size(octets - 1) {}
    // The name of a value, which is a literal too.
    constexpr explicit BlockName(std::string_view literal) : text(literal.data()), size(literal.size()) {}

    // Copies the name and its terminating zero.
    NETFLOOR_INLINE void copyTo(char *buffer) const { std::memcpy(buffer, text, size + 1); }
};

// Writes a field that was read at `cursor` into the field record.
using RecordWriter = void (*)(FieldRecord &record, const std::uint8_t *data, std::uint32_t cursor, std::uint32_t units);

// Starts the record of a field whose elements are still to be read.
using RecordBeginning = void (*)(FieldRecord &record);

template <const Field &field>
void writeRecord(FieldRecord &record, const std::uint8_t *data, std::uint32_t cursor, std::uint32_t units) {
    beginRecord<field>(record);
    writeElements<field>(record, data, cursor, field.place.isRun() ? units : field.place.count);
}

// The passes that report nothing write the field record only where the host can look at it. Till then they
// keep what was read last.
struct LastRead {
    RecordWriter writer = nullptr; // of the last field; null: the record is up to date
    std::uint32_t cursor = 0;      // where that field lies
    std::uint32_t units = 0;       // of a run
    std::uint32_t seenPieces = 0;  // pieces of a look ahead behind that field; 0: there was none
    std::uint32_t seenFirst = 0;
    std::uint32_t seenWidth = 0;
};

// What a stretch of fields has left to be written behind it: only what its last field and last block leave can be seen.
struct Unsettled {
    RecordWriter writer = nullptr; // of the last field; null: there was none
    std::uint32_t cursor = 0;
    std::int32_t advance = 0;
    std::uint32_t blocks = 0; // on the stack behind the last push; 0: there was none
};

// Where a reader stands: what of it goes along when a production runs out of line.
struct Position {
    std::uint32_t cursor = 0;
    std::uint32_t left = 0;
    std::uint32_t blockDepth = 0;
    std::uint32_t limitDepth = 0;
    bool live = true;
    Outcome outcome = Outcome::on;
    bool unchecked = false; // a flag was set that the verdict has not taken in yet
    std::uint32_t bitOrder = 0;
    BlockName block = {}; // name of the innermost open block
    BlockName shown = {}; // the name that `blockName` is to hold, in the passes that report nothing
};

template <class Pass>
class Reader : public Position {
public:
    using Context = typename Pass::Context;

    Context *context;
    DecodeState *state;
    std::uint8_t *data;

    // What is known in a stretch (see stretch.h): constants where the compiler looks, and 0 outside.
    bool inStretch = false;
    std::uint32_t sureBits = 0;   // bits that are left, from an octet border on; the record has room for their elements
    std::uint32_t sureBlocks = 0; // blocks that there is room for
    Unsettled unsettled = {};

    NETFLOOR_INLINE explicit Reader(Context &passContext) : context(&passContext), state(passContext.decodeState) {
        takeState();
    }

    // Goes on where another reader stands, behind which all is settled.
    NETFLOOR_INLINE Reader(Context &passContext, const Position &position)
        : Position(position), context(&passContext), state(passContext.decodeState), data(state->data) {}

    NETFLOOR_INLINE static typename Pass::Variables &variables() { return Pass::variables; }

    // The last condition of the grammar, and the bits of its last step. They live in the state.
    [[nodiscard]] NETFLOOR_INLINE std::uint8_t &condition() {
        settle();
        return state->condition;
    }

    [[nodiscard]] NETFLOOR_INLINE std::int32_t &advance() {
        settle();
        return state->advance;
    }

    // Keeps a condition of the grammar as the last one, and gives it back.
    NETFLOOR_INLINE bool test(bool holds) {
        if (!ended()) {
            condition() = holds ? 1 : 0;
        }
        return holds;
    }

    NETFLOOR_INLINE static LastRead &last() { return Pass::last; }

    // Raises a mark, if the pass does.
    NETFLOOR_INLINE void raise(Flag flag) {
        if (ended() || !Pass::raises(flag)) {
            return;
        }
        state->flags |= flag == Flag::limitTooLong   ? NETFLOOR_FLAG_LIMIT_TOO_LONG
                        : flag == Flag::bitsLeftOver ? NETFLOOR_FLAG_BITS_LEFT_OVER
                                                     : NETFLOOR_FLAG_EXPECTATION;
        unchecked = true;
    }

    // The verdict check: a flag that is set becomes the verdict, in the pass that gives one.
    NETFLOOR_INLINE void check() {
        if (unchecked) {
            Pass::giveVerdict(*context);
            unchecked = false;
        }
    }

    [[nodiscard]] NETFLOOR_INLINE bool ended() const { return outcome != Outcome::on; }

    // Ends the run: nothing has an effect from here on.
    NETFLOOR_INLINE void end(Outcome how) {
        live = false;
        outcome = how;
    }

    // Takes over what the state says: at the entry, and behind a hand-off.
    NETFLOOR_INLINE void takeState() {
        data = state->data;
        cursor = state->cursor;
        left = state->bitsLeft;
        blockDepth = static_cast<std::uint32_t>(state->blockStarts.top - state->blockStarts.base);
        limitDepth = static_cast<std::uint32_t>(state->limits.top - state->limits.base);
        shown = {};
        last().writer = nullptr;
        last().seenPieces = 0;
        unchecked = state->flags != 0;
        forget();
    }

    // Writes what a stretch has put off.
    NETFLOOR_INLINE void settle() {
        if (Pass::reports || !inStretch) {
            return;
        }
        if (unsettled.writer != nullptr) {
            state->condition = 1;
            state->advance = unsettled.advance;
            last().writer = unsettled.writer;
            last().cursor = unsettled.cursor;
            last().seenPieces = 0;
        }
        if (unsettled.blocks != 0) {
            state->blockStarts.count = unsettled.blocks;
        }
        unsettled = {};
    }

    // Goes on where a production that ran out of line left off.
    NETFLOOR_INLINE void stand(const Position &position) {
        static_cast<Position &>(*this) = position;
        data = state->data;
        forget();
    }

    // What was sure is no longer: the reader comes from elsewhere, where all was settled.
    NETFLOOR_INLINE void forget() {
        inStretch = false;
        sureBits = 0;
        sureBlocks = 0;
        unsettled = {};
    }

    // Gives the state all that the reader holds: wherever the host can look.
    NETFLOOR_INLINE void giveState() {
        settle();
        writeLastRead();
        if (!Pass::reports && shown.text != nullptr) {
            shown.copyTo(state->blockName);
        }
        state->blockStarts.top = state->blockStarts.base + blockDepth;
        state->limits.top = state->limits.base + limitDepth;
        givePosition();
    }

    NETFLOOR_INLINE void givePosition() {
        state->cursor = cursor;
        state->bitsLeft = left;
    }

    // Brings the field record up to date: before the packet's working copy or the record changes.
    NETFLOOR_INLINE void writeLastRead() {
        if (Pass::reports) {
            return;
        }
        const LastRead &read = last();
        if (read.writer != nullptr) {
            read.writer(state->fieldRecord, data, read.cursor, read.units);
        }
        if (read.seenPieces != 0) {
            writeSeen(read.seenFirst, read.seenPieces, read.seenWidth);
        }
        last().writer = nullptr;
        last().seenPieces = 0;
    }

    // What a look ahead leaves in the field record: value and elements, under the name of the field before.
    NETFLOOR_INLINE std::uint32_t writeSeen(std::uint32_t first, std::uint32_t pieceCount, std::uint32_t width) {
        FieldRecord &record = state->fieldRecord;
        record.value = 0;
        for (std::uint32_t i = 0; i < pieceCount; ++i) {
            BitRange &range = record.ranges[i];
            range.firstBit = first + i * width;
            range.lastBit = range.firstBit + width - 1;
            range.value = bits(data, range.firstBit, range.lastBit);
            range.flagWord = 0;
            record.value = record.value << width | range.value;
        }
        record.rangeCount = pieceCount;
        return record.value;
    }

    // Names the innermost open block in `blockName`.
    NETFLOOR_INLINE void showBlock() {
        if (Pass::reports) {
            block.copyTo(state->blockName);
        } else {
            shown = block;
        }
    }

    // Opens the block that `block` names. False when the stack cannot grow.
    NETFLOOR_INLINE bool openBlock() {
        showBlock();
        if (sureBlocks != 0) {
            --sureBlocks;
            ++blockDepth;
            unsettled.blocks = blockDepth;
            state->blockStarts.base[blockDepth] = cursor;
        } else {
            settle();
            if (!push(state->blockStarts, blockDepth, cursor)) {
                return false;
            }
        }
        check();
        return true;
    }

    NETFLOOR_INLINE void closeBlock() {
        check();
        --blockDepth;
        if (Pass::reports) {
            --state->blockStarts.top;
        }
    }

    // Opens a limit of so many bits. False where it reaches behind the bits left, and so narrows nothing.
    NETFLOOR_INLINE bool narrow(std::uint32_t bitCount) {
        const bool narrows = bitCount <= left;
        settle();
        sureBits = 0;
        advance() = static_cast<std::int32_t>(bitCount);
        if (narrows) {
            left = bitCount;
        } else {
            raise(Flag::limitTooLong);
        }
        push(state->limits, limitDepth, cursor + left - 1);
        return narrows;
    }

    NETFLOOR_INLINE void popLimit() {
        --limitDepth;
        if (Pass::reports) {
            --state->limits.top;
        }
        left = state->limits.base[limitDepth] - cursor + 1;
    }

    // Skips what is left of the innermost limit.
    NETFLOOR_INLINE void skipRest() {
        if (left != 0) {
            cursor += left;
            left = 0;
            raise(Flag::bitsLeftOver);
        }
    }

    // Makes room for so many elements of a field whose record `begin` starts. False when the ranges cannot grow.
    NETFLOOR_INLINE bool roomFor(std::uint32_t elements, RecordBeginning begin) {
        if (elements < state->fieldRecord.rangeCapacity) [[likely]] {
            return true;
        }
        // Growth works on a copy, so that the reader itself can stay in registers.
        Reader copy = *this;
        if (!copy.growRanges(elements, begin)) {
            end(Outcome::cutOff);
            return false;
        }
        return true;
    }

private:
    NETFLOOR_INLINE bool push(BitStack &stack, std::uint32_t &depth, std::uint32_t bit) {
        ++depth;
        stack.count = depth;
        if (Pass::reports) {
            ++stack.top;
        }
        if (depth >= stack.capacity) [[unlikely]] {
            Reader copy = *this;
            if (!copy.growStack(stack)) {
                end(Outcome::cutOff);
                return false;
            }
        }
        stack.base[depth] = bit;
        return true;
    }

    [[gnu::cold, gnu::noinline]] bool growStack(BitStack &stack) {
        giveState();
        while (stack.count >= stack.capacity) {
            const std::uint32_t capacity = stack.capacity * 2;
            void *const grown = capacity == 0 ? nullptr : hs_Realloc(stack.base, capacity * sizeof *stack.base);
            if (grown == nullptr) {
                state->flags |= NETFLOOR_FLAG_NO_STACK;
                return false;
            }
            stack.base = static_cast<std::uint32_t *>(grown);
            stack.top = stack.base + stack.count;
            stack.capacity = capacity;
        }
        return true;
    }

    [[gnu::cold, gnu::noinline]] bool growRanges(std::uint32_t elements, RecordBeginning begin) {
        giveState();
        FieldRecord &record = state->fieldRecord;
        begin(record);
        void *const grown = hs_Realloc(record.ranges, elements * sizeof *record.ranges);
        if (grown == nullptr) {
            state->flags |= NETFLOOR_FLAG_NO_RANGES;
            return false;
        }
        record.ranges = static_cast<BitRange *>(grown);
        record.rangeCapacity = elements;
        return true;
    }
};

} // namespace netfloor::plugin
