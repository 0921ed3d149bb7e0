// SPDX-License-Identifier: MIT
// How what was read gets into the host's records. A pass that reports each field writes it at once. One that reports
// nothing puts it off: the host looks at its records only where it is called, and of all that was read before it then
// sees the last field, the last peek and the last block alone.
#pragma once

#include <algorithm>
#include <cstdint>
#include <string_view>

#include "frame/bits.h"
#include "frame/field.h"
#include "frame/field_record.h"
#include "frame/for_each.h"
#include "frame/inline.h"
#include "frame/position.h"
#include "netfloor/records.h"

namespace netfloor::plugin {

// Octets of one width that were looked at without being read.
struct Peek {
    std::uint32_t first = 0;  // bit
    std::uint32_t pieces = 0; // 0: there was none
    std::uint32_t width = 0;  // bits of a piece
};

// What a peek leaves in the field record: value and elements, under the name of the field before. Gives the value.
NETFLOOR_INLINE inline std::uint32_t writePeek(FieldRecord &record, const std::uint8_t *data, const Peek &peek) {
    record.value = 0;
    for (std::uint32_t i = 0; i < peek.pieces; ++i) {
        BitRange &range = record.ranges[i];
        range.firstBit = peek.first + i * peek.width;
        range.lastBit = range.firstBit + peek.width - 1;
        range.value = bits(data, range.firstBit, range.lastBit);
        range.flagWord = 0;
        record.value = record.value << peek.width | range.value;
    }
    record.rangeCount = peek.pieces;
    return record.value;
}

class ImmediateWriter {
public:
    static constexpr bool hasCheckedRuns = false;

    [[nodiscard]] NETFLOOR_INLINE static bool isInRun() { return false; }
    NETFLOOR_INLINE void reset() {}
    NETFLOOR_INLINE void endRun() {}
    NETFLOOR_INLINE void flushRun(DecodeState &) {}
    NETFLOOR_INLINE static void setCondition(DecodeState &state, bool holds) { state.condition = holds ? 1 : 0; }
    NETFLOOR_INLINE static void setAdvance(DecodeState &state, std::int32_t bitCount) { state.advance = bitCount; }
    NETFLOOR_INLINE static void raise(DecodeState &state, std::uint32_t flag) { state.flags |= flag; }
    NETFLOOR_INLINE void flush(const Position &, DecodeState &, const std::uint8_t *) {}
    NETFLOOR_INLINE static void flushFlagWords(FieldRecord &) {}

    NETFLOOR_INLINE void pushed(BitStack &stack) { ++stack.top; }
    NETFLOOR_INLINE void popped(BitStack &stack, std::uint32_t count) { stack.top -= count; }
    NETFLOOR_INLINE bool pushedBlockInRun(DecodeState &, std::uint32_t, std::uint32_t) { return false; }
    NETFLOOR_INLINE bool pushedLimitInRun(DecodeState &, std::uint32_t, std::uint32_t) { return false; }
    [[nodiscard]] NETFLOOR_INLINE static std::uint32_t blockRoom() { return 0; }
    NETFLOOR_INLINE void setBlockRoom(std::uint32_t) {}
    NETFLOOR_INLINE void poppedBlock() {}
    NETFLOOR_INLINE void poppedLimit() {}
    NETFLOOR_INLINE void checkBits(std::uint32_t) {}
    template <std::uint32_t>
    NETFLOOR_INLINE void clearInRun(FieldRecord &) {}
    NETFLOOR_INLINE void skipped(std::uint32_t) {}

    NETFLOOR_INLINE void nameBlock(Position &position, DecodeState &state) { position.block.copyTo(state.blockName); }

    template <const Field &field>
    NETFLOOR_INLINE void beginField(FieldRecord &record) {
        beginRecord(record, field.name);
    }

    template <const Field &field>
    NETFLOOR_INLINE void writeField(const Position &position, DecodeState &state, const std::uint8_t *data,
                                    std::uint32_t start, std::uint32_t units) {
        writeElements<field.place>(state.fieldRecord, data, start, units);
        state.fieldRecord.fieldId = field.id;
        state.cursor = position.cursor;
        state.bitsLeft = position.left;
    }

