// SPDX-License-Identifier: MIT
#include "messages.h"
#include "text.h"

#include <algorithm>
#include <iostream>

namespace netfloor::cli {

namespace {

unsigned char octetAt(std::string_view text, std::size_t at) {
    return at < text.size() ? static_cast<unsigned char>(text[at]) : '\0';
}

// The octets of a character of UTF-8, by its first octet; 0 for none.
std::size_t lengthBy(unsigned char first) {
    if (first < 0x80) {
        return 1;
    }
    if (first < 0xc2 || first > 0xf4) {
        return 0;
    }
    return first < 0xe0 ? 2 : first < 0xf0 ? 3 : 4;
}

// The octets of the printable character at the start of the text; 0 where there is none.
std::size_t printableAtStart(std::string_view text) {
    const unsigned char first = octetAt(text, 0);
    const std::size_t length = lengthBy(first);
    if (length == 1) {
        return first == '\n' || (first >= 0x20 && first != 0x7f) ? 1 : 0;
    }
    for (std::size_t i = 1; i < length; ++i) {
        if ((octetAt(text, i) & 0xc0U) != 0x80) {
            return 0;
        }
    }
    const bool isControl = first == 0xc2 && octetAt(text, 1) < 0xa0; // U+0080 to U+009F
    return isControl ? 0 : length;
}

} // namespace

std::string withoutControls(std::string_view text) {
    std::string printable;
    while (!text.empty()) {
        const std::size_t length = printableAtStart(text);
        if (length == 0) {
            const unsigned char octet = octetAt(text, 0);
            printable += {'\\', 'x', hexDigits[octet >> 4U], hexDigits[octet & 0xfU]};
        } else {
            printable += text.substr(0, length);
        }
        text.remove_prefix(std::max<std::size_t>(length, 1));
    }
    return printable;
}

PrintableErrors::PrintableErrors() : target_(std::cerr.rdbuf(this)) {}

PrintableErrors::~PrintableErrors() {
    std::cerr.rdbuf(target_);
}

PrintableErrors::int_type PrintableErrors::overflow(int_type character) {
    const char one = traits_type::to_char_type(character);
    return xsputn(&one, 1) == 1 ? character : traits_type::eof();
}

std::streamsize PrintableErrors::xsputn(const char *text, std::streamsize octets) {
    const std::string printable = withoutControls({text, static_cast<std::size_t>(octets)});
    const auto size = static_cast<std::streamsize>(printable.size());
    return target_->sputn(printable.data(), size) == size ? octets : 0;
}

int PrintableErrors::sync() {
    return target_->pubsync();
}

} // namespace netfloor::cli
