// SPDX-License-Identifier: MIT
// What a host says of octets that no owner decodes.
#pragma once

#include <array>
#include <charconv>
#include <cstdint>
#include <string_view>

namespace netfloor {

inline constexpr std::string_view dataName = "data";
inline constexpr std::string_view longDataStart = "Data=";

// "Data=12 octets", "Data - 3 octets and 4 bits". It allocates nothing.
class DataText {
public:
    DataText(std::string_view start, std::uint32_t bits) {
        constexpr std::uint32_t bitsPerOctet = 8;
        const std::uint32_t octets = bits / bitsPerOctet;
        const std::uint32_t rest = bits % bitsPerOctet;
        append(start);
        append(octets);
        append(octets == 1 ? " octet" : " octets");
        if (rest != 0) {
            append(" and ");
            append(rest);
            append(" bits");
        }
    }

    [[nodiscard]] std::string_view view() const { return {text_.data(), size_}; }

private:
    void append(std::string_view text) { size_ += text.copy(text_.data() + size_, text_.size() - size_); }
    void append(std::uint32_t number) {
        size_ = static_cast<std::size_t>(std::to_chars(text_.data() + size_, text_.data() + text_.size(), number).ptr -
                                         text_.data());
    }

    std::array<char, 64> text_;
    std::size_t size_ = 0;
};

} // namespace netfloor
