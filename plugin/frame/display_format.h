// SPDX-License-Identifier: MIT
// The display format of a field, taken apart at compile time.
//
//   %u %x %c         the value in decimal, in hexadecimal, as one character
//   %-S              the name of the value; %-s its short form
//   %-["%x":"."]     each element by the inner format, joined by the text after the colon
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <string_view>

namespace netfloor::plugin {

enum class Conversion : std::uint8_t { none, decimal, hexadecimal, character, name, briefName, list };

// A format: text, conversion, text, conversion, text.
struct Format {
    static constexpr std::size_t most = 2;

    std::array<std::string_view, most + 1> literal = {};
    std::array<Conversion, most> conversion = {};
    std::size_t conversions = 0;
    Conversion element = Conversion::none; // of a list: how each element is shown
    std::string_view separator = {};       // of a list: what stands between two elements
    bool wellFormed = true;

    [[nodiscard]] constexpr bool has(Conversion wanted) const {
        for (std::size_t i = 0; i < conversions; ++i) {
            if (conversion[i] == wanted) {
                return true;
            }
        }
        return false;
    }
};

[[nodiscard]] constexpr Conversion numberConversion(char letter) {
    switch (letter) {
    case 'u': return Conversion::decimal;
    case 'x': return Conversion::hexadecimal;
    case 'c': return Conversion::character;
    default: return Conversion::none;
    }
}

[[nodiscard]] constexpr Format parseFormat(std::string_view text) {
    Format format;
    while (true) {
        const std::size_t percent = text.find('%');
        if (percent == std::string_view::npos) {
            format.literal[format.conversions] = text;
            return format;
        }
        if (format.conversions == Format::most) {
            format.wellFormed = false;
            return format;
        }
        format.literal[format.conversions] = text.substr(0, percent);
        text.remove_prefix(percent + 1);
        Conversion found = numberConversion(text.empty() ? '\0' : text.front());
        std::size_t used = 1;
        if (text.starts_with("-S") || text.starts_with("-s")) {
            found = text[1] == 'S' ? Conversion::name : Conversion::briefName;
            used = 2;
        } else if (text.starts_with("-[\"%")) {
            const std::size_t end = text.find(']');
            found = Conversion::list;
            format.element = numberConversion(text[4]);
            if (const std::size_t colon = text.find("\":\""); colon < end) {
                format.separator = text.substr(colon + 3, end - 1 - (colon + 3));
            }
            used = end + 1;
        }
        format.wellFormed = format.wellFormed && found != Conversion::none;
        format.conversion[format.conversions++] = found;
        text.remove_prefix(used);
    }
}

// What a display line shows after the field's name: the part after the last "=" before
// the first conversion, without the blanks that follow it.
[[nodiscard]] constexpr std::string_view valuePart(std::string_view line) {
    const std::size_t equals = line.substr(0, line.find('%')).rfind('=');
    if (equals == std::string_view::npos) {
        return {};
    }
    line.remove_prefix(equals + 1);
    while (line.starts_with(' ')) {
        line.remove_prefix(1);
    }
    return line;
}

} // namespace netfloor::plugin
