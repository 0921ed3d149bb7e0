// SPDX-License-Identifier: MIT
// Addresses out of text. The system's inet_pton would bring a network library into each host on Windows.
#pragma once

#include <cstdint>
#include <span>
#include <string_view>

namespace netfloor {

// Reads "192.0.2.1". False where the text is anything else.
[[nodiscard]] bool parseIpv4(std::string_view text, std::span<std::uint8_t, 4> octets);

// Reads an address in a form of RFC 4291, section 2.2, such as "2001:db8::1" or "::ffff:192.0.2.1". False where the
// text is anything else.
[[nodiscard]] bool parseIpv6(std::string_view text, std::span<std::uint8_t, 16> octets);

} // namespace netfloor
