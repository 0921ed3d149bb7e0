// SPDX-License-Identifier: MIT
// The Lengths of chunks, parameters and error causes (RFC 9260), and the limits computed from them.
#pragma once

#include <array>
#include <cstdint>
#include <optional>

#include "frame/block.h"
#include "frame/field.h"
#include "frame/field_step.h"
#include "sctp/variables.h"

namespace netfloor::plugin::sctp {

// The head of a chunk, a parameter or a cause, which its Length includes.
inline constexpr std::int32_t headOctets = 4;

// Stores a Length as the octets after the head. For a Length below 4 this is negative, and nothing fits.
[[nodiscard]] constexpr auto octetsAfterHead(std::int32_t &octets) {
    return [&octets](std::uint32_t length) { octets = static_cast<std::int32_t>(length) - headOctets; };
}

[[nodiscard]] constexpr std::uint32_t bitsOf(std::int32_t octets) {
    return static_cast<std::uint32_t>(octets) * bitsPerOctet;
}

// A type, and a Length.
inline constexpr std::uint32_t typeBits = 16;
inline constexpr std::uint32_t lengthBits = 16;

// Bits before a Length, which are skipped if `needs` bits are left.
struct Skipped {
    std::uint32_t needs;
    std::uint32_t width;
};

// A Length that comes after the start of the block that it limits.
struct LengthAhead {
    std::array<Skipped, 2> skipped; // the fields before the Length; an element that needs 0 bits is unused
    bool addsSkipped;               // whether their bits are added to the limit
    std::uint32_t takesOff;         // bits that are subtracted from the sum
};

// The limit is Length * 8 bits, and Length * 8 - 8 for ABORT. INIT starts after its Chunk Type, so that its limit
// reaches one octet past the chunk. If that octet is missing, the limit does not fit and the walk over the chunks ends.
// Otherwise the octet is skipped.
inline constexpr LengthAhead initLengthAhead = {
    .skipped = {Skipped{.needs = 8, .width = 8}},
    .addsSkipped = true,
    .takesOff = 24,
};
// The octet of flags holds two fields, of which the first does not move the cursor.
inline constexpr LengthAhead abortLengthAhead = {
    .skipped = {Skipped{.needs = 8, .width = 0}, Skipped{.needs = 8, .width = 8}},
    .addsSkipped = false,
    .takesOff = 24,
};
// Of a parameter, and of the heartbeat information.
inline constexpr LengthAhead valueLengthAhead = {
    .skipped = {Skipped{.needs = typeBits, .width = typeBits}},
    .addsSkipped = true,
    .takesOff = 32,
};

// Peeks at a Length, and gives the limit in bits. Nothing is reported, and the cursor is set back. A field that does
// not fit adds the advance of the previous step instead of its own: after the last parameter of a list, this makes a
// limit that is longer than the bits left, or 0. A Length that was read is stored, even if the limit is then too short
// for the Length field itself.
template <const LengthAhead &ahead, class Pass, class Store>
[[nodiscard]] std::uint32_t limitFromLength(Reader<Pass> &reader, Store into) {
    if (reader.ended()) {
        return 0;
    }
    const std::uint32_t cursor = reader.cursor;
    const std::uint32_t left = reader.left;
    const auto stepOver = [&reader](std::uint32_t width) {
        reader.setAdvance(static_cast<std::int32_t>(width));
        reader.cursor += width;
        reader.left -= width;
    };

    std::uint32_t sum = 0;
    for (const Skipped &part : ahead.skipped) {
        if (part.needs == 0) {
            continue;
        }
        if (reader.test(reader.left >= part.needs)) {
            stepOver(part.width);
        }
        sum += ahead.addsSkipped ? static_cast<std::uint32_t>(reader.state->advance) : 0;
    }
    const std::optional<std::uint32_t> length = peek(reader, octets(2));
    if (reader.test(length.has_value())) {
        store(into, *length);
        stepOver(lengthBits);
    }
    sum += static_cast<std::uint32_t>(reader.state->advance) + length.value_or(0) * bitsPerOctet;

    reader.cursor = cursor;
    reader.left = left;
    return sum - ahead.takesOff;
}

} // namespace netfloor::plugin::sctp
