// SPDX-License-Identifier: MIT
// The field step: how a field is read, stored and reported. And the peek, which does neither.
#pragma once

#include <algorithm>
#include <cstdint>
#include <optional>
#include <type_traits>

#include "frame/bit_order.h"
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

// Whether the bits of a field are there, which the condition then tells. A field that is not tested needs them in the
// packet only, and leaves the condition; where they are not all there it does not fit, like any other.
template <const Field &field, class Pass>
[[nodiscard]] NETFLOOR_INLINE inline bool fits(Reader<Pass> &reader, std::uint32_t units) {
    constexpr const Place &place = field.place;
    if constexpr (!place.isTested()) {
        const bool inPacket = reader.cursor + neededBits<field> <= reader.state->totalBits + 1;
        if (!inPacket) {
            reader.setCondition(false);
        }
        return inPacket;
    }
    const std::uint32_t needs = place.isRun() ? place.needs(units) : neededBits<field>;
    reader.setCondition(reader.left >= needs);
    return reader.left >= needs;
}

// The value of a field where a variable or the pass takes it. It is read once: for compilers, what is stored in between
// may change the packet.
template <const Field &field, class Pass, class Store>
[[nodiscard]] NETFLOOR_INLINE inline std::uint32_t valueFor(const std::uint8_t *data, std::uint32_t start,
                                                            std::uint32_t units) {
    if constexpr (!std::is_same_v<Store, Unstored> || Pass::template takesValue<field>) {
        return valueAt<field.place>(data, start, units);
    }
    return 0;
}

// The step of a field whose bits a checked run has found to be left.
template <const Field &field, class Pass, class Store>
NETFLOOR_INLINE inline void stepInRun(Reader<Pass> &reader, Store into) {
    constexpr const Place &place = field.place;
    reader.writer.nameBlock(reader, *reader.state);
    const std::uint32_t start = reader.cursor;
    const std::uint32_t bit = reader.writer.bit();
    if (!onOctetBorder(bit)) {
        __builtin_unreachable(); // a run starts on one and moves in octets: reading across octets needs no code here
    }
    const std::uint32_t value = valueFor<field, Pass, Store>(reader.writer.octets(), bit, place.count);
    if constexpr (!std::is_same_v<Store, Unstored>) {
        store(into, value);
    }
    reader.left -= place.advance;
    reader.cursor += place.advance;
    reader.writer.template writeFieldInRun<field>(*reader.state, start);
    Pass::template output<field>(reader, reader.writer.octets(), bit, value);
}

// Whether a field can be part of a checked run: all of fixed size that move in whole octets.
template <const Field &field>
inline constexpr bool canBeInRun =
    !field.place.isRun() && field.place.shape != Shape::ahead && field.place.advance % bitsPerOctet == 0;

// The number of units of a field of fixed size.
template <const Field &field>
inline constexpr std::uint32_t fixedUnits = [] {
    static_assert(!field.place.isRun(), "a run needs its number of units: read it by readRun");
    return field.place.count;
}();

// Reads a field. `into` takes its value: a pointer to a variable, or a function of the value.
// A field that does not fit clears the live flag and the condition, and changes nothing else.
template <const Field &field, class Pass, class Store = Unstored>
NETFLOOR_INLINE inline void read(Reader<Pass> &reader, Store into = {}, std::uint32_t units = fixedUnits<field>) {
    static_assert(isListed<typename Pass::Fields, field>,
                  "this field is read and stands in no list: add it to the rows at the end of its protocol's file, and "
                  "those rows to tables/catalogue.h");
    static_assert(std::is_same_v<Store, Unstored> || hasStoredValue(field.place), "this field has no number to store");
    constexpr const Place &place = field.place;
    if (!reader.live) {
        return;
    }
    if constexpr (Pass::Writer::hasCheckedRuns && canBeInRun<field>) {
        if (reader.writer.checkedBits() >= neededBits<field>) {
            return stepInRun<field>(reader, into);
        }
    }
    reader.leaveRun();
    if (!fits<field>(reader, units)) {
        reader.live = false;
        return;
    }
    const std::uint32_t moves = place.isRun() ? place.moves(units) : place.advance;
    reader.writer.nameBlock(reader, *reader.state);
    reader.writer.template beginField<field>(reader.state->fieldRecord);
    if constexpr (place.shape == Shape::groups) {
        if (!reader.roomForGroups(field.name)) {
            return;
        }
    } else if (!reader.roomFor(place.elements(units), field.name.data())) {
        return;
    }
    const std::uint32_t start = reader.cursor;
    const std::uint32_t value = valueFor<field, Pass, Store>(reader.data, start, units);
    if constexpr (!std::is_same_v<Store, Unstored>) {
        store(into, value);
    }
    reader.setAdvance(static_cast<std::int32_t>(moves));
    reader.left -= moves;
    reader.cursor += moves;
    reader.writer.template writeField<field>(reader, *reader.state, reader.data, start, units);
    if constexpr (place.shape == Shape::reversedGroups) {
        finishReversedAddress(reader, start);
    }
    Pass::template output<field>(reader, reader.data, start, value);
}

