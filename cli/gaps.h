// SPDX-License-Identifier: MIT
// Octets that the MD pass went over and that no field covers, found while it goes.
#pragma once

#include <algorithm>
#include <cstdint>
#include <optional>

#include "netfloor-host/sink.h"

namespace netfloor::cli {

struct Gap {
    std::uint32_t firstOctet = 0;
    std::uint32_t octets = 0;
};

// Bits of a packet, from their lowest to their highest octet.
struct OctetSpan {
    std::uint32_t first = 0;
    std::uint32_t end = 0; // the one after the last
};

[[nodiscard]] inline std::uint32_t octetOf(std::uint32_t bit) {
    return (bit - 1) / bitsPerOctet;
}

// What the ranges of a field cover. Without bits for a field that was looked at ahead of its turn and has no ranges.
struct FieldExtent {
    OctetSpan octets;
    std::uint32_t bits = 0;
};
[[nodiscard, gnu::always_inline]] inline FieldExtent extentOf(const FieldView &field) {
    if (field.ranges.empty()) {
        return {};
    }
    // Some fields are read from the last octet on, in many pieces.
    std::uint32_t first = field.ranges[0].firstBit;
    std::uint32_t last = field.ranges[0].lastBit;
    std::uint32_t bits = last - first + 1;
    for (std::size_t i = 1; i < field.ranges.size(); ++i) {
        const BitRange &range = field.ranges[i];
        first = std::min(first, range.firstBit);
        last = std::max(last, range.lastBit);
        bits += range.lastBit - range.firstBit + 1;
    }
    return {{octetOf(first), octetOf(last) + 1}, bits};
}
[[nodiscard]] inline std::optional<OctetSpan> octetsOf(const FieldView &field) {
    const FieldExtent extent = extentOf(field);
    return extent.bits == 0 ? std::nullopt : std::optional(extent.octets);
}

// A pass reads forwards, and what is looked at ahead has no bits. So an octet is in no field when what comes next
// begins after it and no field before has covered it.
class GapFinder {
public:
    void reset() { covered_ = 0; }

    // Whether there is none in front of this octet.
    [[nodiscard]] bool isCovered(std::uint32_t octet) const { return octet <= covered_; }

    // What begins at `octet` comes next, and the cursor is there or past it. Gives the gap in front of it.
    [[nodiscard]] std::optional<Gap> before(std::uint32_t octet) {
        if (isCovered(octet)) {
            return std::nullopt;
        }
        const Gap gap = {covered_, octet - covered_};
        covered_ = octet;
        return gap;
    }

    void cover(OctetSpan octets) { covered_ = std::max(covered_, octets.end); }

private:
    std::uint32_t covered_ = 0; // all octets up to this one are in fields, or in gaps that were told
};

} // namespace netfloor::cli
