// SPDX-License-Identifier: MIT
// Values as JSON (RFC 8259), straight into the output.
#pragma once

#include <cstdint>
#include <span>
#include <string>
#include <string_view>

#include "output.h"

namespace netfloor::cli {

// A string in quotes. What is no valid UTF-8 in it becomes U+FFFD.
void writeJsonText(Output &out, std::string_view text);

// Hexadecimal digits in quotes.
void writeJsonOctets(Output &out, std::span<const std::uint8_t> octets);

// "2011-11-17T09:12:33.123456000Z" (ISO 8601). The date is computed once for all times of a day.
class JsonTime {
public:
    void write(Output &out, std::int64_t nanoseconds);

private:
    std::int64_t day_ = 0; // since 1970
    std::string date_;     // of it; empty: none so far
};

} // namespace netfloor::cli
