// SPDX-License-Identifier: MIT
// Pieces of text that several printers need.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

namespace netfloor::cli {

constexpr std::string_view hexDigits = "0123456789abcdef";

// Names and texts carry blanks in front, by which a host may lay them out; here a tree does.
[[nodiscard]] inline std::string_view withoutLeadingBlanks(std::string_view text) {
    while (text.starts_with(' ')) {
        text.remove_prefix(1);
    }
    return text;
}

// "1 octet", "2 octets".
[[nodiscard]] std::string countText(std::uint64_t count, const char *thing);

} // namespace netfloor::cli
