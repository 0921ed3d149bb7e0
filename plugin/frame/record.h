// SPDX-License-Identifier: MIT
// Writes a field into the field record: its name, its elements and its value.
#pragma once

#include <cstdint>
#include <cstring>

#include "frame/bits.h"
#include "frame/field.h"
#include "netfloor/records.h"

namespace netfloor {

// The value of a field that lies at `cursor`, before it is scaled.
template <const Field& field>
[[nodiscard, gnu::always_inline]] inline std::uint32_t valueAt(const std::uint8_t* data, std::uint32_t cursor, std::uint32_t units) {
    constexpr const Place& place = field.place;
    std::uint32_t value = 0;
    if constexpr (place.isPieces()) {
        for (std::uint32_t i = 0; i < place.count; ++i) {
            constexpr auto pieces = place.pieces;
            const std::uint32_t element = bits(data, cursor + pieces[i].low, cursor + pieces[i].high);
            value = i == 0 ? element : value << pieces[i].width() | element;
        }
    } else if constexpr (place.shape == Shape::octets) {
        value = octetsAt(data, cursor, place.isRun() ? units : place.count);
    } else if constexpr (place.shape == Shape::octetsBackward) {
        for (std::uint32_t octet = units; octet-- > 0;) {
            value = value << bitsPerOctet | octetAt(data, cursor + octet * bitsPerOctet);
        }
    }
    return value;
}

// Writes the elements and the value of a field that lies at `cursor`. There is room for the elements.
template <const Field& field>
[[gnu::always_inline]] inline void writeElements(FieldRecord& record, const std::uint8_t* data, std::uint32_t cursor, std::uint32_t units) {
    constexpr const Place& place = field.place;
    BitRange* const ranges = record.ranges;
    std::uint32_t value = 0;
    const auto element = [&](std::uint32_t index, std::uint32_t first, std::uint32_t last) {
        ranges[index].firstBit = first;
        ranges[index].lastBit = last;
        return ranges[index].value = bits(data, first, last);
    };
    const auto octet = [&](std::uint32_t index, std::uint32_t first) {
        ranges[index].firstBit = first;
        ranges[index].lastBit = first + bitsPerOctet - 1;
        ranges[index].value = octetAt(data, first);
        value = value << bitsPerOctet | ranges[index].value;
    };
    std::uint32_t elements = place.elements(units);
    std::uint32_t outputElements = elements;

    if constexpr (place.shape == Shape::pieces) {
        constexpr auto pieces = place.pieces;
        for (std::uint32_t i = 0; i < place.count; ++i) {
            const std::uint32_t read = element(i, cursor + pieces[i].low, cursor + pieces[i].high);
            ranges[i].flagWord = 0;
            value = i == 0 ? read : value << pieces[i].width() | read;
        }
    } else if constexpr (place.shape == Shape::octets) {
        for (std::uint32_t i = 0; i < (place.isRun() ? units : place.count); ++i) {
            octet(i, cursor + i * bitsPerOctet);
        }
    } else if constexpr (place.shape == Shape::octetsBackward) {
        for (std::uint32_t i = 0; i < units; ++i) {
            octet(i, cursor + (units - 1 - i) * bitsPerOctet);
        }
    } else if constexpr (place.shape == Shape::groups) {
        // Only the values of the later groups are kept: the first element stands for the whole address.
        for (std::uint32_t group = 0; group < units; ++group) {
            std::uint32_t digits = 0;
            for (std::uint32_t nibble = 0; nibble < nibblesPerGroup; ++nibble) {
                const std::uint32_t first = cursor + group * groupBits + nibble * nibbleBits;
                digits = digits << nibbleBits | bits(data, first, first + nibbleBits - 1);
            }
            ranges[group].value = digits;
        }
        record.wideStart = 0;
        record.wideBits = units * groupBits;
        ranges[0].firstBit = cursor;
        ranges[0].lastBit = cursor + record.wideBits - 1;
        outputElements = 1;
    } else if constexpr (place.shape == Shape::reversedGroups) {
        for (std::uint32_t group = 0; group < units; ++group) {
            const std::uint32_t first = cursor + group * groupBits;
            const std::uint32_t last = first + groupBits - 1;
            ranges[group].firstBit = first;
            ranges[group].lastBit = last;
            ranges[group].value = bits(data, last, first);
            value = value << groupBits | ranges[group].value;
        }
    } else if constexpr (place.shape == Shape::nibbles || place.shape == Shape::addressNibbles) {
        for (std::uint32_t i = 0; i < elements; ++i) {
            const std::uint32_t first = cursor + i * nibbleBits;
            value = value << nibbleBits | element(i, first, first + nibbleBits - 1);
        }
    } else {
        constexpr Piece piece = place.pieces[0];
        value = bits(data, cursor + piece.low, cursor + piece.high);
        elements = 0;
        outputElements = 0;
    }
    record.value = value * place.scale;
    record.rangeCount = elements;
    record.outputRangeCount = outputElements;
}

// Resets the record for a field and gives it the field's name.
template <const Field& field> [[gnu::always_inline]] inline void beginRecord(FieldRecord& record) {
    record.value = 0;
    record.rangeCount = 0;
    record.valueText[0] = '\0';
    record.rawFlag = 0;
    // A name is a literal, so its terminating zero goes along.
    std::memcpy(record.fieldName, field.name.data(), field.name.size() + 1);
}

} // namespace netfloor