    NETFLOOR_INLINE std::uint32_t peek(FieldRecord &record, const std::uint8_t *data, const Peek &peek) {
        return writePeek(record, data, peek);
    }

    NETFLOOR_INLINE bool stepBackInRun(std::uint32_t) { return false; }
};

// What it takes to write a field into the record later on.
struct DeferredField {
    void (*writeElements)(FieldRecord &record, const std::uint8_t *data, std::uint32_t cursor, std::uint32_t units);
    std::string_view name;
    std::uint32_t id;
};

// A field that was read, and is still to be written.
struct FieldRead {
    const DeferredField *field = nullptr; // null: there is none
    std::uint32_t cursor = 0;             // where it lies
    std::uint32_t units = 0;              // of a run of octets or nibbles

    NETFLOOR_INLINE void writeElements(FieldRecord &record, const std::uint8_t *data) const {
        field->writeElements(record, data, cursor, units);
    }
};

// An address in groups writes only the values of its second to eighth element. Their other words are those of the
// fields before: of the last field, which has filled the first four, and of the last ones that have filled more.
inline constexpr std::uint32_t fewElements = 4;

// Where the elements of a field of octets or nibbles lie.
struct Elements {
    std::uint32_t cursor = 0; // 0: there was no such field
    std::uint32_t width = 0;
    std::uint32_t count = 0;

    // Writes what this field has left in the elements of an address.
    void write(BitRange *ranges) const {
        for (std::uint32_t i = fewElements; i < std::min(count, addressGroupCount); ++i) {
            ranges[i].firstBit = cursor + i * width;
            ranges[i].lastBit = ranges[i].firstBit + width - 1;
        }
    }
};

// What was read last, and what else of the fields before shows in the elements.
struct LastRead {
    FieldRead field; // none: the record is up to date
    Peek peek;       // after that field

    FieldRead before; // the field before an address in groups
    Elements wide;    // the last field that filled all the elements that an address has
    Elements medium;  // the last one that filled only some of those after the first four

    std::uint32_t cleared = 0; // so many elements' flag words are cleared; those after the first four are still to be
};

// Room on the two stacks that a checked run asks for once: as much as an IPv4 packet with TCP and a few rounds
// of options takes.
inline constexpr std::uint32_t runBlocks = 12;
inline constexpr std::uint32_t runLimits = 3;

// Puts off what the host cannot see yet. In a checked run (see checked_run.h) it puts off more: what is known there
// are constants where the compiler looks, and what has to be written after the run is kept in registers.
template <class Pass>
class DeferredWriter {
public:
    static constexpr bool hasCheckedRuns = true;

    // Starts a run at `octets` in the packet, whose stacks have the room of a run and whose record that of any field of
    // fixed size.
    NETFLOOR_INLINE void startRun(const std::uint8_t *octets) {
        inRun_ = true;
        octets_ = octets;
        offset_ = 0;
        blockRoom_ = runBlocks;
        limitRoom_ = runLimits;
        cleared_ = 0;
    }

    // So many bits from the cursor on were found to be left.
    NETFLOOR_INLINE void checkBits(std::uint32_t bitCount) { checkedBits_ = bitCount; }

    // Clears the flag words of so many elements, for fields of the run. What it has cleared stays clear.
    template <std::uint32_t elements>
    NETFLOOR_INLINE void clearInRun(FieldRecord &record) {
        forEach<std::min(elements, fewElements)>([&]<std::uint32_t i>() NETFLOOR_INLINE { clearInRun(record, i); });
        if constexpr (elements > fewElements) {
            last_.cleared = std::max(last_.cleared, elements);
        }
    }

    [[nodiscard]] NETFLOOR_INLINE bool isInRun() const { return inRun_; }
    [[nodiscard]] NETFLOOR_INLINE std::uint32_t checkedBits() const { return checkedBits_; }

    // The cursor of a run: the octets at its start, and a bit number in them. Compilers know the latter.
    [[nodiscard]] NETFLOOR_INLINE const std::uint8_t *octets() const { return octets_; }
    [[nodiscard]] NETFLOOR_INLINE std::uint32_t bit() const { return offset_ + 1; }

