// SPDX-License-Identifier: MIT
// The published layouts: where the bits of a field lie, in the code that netfloor/descriptors.h describes. Fields of
// one layout share a record; the records have the order of first use.
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>

#include "tables/catalogue.h"

namespace netfloor::plugin {

// The octets of one record, its length word included.
struct LayoutRecord {
    std::array<std::uint8_t, 96> octets{};
    std::size_t size = 2;

    constexpr void add(std::initializer_list<unsigned> values) {
        for (const unsigned value : values) {
            octets[size++] = static_cast<std::uint8_t>(value);
        }
    }

    constexpr void addConstant(std::uint32_t value) { add({0x10, 0, 0, 0, value}); }

    constexpr void addRange(std::uint32_t from, std::uint32_t to) {
        add({0x05});
        addConstant(from);
        addConstant(to);
    }

    // A piece from bit `from` to bit `to`, counted from 1.
    constexpr void addPiece(std::uint32_t from, std::uint32_t to) {
        if (from == to) {
            addConstant(from);
        } else {
            addRange(from, to);
        }
    }

    constexpr void addReference(std::uint32_t number) { add({0x08, number, 0}); }

    constexpr void finish() {
        const std::size_t length = size - 2;
        octets[0] = static_cast<std::uint8_t>(length);
        octets[1] = static_cast<std::uint8_t>(length >> 8);
    }

    [[nodiscard]] constexpr bool sameAs(const std::uint8_t *other) const {
        for (std::size_t i = 0; i < size; ++i) {
            if (octets[i] != other[i]) {
                return false;
            }
        }
        return true;
    }
};

inline constexpr std::uint32_t countByPacket = 0;  // reference in the place of the count
inline constexpr std::uint32_t fixedLength = 0;    // reference at the end
inline constexpr std::uint32_t variableLength = 1; // reference at the end

// A field that is peeked, or read by groups that no piece describes, has no layout.
[[nodiscard]] constexpr bool hasLayout(const Place &place) {
    return place.shape != Shape::ahead && place.shape != Shape::groups;
}

// The pieces of a field, and how often they repeat. Nibbles that are repeated in the next octet are listed once.
[[nodiscard]] constexpr std::uint32_t distinctPieces(const Place &place) {
    const bool repeats = place.count == 4 && place.pieces[2].low == place.pieces[0].low + bitsPerOctet &&
                         place.pieces[3].low == place.pieces[1].low + bitsPerOctet;
    return repeats ? 2 : place.count;
}

// Two whole octets are listed with the second one first, although the passes read the first one first.
[[nodiscard]] constexpr bool isOctetPair(const Place &place) {
    return place.count == 2 && place.pieces[0].width() == bitsPerOctet && place.pieces[1].width() == bitsPerOctet;
}

// The pieces of one unit.
constexpr void addPieces(LayoutRecord &record, const Place &place) {
    switch (place.shape) {
    case Shape::pieces: {
        const std::uint32_t count = distinctPieces(place);
        record.add({count});
        for (std::uint32_t i = 0; i < count; ++i) {
            const Piece &piece = place.pieces[isOctetPair(place) ? count - 1 - i : i];
            record.addPiece(piece.low + 1, piece.high + 1);
        }
        return;
    }
    case Shape::addressNibbles:
        record.add({nibblesPerGroup});
        for (std::uint32_t nibble = 0; nibble < nibblesPerGroup; ++nibble) {
            record.addPiece(nibble * nibbleBits + 1, (nibble + 1) * nibbleBits);
        }
        return;
    case Shape::reversedGroups:
        record.add({1});
        record.addPiece(groupBits, 1);
        return;
    default: record.add({1}); record.addPiece(1, place.unitBits());
    }
}

// How often the pieces of a fixed field repeat, and the bits from one repeat to the next. The step of
// ipv6::payloadLengthAhead is that of octets too, although it does not move the cursor: it shares the record of "Total
// Length". From the tables alone, the field after it seems to start two octets later than it does.
[[nodiscard]] constexpr std::uint32_t repeats(const Place &place) {
    return place.shape == Shape::pieces ? place.count / distinctPieces(place) : place.count;
}

[[nodiscard]] constexpr std::uint32_t stepBits(const Place &place) {
    return place.shape == Shape::pieces ? place.advance / repeats(place) : place.unitBits();
}

[[nodiscard]] constexpr LayoutRecord layoutOf(const Place &place) {
    LayoutRecord record;
    if (!hasLayout(place)) {
        record.add({0xff, 0x00, 0x00});
        record.finish();
        return record;
    }
    record.add({0xff, 0x02, 0x55, 0x01, 0x04});
    addPieces(record, place);
    const bool byPacket = (place.isRun() && place.mostUnits == 0) || place.shape == Shape::addressNibbles;
    if (byPacket) {
        record.addReference(countByPacket);
    } else if (place.isRun()) {
        record.addRange(1, place.mostUnits);
    } else {
        record.addConstant(repeats(place));
    }
    record.addConstant(stepBits(place));
    record.addReference(byPacket ? variableLength : fixedLength);
    record.finish();
    return record;
}

// All records, and where the record of each field starts.
struct LayoutTable {
    std::array<std::uint8_t, 4096> octets{};
    std::array<std::uint32_t, catalogue.size()> offsets{};
    std::size_t size = 0;
    std::size_t records = 0;
};

inline constexpr LayoutTable layoutTable = [] {
    LayoutTable table;
    for (std::size_t i = 0; i < catalogue.size(); ++i) {
        const LayoutRecord record = layoutOf(catalogue[i]->place);
        std::size_t at = 0;
        while (at < table.size && !record.sameAs(&table.octets[at])) {
            at += 2u + table.octets[at]; // the low octet of its length, which is below 256
        }
        table.offsets[i] = static_cast<std::uint32_t>(at);
        if (at == table.size) {
            for (std::size_t octet = 0; octet < record.size; ++octet) {
                table.octets[table.size++] = record.octets[octet];
            }
            ++table.records;
        }
    }
    return table;
}();

} // namespace netfloor::plugin
