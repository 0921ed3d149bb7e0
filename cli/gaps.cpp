// SPDX-License-Identifier: MIT
#include "gaps.h"

#include <algorithm>

namespace netfloor::cli {

namespace {

constexpr std::uint32_t bitsPerOctet = 8;

std::size_t octetOf(std::uint32_t bit) {
    return (bit - 1) / bitsPerOctet;
}

std::uint32_t firstBitOf(const FieldReport &field) {
    std::uint32_t first = 0; // a field that was looked at ahead of its turn has no ranges
    for (const ReportedRange &range : field.ranges) {
        first = first == 0 ? range.firstBit : std::min(first, range.firstBit);
    }
    return first;
}

} // namespace

std::vector<Gap> findGaps(const Report &detail) {
    // Fields come in the order of the packet, but the octets of some are read from the last one on.
    std::vector<bool> covered((detail.cursor - 1) / bitsPerOctet);
    for (const FieldReport &field : detail.fields) {
        for (const ReportedRange &range : field.ranges) {
            for (std::size_t octet = octetOf(range.firstBit); octet <= octetOf(range.lastBit); ++octet) {
                if (octet < covered.size()) {
                    covered[octet] = true;
                }
            }
        }
    }
    std::vector<Gap> gaps;
    std::size_t field = 0;
    const auto start = covered.begin();
    for (auto from = std::find(start, covered.end(), false); from != covered.end();) {
        const auto to = std::find(from, covered.end(), true);
        const auto firstBit = static_cast<std::uint32_t>(from - start) * bitsPerOctet + 1;
        while (field < detail.fields.size() && firstBitOf(detail.fields[field]) < firstBit) {
            ++field;
        }
        gaps.push_back({field, firstBit, static_cast<std::uint32_t>(to - start) * bitsPerOctet});
        from = std::find(to, covered.end(), false);
    }
    return gaps;
}

} // namespace netfloor::cli
