// SPDX-License-Identifier: MIT
// What a detailed view says of a field beside the plug-in's text, out of the field's value and bits.
#pragma once

#include <cstdint>
#include <optional>
#include <span>
#include <string>
#include <string_view>
#include <vector>

#include "netfloor-host/reports.h"

namespace netfloor::cli {

// "17-32", and for a field whose pieces do not follow one another "1-5,9-16".
[[nodiscard]] std::string bitsText(const std::vector<ReportedRange> &ranges);

// "octet 7", "octets 7 to 9"
[[nodiscard]] std::string octetsText(std::uint32_t firstBit, std::uint32_t lastBit);

[[nodiscard]] std::string_view nameOf(const FieldReport &field);

// Octets one behind the other, as they stand in the packet from `firstBit` on.
struct OctetRun {
    std::uint32_t firstBit = 0;
    std::span<const std::uint8_t> octets;
};

// Those of a field that has more than a number can hold and whose text shows only digits, if that: the text leaves out
// the zeros in front and may be cut. Empty for other fields.
[[nodiscard]] OctetRun unshownOctets(const FieldReport &field, std::span<const std::uint8_t> packet);

// The number of a field whose text gives the name of its value, or no name: of types and codes, not of single bits.
[[nodiscard]] std::optional<std::uint32_t> unshownNumber(const FieldReport &field);

} // namespace netfloor::cli
