// SPDX-License-Identifier: MIT
// Values as text: addresses, key fields, flags, passes.
#pragma once

#include <array>
#include <cstdint>
#include <optional>
#include <span>
#include <string>
#include <string_view>
#include <vector>

#include "netfloor-host/reports.h"

namespace netfloor {

using Ipv6Octets = std::array<std::uint8_t, 16>;

// A text for each flag set in DecodeState::flags, the lowest first; "flag 0x..." for a flag without a name.
[[nodiscard]] std::vector<std::string> flagNames(std::uint32_t flags);

// "MD", "TO", "MV", "XTR".
[[nodiscard]] std::string_view passName(Pass pass);

// An IPv6 address in the form of RFC 5952, and an IPv4 address in dotted form.
[[nodiscard]] std::string ipv6Text(const Ipv6Octets &octets);
[[nodiscard]] std::string ipv4Text(std::uint32_t address);

// Room for the text of one address or number, for who writes many of them.
using TextRoom = std::array<char, 48>;
[[nodiscard]] std::string_view ipv6Text(const Ipv6Octets &octets, TextRoom &room);
[[nodiscard]] std::string_view ipv4Text(std::uint32_t address, TextRoom &room);

// The IPv6 address of a field, taken from the packet by the field's bit ranges. None when the field is no IPv6
// address: it is one if its ranges are 128 bits in one piece, 8 groups of 16 bits or 32 nibbles, follow one another
// without a gap, and start on an octet border.
[[nodiscard]] std::optional<Ipv6Octets> ipv6Address(const FieldReport &field, std::span<const std::uint8_t> packet);
[[nodiscard]] std::optional<Ipv6Octets> ipv6Address(const FieldView &field, std::span<const std::uint8_t> packet);

// The IPv6 address of a key field, with its nibbles in their usual order. None when the key field holds no address.
[[nodiscard]] std::optional<Ipv6Octets> ipv6Address(const KeyView &key);

// The value of a key field in its usual form: a decimal number, or an address.
[[nodiscard]] std::string keyText(const KeyView &key);
[[nodiscard]] std::string_view keyText(const KeyView &key, TextRoom &room);

} // namespace netfloor