    // The cursor moved on without a field.
    NETFLOOR_INLINE void skipped(std::uint32_t bitCount) { offset_ += bitCount; }

    // Nothing is put off: the state is as the host left it.
    NETFLOOR_INLINE void reset() {
        last_.field.field = nullptr;
        last_.peek.pieces = 0;
        last_.wide.count = 0;
        last_.medium.count = 0;
        last_.cleared = 0;
        endRun();
    }

    // Nothing of the run is put off.
    NETFLOOR_INLINE void endRun() {
        inRun_ = false;
        checkedBits_ = 0;
        putOff_.clear();
    }

    NETFLOOR_INLINE void setCondition(DecodeState &state, bool holds) {
        if (!inRun_) {
            state.condition = holds ? 1 : 0;
            return;
        }
        putOff_.hasCondition = true;
        putOff_.condition = holds;
    }

    NETFLOOR_INLINE void setAdvance(DecodeState &state, std::int32_t bitCount) {
        if (!inRun_) {
            state.advance = bitCount;
            return;
        }
        putOff_.hasAdvance = true;
        putOff_.advance = bitCount;
    }

    NETFLOOR_INLINE void raise(DecodeState &state, std::uint32_t flag) {
        if (!inRun_) {
            state.flags |= flag;
            return;
        }
        putOff_.flags |= flag;
    }

    // Writes what the run has put off, or keeps it where it is kept outside of runs.
    NETFLOOR_INLINE void flushRun(DecodeState &state) {
        if (!inRun_) {
            return;
        }
        writeSteps(state);
        if (putOff_.field != nullptr) {
            last_.field.field = putOff_.field;
            last_.field.cursor = putOff_.cursor;
            last_.peek.pieces = 0;
        }
        putOff_.clear();
    }

    // Writes all that was put off: before the host looks at the state, and before the working copy changes.
    NETFLOOR_INLINE void flush(const Position &position, DecodeState &state, const std::uint8_t *data) {
        if (inRun_ && putOff_.field != nullptr) {
            // Compilers know this field, where those of last_ are any.
            writeSteps(state);
            const FieldRead field{.field = putOff_.field, .cursor = putOff_.cursor};
            writeRecord(state.fieldRecord, data, field, {});
            putOff_.clear();
        } else {
            flushRun(state);
            writeRecord(state.fieldRecord, data, last_.field, last_.peek);
        }
        last_.field.field = nullptr;
        last_.peek.pieces = 0;
        if (position.fieldBlock.text != nullptr) {
            position.fieldBlock.copyTo(state.blockName);
        }
    }

    NETFLOOR_INLINE void pushed(BitStack &) {}
    NETFLOOR_INLINE void popped(BitStack &, std::uint32_t) {}

    // Notes that the block at `depth` opened at `cursor`. False where the run has checked no room for it.
    NETFLOOR_INLINE bool pushedBlockInRun(DecodeState &state, std::uint32_t depth, std::uint32_t cursor) {
        if (!inRun_ || blockRoom_ == 0) {
            return false;
        }
        --blockRoom_;
        putOff_.hasBlocks = true;
        putOff_.blocks = depth;
        state.blockStarts.base[depth] = cursor;
        return true;
    }

    // The same for a limit.
    NETFLOOR_INLINE bool pushedLimitInRun(DecodeState &state, std::uint32_t depth, std::uint32_t lastBit) {
        if (!inRun_ || limitRoom_ == 0) {
            return false;
        }
        --limitRoom_;
        putOff_.hasLimits = true;
        putOff_.limits = depth;
        state.limits.base[depth] = lastBit;
        return true;
    }

    [[nodiscard]] NETFLOOR_INLINE std::uint32_t blockRoom() const { return blockRoom_; }
    NETFLOOR_INLINE void setBlockRoom(std::uint32_t blocks) { blockRoom_ = blocks; }
    NETFLOOR_INLINE void poppedBlock() { ++blockRoom_; }
    NETFLOOR_INLINE void poppedLimit() { ++limitRoom_; }

