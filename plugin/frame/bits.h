// SPDX-License-Identifier: MIT
// The bit reader: the one place where octets of the packet are read.
//
// Bits are numbered from 1, and within an octet from the least significant bit up. A number that
// reaches over several octets takes the later octet as the more significant, which is not network
// order: byte order is made field by field, from pieces.
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <cstring>

#include "frame/for_each.h"
#include "frame/inline.h"

namespace netfloor::plugin {

inline constexpr std::uint32_t bitsPerOctet = 8;

// Reads the bits `first` to `last`, at most 32, where first is not above last.
[[nodiscard]] NETFLOOR_INLINE constexpr std::uint32_t bits(const std::uint8_t *data, std::uint32_t first,
                                                           std::uint32_t last) {
    const std::uint32_t low = first - 1;
    const std::uint32_t high = last - 1;
    std::uint64_t gathered = 0;
    for (std::uint32_t octet = high / bitsPerOctet + 1; octet-- > low / bitsPerOctet;) {
        gathered = gathered << bitsPerOctet | data[octet];
    }
    const std::uint64_t mask = (std::uint64_t{1} << (high - low + 1)) - 1;
    return static_cast<std::uint32_t>(gathered >> (low % bitsPerOctet) & mask);
}

// The low `width` bits of `value`, in reverse order.
[[nodiscard]] constexpr std::uint32_t reversed(std::uint32_t value, std::uint32_t width) {
    std::uint32_t result = 0;
    for (std::uint32_t bit = 0; bit < width; ++bit) {
        result = result << 1 | (value >> bit & 1);
    }
    return result;
}

// True where a bit number is the first of an octet.
[[nodiscard]] NETFLOOR_INLINE constexpr bool onOctetBorder(std::uint32_t bit) {
    return (bit - 1) % bitsPerOctet == 0;
}

// The octets from bit number `first` on, which lies on an octet border.
[[nodiscard]] NETFLOOR_INLINE constexpr const std::uint8_t *octetsFrom(const std::uint8_t *data, std::uint32_t first) {
    return data + (first - 1) / bitsPerOctet;
}

// Reads the bits `first` to `last` out of line: the form that need not be fast.
[[nodiscard, gnu::cold, gnu::noinline]] constexpr std::uint32_t bitsAcross(const std::uint8_t *data,
                                                                           std::uint32_t first, std::uint32_t last) {
    return bits(data, first, last);
}

// Reads the 8 bits from bit number `first` on, wherever they lie.
[[nodiscard]] NETFLOOR_INLINE constexpr std::uint32_t octetAt(const std::uint8_t *data, std::uint32_t first) {
    if (onOctetBorder(first)) [[likely]] {
        return data[(first - 1) / bitsPerOctet];
    }
    return bitsAcross(data, first, first + bitsPerOctet - 1);
}

// Reads the 4 bits from bit number `first` on, wherever they lie.
[[nodiscard]] NETFLOOR_INLINE constexpr std::uint32_t nibbleAt(const std::uint8_t *data, std::uint32_t first) {
    const std::uint32_t low = (first - 1) % bitsPerOctet;
    if (low <= 4) [[likely]] {
        return data[(first - 1) / bitsPerOctet] >> low & 0xfu;
    }
    return bitsAcross(data, first, first + 3);
}

// Reads the bits `low` to `high` after `cursor`. On an octet border their octets and shifts are constants.
template <std::uint32_t low, std::uint32_t high>
[[nodiscard]] NETFLOOR_INLINE constexpr std::uint32_t pieceAt(const std::uint8_t *data, std::uint32_t cursor) {
    if (!onOctetBorder(cursor)) [[unlikely]] {
        return bitsAcross(data, cursor + low, cursor + high);
    }
    constexpr std::uint32_t firstOctet = low / bitsPerOctet;
    constexpr std::uint32_t lastOctet = high / bitsPerOctet;
    constexpr std::uint64_t mask = (std::uint64_t{1} << (high - low + 1)) - 1;
    const std::uint8_t *const from = data + (cursor - 1) / bitsPerOctet;
    std::uint64_t gathered = 0;
    for (std::uint32_t octet = lastOctet + 1; octet-- > firstOctet;) {
        gathered = gathered << bitsPerOctet | from[octet];
    }
    return static_cast<std::uint32_t>(gathered >> (low % bitsPerOctet) & mask);
}

[[nodiscard, gnu::cold, gnu::noinline]] constexpr std::uint32_t octetsAcross(const std::uint8_t *data,
                                                                             std::uint32_t first, std::uint32_t count) {
    std::uint32_t value = 0;
    for (std::uint32_t octet = 0; octet < count; ++octet) {
        value = value << bitsPerOctet |
                bits(data, first + octet * bitsPerOctet, first + octet * bitsPerOctet + bitsPerOctet - 1);
    }
    return value;
}

// Reads `count` octets from bit number `first` on in network order; of more than four the last four stay.
[[nodiscard]] NETFLOOR_INLINE constexpr std::uint32_t octetsAt(const std::uint8_t *data, std::uint32_t first,
                                                               std::uint32_t count) {
    if (!onOctetBorder(first)) [[unlikely]] {
        return octetsAcross(data, first, count);
    }
    const std::uint8_t *const from = octetsFrom(data, first);
    std::uint32_t value = 0;
    for (std::uint32_t octet = 0; octet < count; ++octet) {
        value = value << bitsPerOctet | from[octet];
    }
    return value;
}

// The same for a constant number of octets, for which compilers then take one load.
template <std::uint32_t count>
[[nodiscard]] NETFLOOR_INLINE constexpr std::uint32_t octetsAt(const std::uint8_t *data, std::uint32_t first) {
    if (!onOctetBorder(first)) [[unlikely]] {
        return octetsAcross(data, first, count);
    }
    const std::uint8_t *const from = octetsFrom(data, first);
    std::uint32_t value = 0;
    forEach<count>([&]<std::size_t octet>() NETFLOOR_INLINE { value = value << bitsPerOctet | from[octet]; });
    return value;
}

// Copies `count` octets from bit number `first` on.
template <std::size_t count>
[[nodiscard]] NETFLOOR_INLINE inline std::array<std::uint8_t, count> octetArrayAt(const std::uint8_t *data,
                                                                                  std::uint32_t first) {
    std::array<std::uint8_t, count> octets{};
    if (onOctetBorder(first)) [[likely]] {
        std::memcpy(octets.data(), octetsFrom(data, first), count);
        return octets;
    }
    for (std::uint32_t octet = 0; octet < count; ++octet) {
        octets[octet] = static_cast<std::uint8_t>(octetAt(data, first + octet * bitsPerOctet));
    }
    return octets;
}

inline constexpr auto reversedOctets = [] {
    std::array<std::uint8_t, 256> table{};
    for (std::uint32_t value = 0; value < table.size(); ++value) {
        table[value] = static_cast<std::uint8_t>(reversed(value, bitsPerOctet));
    }
    return table;
}();

// Eight octets at once, the bits of each reversed.
[[nodiscard]] constexpr std::uint64_t eachReversed(std::uint64_t octets) {
    octets = (octets >> 1 & 0x5555555555555555) | (octets & 0x5555555555555555) << 1;
    octets = (octets >> 2 & 0x3333333333333333) | (octets & 0x3333333333333333) << 2;
    return (octets >> 4 & 0x0f0f0f0f0f0f0f0f) | (octets & 0x0f0f0f0f0f0f0f0f) << 4;
}

// Eight octets as a number, the first the least significant.
[[nodiscard]] inline std::uint64_t load64(const std::uint8_t *octets) {
    std::uint64_t value = 0;
    for (std::uint32_t i = 0; i < sizeof value; ++i) {
        value |= std::uint64_t{octets[i]} << i * bitsPerOctet;
    }
    return value;
}

inline void store64(std::uint8_t *octets, std::uint64_t value) {
    for (std::uint32_t i = 0; i < sizeof value; ++i) {
        octets[i] = static_cast<std::uint8_t>(value >> i * bitsPerOctet);
    }
}

// Eight octets at once, the two nibbles of each exchanged.
[[nodiscard]] constexpr std::uint64_t nibblesExchanged(std::uint64_t octets) {
    return (octets & 0x0f0f0f0f0f0f0f0f) << 4 | (octets >> 4 & 0x0f0f0f0f0f0f0f0f);
}

// Copies octets with the bits of each reversed. The two may be the same octets.
inline void copyWithBitsReversed(std::uint8_t *to, const std::uint8_t *from, std::uint32_t count) {
    std::uint32_t octet = 0;
    for (; octet + sizeof(std::uint64_t) <= count; octet += sizeof(std::uint64_t)) {
        store64(to + octet, eachReversed(load64(from + octet)));
    }
    for (; octet < count; ++octet) {
        to[octet] = reversedOctets[from[octet]];
    }
}

// The same in place off an octet border: of `count` windows of 8 bits, each of which starts `shift` bits above the
// lowest bit of its octet and ends in the next one.
inline void reverseShifted(std::uint8_t *data, std::uint32_t count, std::uint32_t shift) {
    const std::uint32_t below = (1u << shift) - 1;
    std::uint32_t octet = 0;
    for (; octet + sizeof(std::uint64_t) <= count; octet += sizeof(std::uint64_t)) {
        const std::uint64_t low = load64(data + octet);
        const std::uint64_t high = data[octet + sizeof low];
        const std::uint64_t windows = eachReversed(low >> shift | high << (64 - shift));
        store64(data + octet, (low & below) | windows << shift);
        data[octet + sizeof low] = static_cast<std::uint8_t>((high & ~std::uint64_t{below}) | windows >> (64 - shift));
    }
    for (; octet < count; ++octet) {
        const auto pair = static_cast<std::uint32_t>(data[octet] | data[octet + 1] << bitsPerOctet);
        const std::uint32_t window = reversedOctets[pair >> shift & 0xff];
        const std::uint32_t mixed = (pair & ~(0xffu << shift)) | window << shift;
        data[octet] = static_cast<std::uint8_t>(mixed);
        data[octet + 1] = static_cast<std::uint8_t>(mixed >> bitsPerOctet);
    }
}

// Reverses the bits of each octet of a packet of `totalBits` in place, from bit number `from` on up to the packet's
// last whole octet. Off an octet border the octets are those counted from `from` on.
inline void reverseOctets(std::uint8_t *data, std::uint32_t from, std::uint32_t totalBits) {
    const std::uint32_t shift = (from - 1) % bitsPerOctet;
    const std::uint32_t start = (from - 1) / bitsPerOctet;
    const std::uint32_t end = totalBits / bitsPerOctet;
    if (start >= end) {
        return;
    }
    if (shift == 0) {
        copyWithBitsReversed(data + start, data + start, end - start);
    } else {
        reverseShifted(data + start, end - start - 1, shift);
    }
}

} // namespace netfloor::plugin