// Reads a field of as many units (octets, nibbles) as the packet tells. The number counts as unsigned in the
// test of the bits left, so that a negative one does not fit.
template <const Field &field, class Pass>
NETFLOOR_INLINE inline void readRun(Reader<Pass> &reader, std::int32_t units) {
    static_assert(field.place.isRun(), "a field of fixed size has its number of units");
    read<field>(reader, Unstored{}, static_cast<std::uint32_t>(units));
}

// Goes over up to `most` fields of one declaration that no host can see: where the host is not called for each field,
// it sees the last one alone, and so does the key record. Gives how many they were. The last one that fits is left.
template <const Field &field, class Pass>
[[nodiscard]] NETFLOOR_INLINE inline std::int32_t skipUnseen(Reader<Pass> &reader, std::int32_t most) {
    constexpr std::uint32_t bitCount = neededBits<field>;
    static_assert(field.place.isTested() && bitCount == field.place.advance, "these fields must follow one another");
    const bool callsHost = Pass::reportsFields || reader.state->fieldRecord.rangeCapacity <= mostFixedElements;
    if (callsHost || most < 2 || reader.left < 2 * bitCount) {
        return 0;
    }
    reader.leaveRun();
    const std::uint32_t skipped = std::min(static_cast<std::uint32_t>(most), reader.left / bitCount) - 1;
    reader.cursor += skipped * bitCount;
    reader.left -= skipped * bitCount;
    return static_cast<std::int32_t>(skipped);
}

// Reads a field again and again, up to `count` times, as long as its bits are left. Gives how often it was read.
template <const Field &field, class Pass>
NETFLOOR_INLINE inline std::int32_t readRepeated(Reader<Pass> &reader, std::int32_t count) {
    std::int32_t seen = 0;
    while (reader.live && seen < count) {
        seen += skipUnseen<field>(reader, count - seen);
        read<field>(reader);
        seen += reader.live ? 1 : 0;
    }
    return seen;
}

// Reads a field `count` times. Where it ends with another count, as bits ran out or the count is negative,
// a flag says so.
template <const Field &field, class Pass>
NETFLOOR_INLINE inline void readCounted(Reader<Pass> &reader, std::int32_t count) {
    if (readRepeated<field>(reader, count) != count) {
        reader.raise(Flag::count);
    }
}

// Gives the bits of `place` without moving the cursor and without reporting anything; nothing where they
// are not all left or the run has ended. The field record keeps what was seen, under the name of the field before.
template <class Pass>
NETFLOOR_INLINE inline std::optional<std::uint32_t> peek(Reader<Pass> &reader, const Place &place) {
    if (reader.ended() || reader.left < place.needs(place.count)) {
        return std::nullopt;
    }
    reader.leaveRun();
    if (!reader.roomFor(place.count, nullptr)) {
        return std::nullopt;
    }
    const bool whole = !place.isPieces();
    const std::uint32_t low = whole ? 0 : place.pieces[0].low;
    const Peek found = {
        .first = reader.cursor + low,
        .pieces = place.count,
        .width = whole ? bitsPerOctet : place.pieces[0].width(),
    };
    return reader.writer.peek(reader.state->fieldRecord, reader.data, found);
}

// Moves the cursor back over `bitCount` bits, so that they can be read a second time.
template <class Pass>
NETFLOOR_INLINE inline void stepBack(Reader<Pass> &reader, std::uint32_t bitCount) {
    if (reader.ended()) {
        return;
    }
    if (!reader.writer.stepBackInRun(bitCount)) {
        reader.leaveRun();
        reader.setAdvance(-static_cast<std::int32_t>(bitCount));
        if (!reader.live || reader.cursor < bitCount) {
            reader.live = false;
            return;
        }
    }
    reader.cursor -= bitCount;
    reader.left += bitCount;
}

} // namespace netfloor::plugin