    NETFLOOR_INLINE void nameBlock(Position &position, DecodeState &) { position.fieldBlock = position.block; }

    template <const Field &field>
    NETFLOOR_INLINE void beginField(FieldRecord &) {}

    // Of an address in groups it writes at once what no other field writes, so that the next field does not hide it.
    template <const Field &field>
    NETFLOOR_INLINE void writeField(const Position &, DecodeState &state, const std::uint8_t *, std::uint32_t start,
                                    std::uint32_t units) {
        constexpr const Place &place = field.place;
        if constexpr (place.shape == Shape::groups) {
            last_.before = last_.field;
        }
        last_.field.field = &deferred<field>;
        last_.field.cursor = start;
        if constexpr (place.isRun()) {
            last_.field.units = units;
        }
        if constexpr (place.isRun() || place.shape == Shape::addressNibbles) {
            remember(start, place.elementBits(), place.elements(units));
        }
        if constexpr (place.clearsFlagWords() && !place.isRun()) {
            clearFlagWords<place.elements(place.count)>(state.fieldRecord);
        } else if constexpr (place.clearsFlagWords()) {
            for (std::uint32_t i = 0; i < units; ++i) {
                state.fieldRecord.ranges[i].flagWord = 0;
            }
        }
        writeWide<field>(state.fieldRecord);
        last_.peek.pieces = 0;
    }

    // The same for a field whose bits the run has checked.
    template <const Field &field>
    NETFLOOR_INLINE void writeFieldInRun(DecodeState &state, std::uint32_t start) {
        checkedBits_ -= field.place.advance;
        offset_ += field.place.advance;
        setCondition(state, true);
        setAdvance(state, static_cast<std::int32_t>(field.place.advance));
        putOff_.field = &deferred<field>;
        putOff_.cursor = start;
        if constexpr (field.place.shape == Shape::addressNibbles) {
            remember(start, nibbleBits, mostFixedElements);
        }
        writeWide<field>(state.fieldRecord);
    }

    NETFLOOR_INLINE std::uint32_t peek(FieldRecord &record, const std::uint8_t *data, const Peek &peek) {
        last_.peek = peek;
        for (std::uint32_t i = 0; i < peek.pieces; ++i) {
            record.ranges[i].flagWord = 0;
        }
        return peek.width == bitsPerOctet ? octetsAt(data, peek.first, peek.pieces)
                                          : bits(data, peek.first, peek.first + peek.width - 1);
    }

    // Clears the flag words of so many elements. The plug-in writes nothing else to them, so that the first need not be
    // put off. Those of an address take longer than the rest of its header, and few packets show them.
    template <std::uint32_t elements>
    NETFLOOR_INLINE static void clearFlagWords(FieldRecord &record) {
        forEach<std::min(elements, fewElements)>([&]<std::size_t i>()
                                                     NETFLOOR_INLINE { record.ranges[i].flagWord = 0; });
        if constexpr (elements > fewElements) {
            last_.cleared = std::max(last_.cleared, elements);
        }
    }

    // Clears what is still to be cleared, also what the record does not show: before a call after which the run reads
    // on, as a later field may show it.
    static void flushFlagWords(FieldRecord &record) {
        clearRemaining(record, last_.cleared);
        last_.cleared = 0;
    }

    // Moves back over an address that the run has just read: inside a run its bits are there. False elsewhere, where
    // the last advance is 0.
    NETFLOOR_INLINE bool stepBackInRun(std::uint32_t bitCount) {
        if (!inRun_ || putOff_.field == nullptr || putOff_.advance != static_cast<std::int32_t>(bitCount)) {
            return false;
        }
        putOff_.advance = -putOff_.advance;
        checkedBits_ += bitCount;
        offset_ -= bitCount;
        return true;
    }

private:
    // Clears the flag words that are still to be cleared, of the first `elements`.
    static void clearRemaining(FieldRecord &record, std::uint32_t elements) {
        for (std::uint32_t i = fewElements; i < std::min(elements, last_.cleared); ++i) {
            record.ranges[i].flagWord = 0;
        }
    }

