// SPDX-License-Identifier: MIT
// Where the bits of a field lie, relative to the cursor, and how far the cursor moves after it.
//
// Bit 0 is the cursor's bit. On an octet border the bits 0 to 3 are the low nibble of the first octet,
// 4 to 7 its high nibble, 8 to 15 the second octet.
#pragma once

#include <algorithm>
#include <array>
#include <cstdint>

#include "frame/bits.h"

namespace netfloor::plugin {

enum class Shape : std::uint8_t {
    pieces,         // one to four pieces, in the order in which they make the value
    octets,         // whole octets in network order, one element each
    octetsBackward, // whole octets from the last to the first, one element each
    groups,         // an address as eight 16-bit groups, shown but not kept as elements
    addressNibbles, // an address nibble by nibble, four elements a group: what the key record keeps
    reversedGroups, // an address as eight 16-bit groups of octets read with their bits reversed
    nibbles,        // a run of nibbles, one element each
    ahead,          // one piece that is shown ahead of its turn and keeps no element
};

// Bits `low` to `high` after the cursor.
struct Piece {
    std::uint32_t low;
    std::uint32_t high;

    [[nodiscard]] constexpr std::uint32_t width() const { return high - low + 1; }
};

inline constexpr std::uint32_t addressGroupCount = 8;
inline constexpr std::uint32_t groupBits = 16;
inline constexpr std::uint32_t nibbleBits = 4;
inline constexpr std::uint32_t nibblesPerGroup = groupBits / nibbleBits;
inline constexpr std::uint32_t addressBits = addressGroupCount * groupBits;

// The most elements of a field of fixed size.
inline constexpr std::uint32_t mostFixedElements = addressGroupCount * nibblesPerGroup;

// The most pieces of a field.
inline constexpr std::uint32_t mostPieces = 4;

struct Place {
    Shape shape;
    std::uint32_t count;                       // pieces or units (octets, groups, nibbles); 0: told by the packet
    std::array<Piece, mostPieces> pieces = {}; // of `pieces` and `ahead`
    std::uint32_t advance = 0;                 // bits that the cursor moves on; for a run: bits for each unit
    std::uint32_t scale = 1;                   // the value is shown and stored multiplied by this
    std::uint32_t mostUnits = 0;               // of a run: the most units that are taken; 0: no bound

    [[nodiscard]] constexpr bool isRun() const { return count == 0; }

    [[nodiscard]] constexpr bool isPieces() const { return shape == Shape::pieces || shape == Shape::ahead; }

    // Elements that the field fills.
    [[nodiscard]] constexpr std::uint32_t elements(std::uint32_t units) const {
        switch (shape) {
        case Shape::addressNibbles: return units * nibblesPerGroup;
        case Shape::ahead: return 0;
        default: return units;
        }
    }

    // True where a field is read only when its bits are left. An address in groups and what is shown ahead
    // are read without that test, also past the limit, as far as the packet reaches.
    [[nodiscard]] constexpr bool isTested() const { return shape != Shape::groups && shape != Shape::ahead; }

    // Bits that must be left for a field of so many units; for one that is not tested, left in the packet.
    [[nodiscard]] NETFLOOR_INLINE constexpr std::uint32_t needs(std::uint32_t units) const {
        if (!isPieces()) {
            return units * unitBits();
        }
        std::uint32_t end = advance;
        for (std::uint32_t i = 0; i < count; ++i) {
            end = std::max(end, pieces[i].high + 1);
        }
        return end;
    }

    // Bits that the cursor moves on after a field of so many units.
    [[nodiscard]] constexpr std::uint32_t moves(std::uint32_t units) const {
        return isRun() ? units * advance : advance;
    }

    // Bits of one unit of a field made of units.
    [[nodiscard]] constexpr std::uint32_t unitBits() const {
        switch (shape) {
        case Shape::octets:
        case Shape::octetsBackward: return bitsPerOctet;
        case Shape::nibbles: return nibbleBits;
        default: return groupBits;
        }
    }

    // The most bits of one element.
    [[nodiscard]] constexpr std::uint32_t elementBits() const {
        if (!isPieces()) {
            return shape == Shape::addressNibbles ? nibbleBits : unitBits();
        }
        std::uint32_t most = 0;
        for (std::uint32_t i = 0; i < count; ++i) {
            most = std::max(most, pieces[i].width());
        }
        return most;
    }

