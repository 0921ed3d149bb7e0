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

// "17-32", and for a field whose pieces do not follow one another "1-5,9-16".
void writeBits(Output &out, std::span<const BitRange> ranges);

// "octet 7", "octets 7 to 9"
void writeOctetNumbers(Output &out, OctetSpan octets);

[[nodiscard]] std::string_view nameOf(const FieldView &field);

// The octets of a field that has more than a number can hold and whose text shows only digits, if that: the text leaves
// out the zeros in front and may be cut. None for other fields.
[[nodiscard]] std::optional<OctetSpan> unshownOctets(const FieldView &field, std::string_view text);

// The number of a field whose text gives the name of its value, or no name: of types and codes, not of single bits.
[[nodiscard]] std::optional<std::uint32_t> unshownNumber(const FieldView &field, std::string_view text);

} // namespace netfloor::cli
