// SPDX-License-Identifier: MIT
#include "output.h"

#include <array>
#include <cerrno>
#include <string>

#include <unistd.h>

namespace netfloor::cli {

namespace {

constexpr std::string_view digits = "0123456789abcdef";

constexpr std::string_view startOf(Style style) {
    switch (style) {
    case Style::dim: return "\x1b[2m";
    case Style::bold: return "\x1b[1m";
    case Style::good: return "\x1b[32m";
    case Style::warning: return "\x1b[33m";
    case Style::bad: return "\x1b[31m";
    case Style::plain: break;
    }
    return "";
}

constexpr bool isPrintable(unsigned char octet) {
    return octet >= 0x20 && octet < 0x7f;
}

// Whether all of eight characters are printable: none is below a blank, none is DEL, none has its top bit set. The
// subtraction borrows only from where the answer is no already.
bool areEightPrintable(const char *text) {
    constexpr std::uint64_t ones = 0x0101010101010101;
    std::uint64_t word = 0;
    std::memcpy(&word, text, sizeof word);
    const std::uint64_t tooSmall = word - ones * 0x20;
    const std::uint64_t tooLarge = word + ones;
    return ((word | tooSmall | tooLarge) & ones * 0x80) == 0;
}

} // namespace

void Output::octet(std::uint8_t octet) {
    char *const to = room(2);
    to[0] = digits[octet >> 4U];
    to[1] = digits[octet & 0xfU];
    size_ += 2;
}

void Output::untrusted(std::string_view text) {
    constexpr std::size_t step = 8;
    constexpr std::size_t mostEach = 4; // \x1b
    char *to = room(text.size() * mostEach + step);
    while (!text.empty()) {
        if (text.size() >= step && areEightPrintable(text.data())) {
            std::memcpy(to, text.data(), step);
            to += step;
            text.remove_prefix(step);
            continue;
        }
        const auto octet = static_cast<unsigned char>(text.front());
        text.remove_prefix(1);
        if (isPrintable(octet)) {
            *to++ = static_cast<char>(octet);
            continue;
        }
        for (const char character : {'\\', 'x', digits[octet >> 4U], digits[octet & 0xfU]}) {
            *to++ = character;
        }
    }
    advanceTo(to);
}

Output &Output::startStyle(Style style) {
    return *this << startOf(style);
}

void Output::rightAligned(std::string_view text, std::size_t width) {
    if (text.size() < width) {
        blanks(width - text.size());
    }
    *this << text;
}

void Output::rightAligned(std::uint64_t number, std::size_t width) {
    std::array<char, mostDigits> text;
    const char *const end = std::to_chars(text.data(), text.data() + text.size(), number).ptr;
    rightAligned(std::string_view(text.data(), end), width);
}

void Output::flush() {
    std::string_view rest(buffer_.data(), size_);
    while (!rest.empty()) {
        const ssize_t written = ::write(STDOUT_FILENO, rest.data(), rest.size());
        if (written >= 0) {
            rest.remove_prefix(static_cast<std::size_t>(written));
        } else if (errno == EPIPE) {
            throw OutputClosed();
        } else if (errno != EINTR) {
            throw OutputError(std::string("the output cannot be written: ") + std::strerror(errno) + ".");
        }
    }
    size_ = 0;
}

} // namespace netfloor::cli
