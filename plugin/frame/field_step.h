// SPDX-License-Identifier: MIT
// The field step: how a field is read, stored and reported. And the look ahead, which does neither.
#pragma once

#include <cstdint>
#include <optional>
#include <type_traits>

#include "frame/field_list.h"
#include "frame/reader.h"

namespace netfloor::plugin {

// For a field that sets no variable.
struct Unstored {};

template <class Store>
NETFLOOR_INLINE inline void store(Store &into, std::uint32_t value) {
    if constexpr (std::is_pointer_v<Store>) {
        *into = static_cast<std::remove_pointer_t<Store>>(value);
    } else {
        into(value);
    }
}

template <const Field &field>
inline constexpr std::uint32_t neededBits = field.place.needs(field.place.count);

// Whether the bits of a field are there. A field that is not tested needs them in the packet only; where they
// are not all there it is not reported either, and clears the live flag like any other.
template <const Field &field, class Pass>
[[nodiscard]] NETFLOOR_INLINE inline bool fits(Reader<Pass> &reader, std::uint32_t units) {
    constexpr const Place &place = field.place;
    if constexpr (!place.isTested()) {
        return reader.cursor + neededBits<field> <= reader.state->totalBits + 1;
    }
    const std::uint32_t needs = place.isRun() ? place.needs(units) : neededBits<field>;
    reader.condition() = reader.left >= needs ? 1 : 0;
    return reader.left >= needs;
}

// Of an address in groups, what no other field writes in the record, so that it would be lost behind the next one.
template <const Field &field, class Pass>
NETFLOOR_INLINE inline void keepWide(Reader<Pass> &reader) {
    if constexpr (field.place.shape == Shape::groups) {
        reader.state->fieldRecord.wideStart = 0;
        reader.state->fieldRecord.wideBits = field.place.width();
    }
}

// The step of a field that a stretch has made sure of. What the host can see of it is put off.
template <const Field &field, class Pass, class Store>
NETFLOOR_INLINE inline void sureStep(Reader<Pass> &reader, Store into) {
    constexpr const Place &place = field.place;
    if (!onOctetBorder(reader.cursor)) {
        __builtin_unreachable(); // a stretch starts on one and moves in octets: the slow roads need no code here
    }
    reader.showBlock();
    const std::uint32_t start = reader.cursor;
    if constexpr (!std::is_same_v<Store, Unstored>) {
        store(into, valueAt<field>(reader.data, start, place.count));
    }
    reader.left -= place.advance;
    reader.cursor += place.advance;
    reader.sureBits -= place.advance;
    reader.unsettled.writer = writeRecord<field>;
    reader.unsettled.cursor = start;
    reader.unsettled.advance = static_cast<std::int32_t>(place.advance);
    keepWide<field>(reader);
    Pass::template output<field>(reader, start, place.count);
}

// Whether a stretch can make sure of a field: all of fixed size that move in whole octets and are part of it.
template <const Field &field>
inline constexpr bool canBeSure =
    !field.place.isRun() && field.place.shape != Shape::ahead && field.place.advance % bitsPerOctet == 0;

// The step of a field of `units` units; see `read` and `readRun`.
template <const Field &field, class Pass, class Store>
NETFLOOR_INLINE inline void step(Reader<Pass> &reader, std::uint32_t units, Store into) {
    static_assert(isListed<typename Pass::Fields, field>,
                  "this field is read and stands in no list: add it to the rows at the end of its protocol's file, and "
                  "those rows to tables/catalogue.h");
    static_assert(std::is_same_v<Store, Unstored> || hasStoredValue(field.place), "this field has no number to store");
    constexpr const Place &place = field.place;
    if (!reader.live) {
        return;
    }
    if constexpr (!Pass::reports && canBeSure<field>) {
        if (reader.sureBits >= neededBits<field>) {
            return sureStep<field>(reader, into);
        }
    }
    reader.settle();
    reader.sureBits = 0;
    if (!fits<field>(reader, units)) {
        reader.live = false;
        return;
    }
    const std::uint32_t moves = place.isRun() ? place.moves(units) : place.advance;
    reader.showBlock();
    if constexpr (Pass::reports) {
        beginRecord<field>(reader.state->fieldRecord);
    }
    if (!reader.roomFor(place.elements(units), beginRecord<field>)) {
        return;
    }
    const std::uint32_t start = reader.cursor;
    if constexpr (!std::is_same_v<Store, Unstored>) {
        store(into, valueAt<field>(reader.data, start, units));
    }
    reader.advance() = static_cast<std::int32_t>(moves);
    reader.left -= moves;
    reader.cursor += moves;
    if constexpr (Pass::reports) {
        const std::uint32_t value = writeElements<field>(reader.state->fieldRecord, reader.data, start, units);
        reader.givePosition();
        Pass::template output<field>(reader, value);
    } else {
        reader.last().writer = writeRecord<field>;
        reader.last().cursor = start;
        if constexpr (place.isRun()) {
            reader.last().units = units;
        }
        keepWide<field>(reader);
        reader.last().seenPieces = 0;
        Pass::template output<field>(reader, start, units);
    }
}

// Reads a field of fixed size. `into` takes its value: a pointer to a variable, or a function of the value.
// A field that does not fit clears the live flag and the condition, and changes nothing else.
template <const Field &field, class Pass, class Store = Unstored>
NETFLOOR_INLINE inline void read(Reader<Pass> &reader, Store into = {}) {
    static_assert(!field.place.isRun(), "a run needs its number of units");
    step<field>(reader, field.place.count, into);
}

// Reads a field of as many units (octets, nibbles) as the packet tells. The number counts as unsigned in the
// test of the bits left, so that a negative one does not fit.
template <const Field &field, class Pass>
NETFLOOR_INLINE inline void readRun(Reader<Pass> &reader, std::int32_t units) {
    static_assert(field.place.isRun(), "a field of fixed size has its number of units");
    step<field>(reader, static_cast<std::uint32_t>(units), Unstored{});
}

// Reads a field again and again, up to `count` times, as long as its bits are left. Gives how often it was read.
template <const Field &field, class Pass>
NETFLOOR_INLINE inline std::int32_t readRepeated(Reader<Pass> &reader, std::int32_t count) {
    std::int32_t seen = 0;
    while (reader.live && seen < count) {
        read<field>(reader);
        seen += reader.live ? 1 : 0;
    }
    return seen;
}

// Reads a field `count` times. Where it ends with another count, as bits ran out or the count is negative,
// that is marked.
template <const Field &field, class Pass>
NETFLOOR_INLINE inline void readCounted(Reader<Pass> &reader, std::int32_t count) {
    if (readRepeated<field>(reader, count) != count) {
        reader.raise(Flag::count);
    }
}

// A look ahead keeps the record of the field before.
inline void keepRecord(FieldRecord &) {}

// Looks at the bits of `place` without moving the cursor and without reporting anything; nothing where they
// are not all left or the run is over. The field record keeps what was seen, under the name of the field before.
template <class Pass>
NETFLOOR_INLINE inline std::optional<std::uint32_t> peek(Reader<Pass> &reader, const Place &place) {
    reader.settle();
    if (reader.ended() || reader.left < place.needs(place.count) || !reader.roomFor(place.count, keepRecord)) {
        return std::nullopt;
    }
    const bool whole = !place.isPieces();
    const std::uint32_t first = reader.cursor + (whole ? 0 : place.pieces[0].low);
    const std::uint32_t width = whole ? bitsPerOctet : place.pieces[0].width();
    if constexpr (Pass::reports) {
        return reader.writeSeen(first, place.count, width);
    }
    reader.last().seenFirst = first;
    reader.last().seenPieces = place.count;
    reader.last().seenWidth = width;
    return width == bitsPerOctet ? octetsAt(reader.data, first, place.count)
                                 : bits(reader.data, first, first + width - 1);
}

// Moves the cursor back over `bitCount` bits, so that they can be read a second time.
template <class Pass>
NETFLOOR_INLINE inline void stepBack(Reader<Pass> &reader, std::uint32_t bitCount) {
    if (reader.ended()) {
        return;
    }
    if (reader.unsettled.advance == static_cast<std::int32_t>(bitCount)) {
        // An address that a stretch has just read: outside of one the number is 0, and inside the bits are there.
        reader.unsettled.advance = -reader.unsettled.advance;
        reader.sureBits += bitCount;
        reader.cursor -= bitCount;
        reader.left += bitCount;
        return;
    }
    reader.settle();
    reader.sureBits = 0;
    reader.advance() = -static_cast<std::int32_t>(bitCount);
    if (!reader.live || reader.cursor < bitCount) {
        reader.live = false;
        return;
    }
    reader.cursor -= bitCount;
    reader.left += bitCount;
}

} // namespace netfloor::plugin
