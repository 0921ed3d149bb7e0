// SPDX-License-Identifier: MIT
// Writes a field into the field record: its name, its elements and its value.
#pragma once

#include <cstdint>
#include <cstring>
#include <string_view>

#include "frame/bits.h"
#include "frame/field.h"
#include "frame/for_each.h"
#include "netfloor/records.h"

namespace netfloor::plugin {

// A value with a further piece of so many bits after it.
[[nodiscard]] NETFLOOR_INLINE constexpr std::uint32_t joined(std::uint32_t value, std::uint32_t piece,
                                                             std::uint32_t width) {
    return width == 32 ? piece : value << width | piece;
}

// Whether a field has a number that a variable can take: an address and a run of nibbles have none.
[[nodiscard]] constexpr bool hasStoredValue(const Place &place) {
    return place.isPieces() || place.shape == Shape::octets || place.shape == Shape::octetsBackward;
}

// Whether a field is a known number of octets from its start on, in network order, be they pieces or not.
[[nodiscard]] constexpr bool isOctetsInOrder(const Place &place) {
    if (!place.isPieces()) {
        return place.shape == Shape::octets && !place.isRun();
    }
    for (std::uint32_t i = 0; i < place.count; ++i) {
        if (place.pieces[i].low != i * bitsPerOctet || place.pieces[i].width() != bitsPerOctet) {
            return false;
        }
    }
    return true;
}

// The value of a field at `place`, counted from `cursor`, before it is scaled. Fields of one place share it.
template <Place place>
[[nodiscard]] NETFLOOR_INLINE inline std::uint32_t valueAt(const std::uint8_t *data, std::uint32_t cursor,
                                                           std::uint32_t units) {
    std::uint32_t value = 0;
    if constexpr (isOctetsInOrder(place)) {
        value = octetsAt<place.count>(data, cursor);
    } else if constexpr (place.isPieces()) {
        forEach<place.count>([&]<std::uint32_t i>() NETFLOOR_INLINE {
            constexpr Piece piece = place.pieces[i];
            value = joined(value, pieceAt<piece.low, piece.high>(data, cursor), piece.width());
        });
    } else if constexpr (place.shape == Shape::octets) {
        value = octetsAt(data, cursor, units);
    } else if constexpr (place.shape == Shape::octetsBackward) {
        for (std::uint32_t octet = units; octet-- > 0;) {
            value = value << bitsPerOctet | octetAt(data, cursor + octet * bitsPerOctet);
        }
    }
    return value;
}

// One group of an address, as it is shown: each octet with its low nibble first.
[[nodiscard]] NETFLOOR_INLINE inline std::uint32_t groupAt(const std::uint8_t *data, std::uint32_t first) {
    const std::uint32_t octets = octetsAt<2>(data, first);
    return (octets & 0x0f0f) << nibbleBits | (octets >> nibbleBits & 0x0f0f);
}

// An address as it is shown. The first element stands for the whole address. Of the others only the values are written:
// their other words stay as the fields before have left them.
inline void writeGroups(FieldRecord &record, const std::uint8_t *data, std::uint32_t cursor, std::uint32_t groups) {
    for (std::uint32_t group = 0; group < groups; ++group) {
        record.ranges[group].value = groupAt(data, cursor + group * groupBits);
    }
    record.wideStart = 0;
    record.wideBits = groups * groupBits;
    record.ranges[0].firstBit = cursor;
    record.ranges[0].lastBit = cursor + record.wideBits - 1;
}

// An address that is read with the bits of each octet reversed, twice over: its groups are those of the octets as they
// are in the packet. Gives the value, of which the last two groups stay.
[[nodiscard]] inline std::uint32_t writeReversedGroups(BitRange *ranges, const std::uint8_t *data, std::uint32_t cursor,
                                                       std::uint32_t groups) {
    std::uint32_t value = 0;
    for (std::uint32_t group = 0; group < groups; ++group) {
        const std::uint32_t first = cursor + group * groupBits;
        ranges[group].firstBit = first;
        ranges[group].lastBit = first + groupBits - 1;
        ranges[group].value = octetsAt<2>(data, first);
        ranges[group].flagWord = 0;
        value = value << groupBits | ranges[group].value;
    }
    return value;
}

// Writes the elements and the value of a field at `place`, counted from `cursor`. There is room for the elements.
template <Place place>
NETFLOOR_INLINE inline void writeElements(FieldRecord &record, const std::uint8_t *data, std::uint32_t cursor,
                                          std::uint32_t units) {
    BitRange *const ranges = record.ranges;
    std::uint32_t value = 0;
    const auto nibble = [&](std::uint32_t index, std::uint32_t first) NETFLOOR_INLINE {
        ranges[index].firstBit = first;
        ranges[index].lastBit = first + nibbleBits - 1;
        ranges[index].value = nibbleAt(data, first);
        ranges[index].flagWord = 0;
        value = value << nibbleBits | ranges[index].value;
    };
    const auto octet = [&](std::uint32_t index, std::uint32_t first) NETFLOOR_INLINE {
        ranges[index].firstBit = first;
        ranges[index].lastBit = first + bitsPerOctet - 1;
        ranges[index].value = octetAt(data, first);
        value = value << bitsPerOctet | ranges[index].value;
    };
    std::uint32_t elements = place.elements(units);
    std::uint32_t outputElements = elements;

    if constexpr (place.shape == Shape::pieces) {
        forEach<place.count>([&]<std::uint32_t i>() NETFLOOR_INLINE {
            constexpr Piece piece = place.pieces[i];
            ranges[i].firstBit = cursor + piece.low;
            ranges[i].lastBit = cursor + piece.high;
            ranges[i].value = pieceAt<piece.low, piece.high>(data, cursor);
            ranges[i].flagWord = 0;
            value = joined(value, ranges[i].value, piece.width());
        });
    } else if constexpr (place.shape == Shape::octets && !place.isRun()) {
        forEach<place.count>([&]<std::uint32_t i>() NETFLOOR_INLINE { octet(i, cursor + i * bitsPerOctet); });
        if constexpr (place.clearsFlagWords()) {
            ranges[0].flagWord = 0;
        }
    } else if constexpr (place.shape == Shape::octets) {
        for (std::uint32_t i = 0; i < units; ++i) {
            octet(i, cursor + i * bitsPerOctet);
        }
    } else if constexpr (place.shape == Shape::octetsBackward) {
        for (std::uint32_t i = 0; i < units; ++i) {
            octet(i, cursor + (units - 1 - i) * bitsPerOctet);
        }
    } else if constexpr (place.shape == Shape::groups) {
        writeGroups(record, data, cursor, units);
        outputElements = 1;
    } else if constexpr (place.shape == Shape::reversedGroups) {
        value = writeReversedGroups(ranges, data, cursor, units);
    } else if constexpr (place.shape == Shape::nibbles || place.shape == Shape::addressNibbles) {
        for (std::uint32_t i = 0; i < elements; ++i) {
            nibble(i, cursor + i * nibbleBits);
        }
    } else {
        value = valueAt<place>(data, cursor, units);
    }
    value *= place.scale;
    record.value = value;
    record.rangeCount = elements;
    record.outputRangeCount = outputElements;
}

// Resets the record for a field and gives it the field's name: a literal, so that its terminating zero goes along.
NETFLOOR_INLINE inline void beginRecord(FieldRecord &record, std::string_view name) {
    record.value = 0;
    record.rangeCount = 0;
    record.valueText[0] = '\0';
    record.rawFlag = 0;
    std::memcpy(record.fieldName, name.data(), name.size() + 1);
}

} // namespace netfloor::plugin
