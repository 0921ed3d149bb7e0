// SPDX-License-Identifier: MIT
// Results in words.
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

// The bits of DecodeState::flags in words, the lowest first; a bit without a name as "flag 0x...".
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

// The IPv6 address that a field stands on, taken from the packet by the field's bit ranges, or none when the
// field is no IPv6 address: it is one if its ranges are one stretch of 128 bits, 8 groups of 16 bits or 32
// nibbles, one after the other on octet borders.
[[nodiscard]] std::optional<Ipv6Octets> ipv6Address(const FieldReport &field, std::span<const std::uint8_t> packet);
[[nodiscard]] std::optional<Ipv6Octets> ipv6Address(const FieldView &field, std::span<const std::uint8_t> packet);

// The IPv6 address of a key field, its nibbles put back in order, or none when the key field holds no address.
[[nodiscard]] std::optional<Ipv6Octets> ipv6Address(const KeyView &key);

// The value of a key field in its usual form: a decimal number, or an address.
[[nodiscard]] std::string keyText(const KeyView &key);
[[nodiscard]] std::string_view keyText(const KeyView &key, TextRoom &room);

} // namespace netfloor