    // Remembers a field with many elements.
    NETFLOOR_INLINE static void remember(std::uint32_t cursor, std::uint32_t width, std::uint32_t count) {
        if (count >= addressGroupCount) {
            last_.wide = {.cursor = cursor, .width = width, .count = count};
        } else if (count > fewElements) {
            last_.medium = {.cursor = cursor, .width = width, .count = count};
        }
    }

    // Writes what the fields before an address in groups have left in its elements, the older first.
    static void writeOlderElements(FieldRecord &record, const std::uint8_t *data) {
        if (last_.before.field != nullptr) {
            last_.before.writeElements(record, data);
        }
        last_.wide.write(record.ranges);
        if (last_.medium.cursor > last_.wide.cursor) {
            last_.medium.write(record.ranges);
        }
    }

    // In a run the nibbles of an address follow its groups, so that groups are the last field only outside of one.
    template <Place place>
    static void writeDeferred(FieldRecord &record, const std::uint8_t *data, std::uint32_t cursor,
                              std::uint32_t units) {
        if constexpr (place.shape == Shape::groups) {
            writeOlderElements(record, data);
        }
        writeElements<place>(record, data, cursor, place.isRun() ? units : place.count);
        if constexpr (!place.clearsFlagWords()) {
            clearRemaining(record, record.rangeCount);
        }
    }

    template <const Field &field>
    static constexpr DeferredField deferred{writeDeferred<field.place>, field.name, field.id};

    template <const Field &field>
    NETFLOOR_INLINE static void writeWide(FieldRecord &record) {
        if constexpr (field.place.shape == Shape::groups) {
            record.wideStart = 0;
            record.wideBits = field.place.width();
        }
    }

    NETFLOOR_INLINE void clearInRun(FieldRecord &record, std::uint32_t element) {
        if (element < cleared_) {
            return;
        }
        record.ranges[element].flagWord = 0;
        cleared_ = element + 1;
    }

    NETFLOOR_INLINE static void writeRecord(FieldRecord &record, const std::uint8_t *data, const FieldRead &field,
                                            const Peek &peek) {
        if (field.field != nullptr) {
            beginRecord(record, field.field->name);
            field.writeElements(record, data);
            record.fieldId = field.field->id;
        }
        if (peek.pieces != 0) {
            writePeek(record, data, peek);
        }
    }

    // What a run has put off.
    struct PutOff {
        const DeferredField *field = nullptr; // the last one; null: there was none
        std::uint32_t cursor = 0;             // where it lies
        bool hasCondition = false;
        bool condition = false;
        bool hasAdvance = false;
        std::int32_t advance = 0;
        bool hasBlocks = false;
        std::uint32_t blocks = 0; // on the stack after the last push
        bool hasLimits = false;
        std::uint32_t limits = 0;
        std::uint32_t flags = 0;

        // One by one: as a whole it would be memory.
        NETFLOOR_INLINE void clear() {
            field = nullptr;
            hasCondition = false;
            hasAdvance = false;
            hasBlocks = false;
            hasLimits = false;
            flags = 0;
        }
    };

    // Writes all but the field and the peek.
    NETFLOOR_INLINE void writeSteps(DecodeState &state) const {
        if (putOff_.hasCondition) {
            state.condition = putOff_.condition ? 1 : 0;
        }
        if (putOff_.hasAdvance) {
            state.advance = putOff_.advance;
        }
        if (putOff_.hasBlocks) {
            state.blockStarts.count = putOff_.blocks;
        }
        if (putOff_.hasLimits) {
            state.limits.count = putOff_.limits;
        }
        if (putOff_.flags != 0) {
            state.flags |= putOff_.flags;
        }
    }

    static inline constinit LastRead last_{};

    bool inRun_ = false;
    const std::uint8_t *octets_ = nullptr;
    std::uint32_t offset_ = 0;
    std::uint32_t checkedBits_ = 0;
    std::uint32_t blockRoom_ = 0;
    std::uint32_t limitRoom_ = 0;
    std::uint32_t cleared_ = 0; // so many elements' flag words
    PutOff putOff_ = {};
};

} // namespace netfloor::plugin
