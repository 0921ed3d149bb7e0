// SPDX-License-Identifier: MIT
// Texts that come out of packets and files hold any octets; outputs need valid UTF-8.
#pragma once

#include <string>
#include <string_view>

namespace netfloor {

// How many octets the character at the start of `text` has, or 0 where no valid UTF-8 character (RFC 3629) begins.
// The text must not be empty.
[[nodiscard]] std::size_t utf8Octets(std::string_view text);

inline constexpr std::string_view replacementCharacter = "\xef\xbf\xbd"; // U+FFFD

// The text in UTF-8: what is none, and each zero octet, becomes U+FFFD. `room` is used only for a text that changes.
[[nodiscard]] std::string_view asUtf8(std::string_view text, std::string &room);

} // namespace netfloor
