// SPDX-License-Identifier: MIT
#include "printers/field_text.h"

#include <algorithm>
#include <array>
#include <cctype>
#include <cstdio>

#include "text.h"

namespace netfloor::cli {

namespace {

constexpr std::uint32_t bitsPerOctet = 8;

std::uint32_t bitCount(const FieldReport &field) {
    std::uint32_t bits = 0;
    for (const ReportedRange &range : field.ranges) {
        bits += range.lastBit - range.firstBit + 1;
    }
    return bits;
}

// What stands behind the field's name in its text; none where there is only a name.
std::optional<std::string_view> shownValue(const FieldReport &field) {
    const std::string_view text = field.text;
    const auto equals = text.find('=');
    return equals == std::string_view::npos ? std::nullopt : std::optional(text.substr(equals + 1));
}

} // namespace

std::string bitsText(const std::vector<ReportedRange> &ranges) {
    std::string text;
    for (std::size_t i = 0; i < ranges.size();) {
        const std::uint32_t first = ranges[i].firstBit;
        std::uint32_t last = ranges[i].lastBit;
        for (++i; i < ranges.size() && ranges[i].firstBit == last + 1; ++i) {
            last = ranges[i].lastBit;
        }
        text += text.empty() ? "" : ",";
        text += std::to_string(first);
        if (last != first) {
            text += "-" + std::to_string(last);
        }
    }
    return text;
}

std::string octetsText(std::uint32_t firstBit, std::uint32_t lastBit) {
    const std::uint32_t first = (firstBit - 1) / bitsPerOctet;
    const std::uint32_t last = (lastBit - 1) / bitsPerOctet;
    return first == last ? "octet " + std::to_string(first)
                         : "octets " + std::to_string(first) + " to " + std::to_string(last);
}

std::string_view nameOf(const FieldReport &field) {
    const std::string_view name = withoutLeadingBlanks(field.name);
    return name.empty() ? "(without a name)" : name;
}

OctetRun unshownOctets(const FieldReport &field, std::span<const std::uint8_t> packet) {
    const std::uint32_t bits = bitCount(field);
    if (bits <= sizeof(field.value) * bitsPerOctet ||
        shownValue(field).value_or("").find_first_not_of("0123456789abcdef") != std::string_view::npos) {
        return {};
    }
    // Some fields are read from the last octet on.
    std::uint32_t first = field.ranges.front().firstBit;
    std::uint32_t last = field.ranges.front().lastBit;
    for (const ReportedRange &range : field.ranges) {
        first = std::min(first, range.firstBit);
        last = std::max(last, range.lastBit);
    }
    if (last - first + 1 != bits || first % bitsPerOctet != 1 || bits % bitsPerOctet != 0) {
        return {};
    }
    return {first, packet.subspan((first - 1) / bitsPerOctet, bits / bitsPerOctet)};
}

std::optional<std::uint32_t> unshownNumber(const FieldReport &field) {
    const auto shown = shownValue(field);
    const std::uint32_t bits = bitCount(field);
    if (!shown || (bits != bitsPerOctet && bits != 2 * bitsPerOctet)) {
        return std::nullopt;
    }
    std::array<char, 16> hexadecimal{};
    std::snprintf(hexadecimal.data(), hexadecimal.size(), "%x", field.value);
    const bool isNumber = *shown == hexadecimal.data() || shown->ends_with("(" + std::to_string(field.value) + ")");
    // A single letter is an octet of text.
    const bool isName =
        shown->empty() || (shown->size() > 1 && std::isalpha(static_cast<unsigned char>(shown->front())) != 0);
    return isName && !isNumber ? std::optional(field.value) : std::nullopt;
}

} // namespace netfloor::cli
