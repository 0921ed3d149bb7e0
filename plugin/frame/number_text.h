// SPDX-License-Identifier: MIT
// Text that is copied fast: numbers through small tables, names from entries of one size.
#pragma once

#include <algorithm>
#include <array>
#include <bit>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <string_view>

#include "frame/value_names.h"

namespace netfloor::plugin {

// The two digits of every number below 100, and of every octet in hexadecimal.
inline constexpr auto decimalPairs = [] {
    std::array<std::array<char, 2>, 100> pairs{};
    for (std::size_t value = 0; value < pairs.size(); ++value) {
        pairs[value] = {static_cast<char>('0' + value / 10), static_cast<char>('0' + value % 10)};
    }
    return pairs;
}();

inline constexpr auto hexadecimalPairs = [] {
    constexpr std::string_view digits = "0123456789abcdef";
    std::array<std::array<char, 2>, 256> pairs{};
    for (std::size_t value = 0; value < pairs.size(); ++value) {
        pairs[value] = {digits[value / 16], digits[value % 16]};
    }
    return pairs;
}();

// The most characters of a 32-bit number.
inline constexpr std::size_t mostDigits = 10;

// Writes a number in hexadecimal without leading zeros, and gives the place after it. Up to eight
// characters are written, so there must be room for them.
NETFLOOR_INLINE inline char *writeHexadecimal(char *to, std::uint32_t value) {
    const auto digits = static_cast<std::uint32_t>(value == 0 ? 1 : (35 - std::countl_zero(value)) / 4);
    std::array<char, 8> all;
    for (std::size_t octet = 0; octet < 4; ++octet) {
        std::memcpy(&all[octet * 2], &hexadecimalPairs[value >> (24 - octet * 8) & 0xff], 2);
    }
    std::uint64_t text = 0;
    std::memcpy(&text, all.data(), all.size());
    if constexpr (std::endian::native == std::endian::little) {
        text >>= (8 - digits) * 8;
    } else {
        text <<= (8 - digits) * 8;
    }
    std::memcpy(to, &text, sizeof text);
    return to + digits;
}

// How many digits a number has in decimal.
[[nodiscard]] NETFLOOR_INLINE constexpr std::uint32_t decimalDigits(std::uint32_t value) {
    std::uint32_t digits = 1;
    for (; value >= 10000; value /= 10000) {
        digits += 4;
    }
    return digits + (value >= 10 ? 1 : 0) + (value >= 100 ? 1 : 0) + (value >= 1000 ? 1 : 0);
}

// Writes a number in decimal without leading zeros, and gives the place after it.
NETFLOOR_INLINE inline char *writeDecimal(char *to, std::uint32_t value) {
    char *const end = to + decimalDigits(value);
    char *place = end;
    for (; value >= 100; value /= 100) {
        place -= 2;
        std::memcpy(place, &decimalPairs[value % 100], 2);
    }
    if (value >= 10) {
        std::memcpy(place - 2, &decimalPairs[value], 2);
    } else {
        *(place - 1) = static_cast<char>('0' + value);
    }
    return end;
}

// The decimal digits of every octet, padded to four characters.
struct OctetText {
    std::array<char, 4> text;
    std::uint8_t size;
};

inline constexpr auto octetTexts = [] {
    std::array<OctetText, 256> texts{};
    for (unsigned value = 0; value < texts.size(); ++value) {
        texts[value].size = value >= 100 ? 3 : value >= 10 ? 2 : 1;
        for (unsigned rest = value, place = texts[value].size; place-- > 0; rest /= 10) {
            texts[value].text[place] = static_cast<char>('0' + rest % 10);
        }
    }
    return texts;
}();

// Names of one list in entries of one size, so that a name is copied without a look at its length. Entry 0 is
// the name of a value without a row; a format there stays empty.
template <std::size_t size>
struct NameText {
    std::array<char, size> text{};
    std::uint8_t length = 0;

    constexpr void set(std::string_view name) {
        for (std::size_t i = 0; i < name.size(); ++i) {
            text[i] = name[i];
        }
        length = static_cast<std::uint8_t>(name.size());
    }
};

[[nodiscard]] constexpr std::string_view nameOf(const ValueName &row, bool brief) {
    return brief ? row.brief : row.text;
}

[[nodiscard]] constexpr std::string_view otherName(const ValueNames &names, bool brief) {
    return brief ? names.otherwiseBrief : names.otherwise;
}

// The length of the longest name of a list.
[[nodiscard]] constexpr std::size_t longestName(const ValueNames &names, bool brief) {
    std::size_t longest = otherName(names, brief).size() + mostDigits;
    for (const ValueName &row : names.rows) {
        longest = std::max(longest, nameOf(row, brief).size());
    }
    return longest;
}

template <const ValueNames &names, bool brief>
inline constexpr auto nameTexts = [] {
    constexpr std::size_t unit = 16;
    constexpr std::size_t size = (longestName(names, brief) + unit - 1) / unit * unit;
    std::array<NameText<size>, names.rows.size() + 1> texts{};
    if (const std::string_view otherwise = otherName(names, brief); otherwise.find('%') == std::string_view::npos) {
        texts[0].set(otherwise);
    }
    for (std::size_t row = 0; row < names.rows.size(); ++row) {
        texts[row + 1].set(nameOf(names.rows[row], brief));
    }
    return texts;
}();

} // namespace netfloor::plugin
