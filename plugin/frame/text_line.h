// SPDX-License-Identifier: MIT
// The line that a pass hands to the host: built from a field's format, cut where the buffer ends.
#pragma once

#include <algorithm>
#include <array>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <string_view>

#include "frame/field.h"
#include "frame/number_text.h"
#include "netfloor/records.h"

namespace netfloor::plugin {

// A zero-terminated text of at most 255 characters; what does not fit is dropped. All formats are known to fit into
// the buffer, so that only lists of elements ask for its end; what is copied may be longer than what counts.
class Line {
public:
    static constexpr std::size_t most = 255;
    static constexpr std::size_t slack = 128;

    using Buffer = std::array<char, most + 1 + slack>;

    NETFLOOR_INLINE explicit Line(Buffer &buffer) : text_(buffer.data()), end_(text_) {}

    // Appends a text whose length is known where it is written. One of no length may be null.
    template <std::size_t size>
    NETFLOOR_INLINE void appendLiteral(const char *text) {
        if constexpr (size > 0) {
            std::memcpy(end_, text, size);
            end_ += size;
        }
    }

    // Appends a number as a conversion shows it. A zero octet adds no character, as it would end the text.
    template <Conversion conversion, std::uint32_t bitCount>
    NETFLOOR_INLINE void appendNumber(std::uint32_t value) {
        if constexpr (conversion == Conversion::character) {
            *end_ = static_cast<char>(value);
            end_ += *end_ == '\0' ? 0 : 1;
        } else if constexpr (conversion == Conversion::hexadecimal) {
            end_ = writeHexadecimal(end_, value);
        } else if constexpr (bitCount <= bitsPerOctet) {
            const OctetText &octet = octetTexts[value & 0xff];
            std::memcpy(end_, octet.text.data(), octet.text.size());
            end_ += octet.size;
        } else {
            end_ = writeDecimal(end_, value);
        }
    }

    // Appends the name of a value; a name that is a format is filled with the value.
    template <const ValueNames &names, bool brief>
    NETFLOOR_INLINE void appendName(std::uint32_t value) {
        static constexpr Format otherwise = parseFormat(otherName(names, brief));
        static_assert(otherwise.wellFormed && otherwise.conversions <= 1,
                      "the name of other values takes one number at most");
        const std::uint32_t row = rowNumber<names>(value);
        if constexpr (otherwise.conversions == 1) {
            if (row == 0) {
                appendLiteral<otherwise.literal[0].size()>(otherwise.literal[0].data());
                appendNumber<otherwise.conversion[0], 32>(value);
                appendLiteral<otherwise.literal[1].size()>(otherwise.literal[1].data());
                return;
            }
        }
        const auto &name = nameTexts<names, brief>[row];
        std::memcpy(end_, name.text.data(), name.text.size());
        end_ += name.length;
    }

    // Appends the elements of a field; stops at the end of the buffer.
    template <Conversion conversion, std::uint32_t bitCount>
    NETFLOOR_INLINE void appendElements(const BitRange *ranges, std::uint32_t count, std::string_view separator) {
        for (std::uint32_t element = 0; element < count && !full(); ++element) {
            if (element > 0 && !separator.empty()) {
                std::memcpy(end_, separator.data(), separator.size());
                end_ += separator.size();
            }
            appendNumber<conversion, bitCount>(ranges[element].value);
        }
    }

    [[nodiscard]] NETFLOOR_INLINE bool full() const { return end_ > text_ + most; }

    // Ends the text, and gives it.
    NETFLOOR_INLINE const char *terminated() {
        text_[std::min<std::size_t>(static_cast<std::size_t>(end_ - text_), most)] = '\0';
        return text_;
    }

private:
    char *text_;
    char *end_; // the line itself lives in registers, the text in the buffer
};

template <const Field &field, const Format &format, std::size_t index>
NETFLOOR_INLINE inline void appendConversion(Line &line, std::uint32_t value, const FieldRecord &record) {
    constexpr Conversion conversion = format.conversion[index];
    if constexpr (conversion == Conversion::name || conversion == Conversion::briefName) {
        line.appendName<*field.names, conversion == Conversion::briefName>(value);
    } else if constexpr (conversion == Conversion::list) {
        line.appendElements<format.element, field.place.elementBits()>(
            record.ranges, field.place.isRun() ? record.rangeCount : field.place.elements(field.place.count),
            format.separator);
    } else {
        line.appendNumber<conversion, field.place.isRun() || field.place.scale != 1 ? 32 : field.place.width()>(value);
    }
}

// The most characters that a conversion writes, those past the end of the line included.
template <const Field &field, const Format &format, std::size_t index>
inline constexpr std::size_t mostWritten = [] {
    constexpr Conversion conversion = format.conversion[index];
    if constexpr (conversion == Conversion::none) {
        return std::size_t{0};
    } else if constexpr (conversion == Conversion::name || conversion == Conversion::briefName) {
        return nameTexts<*field.names, conversion == Conversion::briefName>[0].text.size();
    } else if constexpr (conversion == Conversion::list) {
        constexpr std::size_t element = mostDigits + format.separator.size();
        return field.place.isRun() ? Line::most + element : field.place.elements(field.place.count) * element;
    } else {
        return mostDigits;
    }
}();

// Builds the text of the field whose record this is.
template <const Field &field, const Format &format>
NETFLOOR_INLINE inline void fill(Line &line, const FieldRecord &record) {
    const std::uint32_t value = record.value;
    static_assert(format.literal[0].size() + mostWritten<field, format, 0> + format.literal[1].size() +
                          mostWritten<field, format, 1> + format.literal[2].size() <=
                      Line::most + Line::slack,
                  "the buffer has no room for what this field may write");
    line.appendLiteral<format.literal[0].size()>(format.literal[0].data());
    if constexpr (format.conversions > 0) {
        appendConversion<field, format, 0>(line, value, record);
        line.appendLiteral<format.literal[1].size()>(format.literal[1].data());
    }
    if constexpr (format.conversions > 1) {
        appendConversion<field, format, 1>(line, value, record);
        line.appendLiteral<format.literal[2].size()>(format.literal[2].data());
    }
}

} // namespace netfloor::plugin
