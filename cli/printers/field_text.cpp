// SPDX-License-Identifier: MIT
#include "printers/field_text.h"

#include <array>
#include <charconv>

#include "text.h"

namespace netfloor::cli {

void writeBits(Output &out, std::span<const BitRange> ranges, std::uint32_t bitsBefore) {
    for (std::size_t i = 0; i < ranges.size();) {
        const std::uint32_t first = ranges[i].firstBit;
        std::uint32_t last = ranges[i].lastBit;
        out << (i == 0 ? "" : ",") << bitsBefore + first;
        for (++i; i < ranges.size() && ranges[i].firstBit == last + 1; ++i) {
            last = ranges[i].lastBit;
        }
        if (last != first) {
            out << '-' << bitsBefore + last;
        }
    }
}

void writeOctetNumbers(Output &out, OctetSpan octets) {
    if (octets.end - octets.first == 1) {
        out << "octet " << octets.first;
        return;
    }
    out << "octets " << octets.first << " to " << octets.end - 1;
}

std::optional<OctetSpan> unshownOctets(const FieldView &field, std::uint32_t bits, std::string_view text) {
    const auto equals = text.find('=');
    if (equals != std::string_view::npos &&
        text.find_first_not_of("0123456789abcdef", equals + 1) != std::string_view::npos) {
        return std::nullopt;
    }
    const OctetSpan octets = *octetsOf(field);
    const bool isWhole = (octets.end - octets.first) * bitsPerOctet == bits;
    return isWhole ? std::optional(octets) : std::nullopt;
}

bool isOrNamesNumber(std::string_view shown, std::uint32_t number) {
    std::array<char, 12> room;
    const auto digitsOf = [&](int base) {
        return std::string_view(room.data(), std::to_chars(room.data(), room.data() + room.size(), number, base).ptr);
    };
    if (shown == digitsOf(16)) {
        return true;
    }
    if (!shown.ends_with(')')) {
        return false;
    }
    shown.remove_suffix(1);
    const std::string_view digits = digitsOf(10);
    return shown.ends_with(digits) && shown.substr(0, shown.size() - digits.size()).ends_with('(');
}

} // namespace netfloor::cli
