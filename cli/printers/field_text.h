// SPDX-License-Identifier: MIT
// What a detailed view says of a field beside the plug-in's text, out of the field's value and bits.
#pragma once

#include <cstdint>
#include <optional>
#include <span>
#include <string_view>

#include "gaps.h"
#include "netfloor-host/sink.h"
#include "output.h"

namespace netfloor::cli {

constexpr std::uint32_t numberBits = 32; // that a field record holds

// "17-32", and for a field whose pieces do not follow one another "1-5,9-16".
void writeBits(Output &out, std::span<const BitRange> ranges, std::uint32_t bitsBefore = 0);

// "octet 7", "octets 7 to 9"
void writeOctetNumbers(Output &out, OctetSpan octets);

[[nodiscard]] inline std::string_view nameOf(const FieldView &field) {
    return field.name.empty() ? "(without a name)" : field.name;
}

[[nodiscard]] inline bool isLetter(char character) {
    return (character >= 'a' && character <= 'z') || (character >= 'A' && character <= 'Z');
}

[[nodiscard]] inline std::uint32_t bitCount(std::span<const BitRange> ranges) {
    std::uint32_t bits = 0;
    for (const BitRange &range : ranges) {
        bits += range.lastBit - range.firstBit + 1;
    }
    return bits;
}

// The octets of a field of more bits than a number can hold whose text shows only digits, if that: the text leaves out
// the zeros in front and may be cut. None for other fields.
[[nodiscard]] std::optional<OctetSpan> unshownOctets(const FieldView &field, std::uint32_t bits, std::string_view text);

// Whether what a text shows as a value is the number in hexadecimal, or ends with "(number)".
[[nodiscard]] bool isOrNamesNumber(std::string_view shown, std::uint32_t number);

// Whether the text tells the number. It does not where it has the name of the value, or nothing, in its place.
// Inside its callers: it is asked for every second field.
[[nodiscard, gnu::always_inline]] inline bool showsItsNumber(std::string_view text, std::uint32_t number) {
    const auto equals = text.find('=');
    if (equals == std::string_view::npos) {
        return true;
    }
    // A text that starts with a digit is a number; a single letter is an octet of text.
    std::string_view shown = text;
    shown.remove_prefix(equals + 1);
    const bool isName = shown.empty() || (shown.size() > 1 && isLetter(shown.front()));
    return !isName || isOrNamesNumber(shown, number);
}

} // namespace netfloor::cli