    // Whether the field clears the flag words of the elements that it fills: all do but rows of octets and addresses in
    // groups, which leave them. A single octet is a piece, not a row.
    [[nodiscard]] constexpr bool clearsFlagWords() const {
        switch (shape) {
        case Shape::octets: return count == 1;
        case Shape::octetsBackward:
        case Shape::groups: return false;
        default: return true;
        }
    }

    // The bits of the field's value, without the gaps between its pieces; 0 for a run.
    [[nodiscard]] constexpr std::uint32_t width() const {
        if (!isPieces()) {
            return count * unitBits();
        }
        std::uint32_t sum = 0;
        for (std::uint32_t i = 0; i < count; ++i) {
            sum += pieces[i].width();
        }
        return sum;
    }

    // The same place with another move of the cursor after it.
    [[nodiscard]] constexpr Place advancing(std::uint32_t bitCount) const {
        Place place = *this;
        place.advance = bitCount;
        return place;
    }

    // The same place, its value shown and stored multiplied by `factor`.
    [[nodiscard]] constexpr Place times(std::uint32_t factor) const {
        Place place = *this;
        place.scale = factor;
        return place;
    }

    // The same run, of at most `units` units.
    [[nodiscard]] constexpr Place atMost(std::uint32_t units) const {
        Place place = *this;
        place.mostUnits = units;
        return place;
    }
};

// One piece, without a move of the cursor: a later field reads on from the same octet.
constexpr Place piece(std::uint32_t low, std::uint32_t high) {
    return {.shape = Shape::pieces, .count = 1, .pieces = {Piece{low, high}}};
}

// One bit.
constexpr Place bit(std::uint32_t low) {
    return piece(low, low);
}

// Several pieces, the first the most significant, without a move of the cursor.
constexpr Place pieces(Piece first, Piece second) {
    return {.shape = Shape::pieces, .count = 2, .pieces = {first, second}};
}

constexpr Place pieces(Piece first, Piece second, Piece third) {
    return {.shape = Shape::pieces, .count = 3, .pieces = {first, second, third}};
}

constexpr Place pieces(Piece first, Piece second, Piece third, Piece fourth) {
    return {.shape = Shape::pieces, .count = 4, .pieces = {first, second, third, fourth}};
}

// Two octets in network order, as two pieces. The value is that of octets(2), but the published layout is another, and
// decides which of the two a field is.
constexpr Place octetPair() {
    return pieces({0, 7}, {8, 15}).advancing(16);
}

// `count` octets in network order.
constexpr Place octets(std::uint32_t count) {
    return {.shape = Shape::octets, .count = count, .advance = count * bitsPerOctet};
}

// `count` octets, read from the last to the first: the value is the little-endian one.
constexpr Place octetsBackward(std::uint32_t count) {
    return {.shape = Shape::octetsBackward, .count = count, .advance = count * bitsPerOctet};
}

// As many octets as the packet tells, in network order or from the last to the first.
constexpr Place octetRun() {
    return {.shape = Shape::octets, .count = 0, .advance = bitsPerOctet};
}

constexpr Place octetRunBackward() {
    return {.shape = Shape::octetsBackward, .count = 0, .advance = bitsPerOctet};
}

// As many nibbles as the packet tells, the low nibble of each octet first.
constexpr Place nibbleRun() {
    return {.shape = Shape::nibbles, .count = 0, .advance = nibbleBits};
}

// An IPv6 address: for the eye, for the key record, and with reversed bits.
constexpr Place addressGroups() {
    return {.shape = Shape::groups, .count = addressGroupCount, .advance = addressBits};
}

constexpr Place addressNibbles() {
    return {.shape = Shape::addressNibbles, .count = addressGroupCount, .advance = addressBits};
}

constexpr Place addressReversed() {
    return {.shape = Shape::reversedGroups, .count = addressGroupCount, .advance = addressBits};
}

// One piece that is shown ahead of its turn: reported without elements, and read again by a later field.
constexpr Place ahead(std::uint32_t low, std::uint32_t high) {
    return {.shape = Shape::ahead, .count = 1, .pieces = {Piece{low, high}}};
}

} // namespace netfloor::plugin
