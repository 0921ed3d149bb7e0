// SPDX-License-Identifier: MIT
// The line that a pass hands to the host: built from a field's format, cut where the buffer ends.
#pragma once

#include <algorithm>
#include <array>
#include <charconv>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <string_view>

#include "frame/field.h"
#include "netfloor/records.h"

namespace netfloor {

// A zero-terminated text of at most 255 characters; what does not fit is dropped.
class Line {
public:
    static constexpr std::size_t most = 255;

    using Buffer = std::array<char, most + 1>;

    explicit Line(Buffer& buffer) : text_(buffer.data()), end_(text_) {}

    [[gnu::always_inline]] void append(std::string_view text) {
        const std::size_t size = std::min(text.size(), room());
        std::memcpy(end_, text.data(), size);
        end_ += size;
    }

    [[gnu::always_inline]] void append(char character) {
        if (room() > 0) {
            *end_++ = character;
        }
    }

    // Appends a text of known length to a line that is known to have room: the copy has a constant size.
    template <std::size_t size> [[gnu::always_inline]] void appendFitting(const char* text) {
        std::memcpy(end_, text, size);
        end_ += size;
    }

    [[nodiscard]] constexpr std::size_t room() const {
        return most - static_cast<std::size_t>(end_ - text_);
    }

    [[gnu::always_inline]] const char* terminated() {
        *end_ = '\0';
        return text_;
    }

private:
    char* text_;
    char* end_; // the line itself lives in registers, the text in the buffer
};

// The decimal digits of every octet, for addresses.
struct OctetDigits {
    std::array<char, 3> digits;
    std::uint8_t size;
};

inline constexpr auto octetDigits = [] {
    std::array<OctetDigits, 256> table{};
    for (unsigned value = 0; value < table.size(); ++value) {
        OctetDigits& entry = table[value];
        entry.size = value >= 100 ? 3 : value >= 10 ? 2 : 1;
        for (unsigned rest = value, place = entry.size; place-- > 0; rest /= 10) {
            entry.digits[place] = static_cast<char>('0' + rest % 10);
        }
    }
    return table;
}();

// Appends one number as a conversion shows it.
template <Conversion conversion> [[gnu::always_inline]] inline void appendNumber(Line& line, std::uint32_t value) {
    if constexpr (conversion == Conversion::character) {
        // A zero octet adds nothing, as it would end the text.
        if (const char character = static_cast<char>(value); character != '\0') {
            line.append(character);
        }
    } else {
        if (conversion == Conversion::decimal && value < octetDigits.size()) {
            const OctetDigits& entry = octetDigits[value];
            line.append(std::string_view(entry.digits.data(), entry.size));
            return;
        }
        constexpr int base = conversion == Conversion::decimal ? 10 : 16;
        std::array<char, 10> digits; // NOLINT(cppcoreguidelines-pro-type-member-init): to_chars fills what is used
        const std::to_chars_result end = std::to_chars(digits.data(), digits.data() + digits.size(), value, base);
        line.append(std::string_view(digits.data(), static_cast<std::size_t>(end.ptr - digits.data())));
    }
}

// Appends the name of a value; a name that is a format is filled with the value.
template <const ValueNames& names, bool brief> [[gnu::always_inline]] inline void appendName(Line& line, std::uint32_t value) {
    if (const ValueName* row = rowOf<names>(value)) {
        line.append(brief ? row->brief : row->text);
        return;
    }
    static constexpr Format otherwise = parseFormat(brief ? names.otherwiseBrief : names.otherwise);
    static_assert(otherwise.wellFormed && otherwise.conversions <= 1, "the name of other values takes one number at most");
    line.append(otherwise.literal[0]);
    if constexpr (otherwise.conversions == 1) {
        appendNumber<otherwise.conversion[0]>(line, value);
        line.append(otherwise.literal[1]);
    }
}

template <const Field& field, const Format& format, std::size_t index>
[[gnu::always_inline]] inline void appendConversion(Line& line, const FieldRecord& record) {
    constexpr Conversion conversion = format.conversion[index];
    if constexpr (conversion == Conversion::name || conversion == Conversion::briefName) {
        appendName<*field.names, conversion == Conversion::briefName>(line, record.value);
    } else if constexpr (conversion == Conversion::list) {
        for (std::uint32_t element = 0; element < record.rangeCount; ++element) {
            if (element > 0) {
                line.append(format.separator);
            }
            appendNumber<format.element>(line, record.ranges[element].value);
        }
    } else {
        appendNumber<conversion>(line, record.value);
    }
}

// Builds the text of a field from its record. The first text of a format always has room.
template <const Field& field, const Format& format> [[gnu::always_inline]] inline void fill(Line& line, const FieldRecord& record) {
    static_assert(format.literal[0].size() <= Line::most, "a field's name fills no line");
    line.appendFitting<format.literal[0].size()>(format.literal[0].data());
    if constexpr (format.conversions > 0) {
        appendConversion<field, format, 0>(line, record);
        line.append(format.literal[1]);
    }
    if constexpr (format.conversions > 1) {
        appendConversion<field, format, 1>(line, record);
        line.append(format.literal[2]);
    }
}

} // namespace netfloor
