// SPDX-License-Identifier: MIT
#include "output.h"
#include "text.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <string>

#include <unistd.h>

namespace netfloor::cli {

namespace {

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

constexpr std::size_t wordOctets = 8;

std::uint64_t loadWord(const char *text) {
    std::uint64_t word = 0;
    std::memcpy(&word, text, sizeof word);
    return word;
}

// Has the top bit of an octet set if one of the characters is not printable: below a blank, DEL, or with its own top
// bit set. A borrow or a carry goes only to octets above one for which the answer is known already.
constexpr std::uint64_t unprintableIn(std::uint64_t word) {
    constexpr std::uint64_t ones = 0x0101010101010101;
    return (word | (word - ones * 0x20) | (word + ones)) & ones * 0x80;
}

bool areAllPrintable(std::string_view text) {
    if (text.size() < wordOctets) {
        bool all = true;
        for (const char character : text) {
            all &= isPrintable(static_cast<unsigned char>(character));
        }
        return all;
    }
    std::uint64_t found = unprintableIn(loadWord(text.data() + text.size() - wordOctets));
    for (std::size_t i = 0; i + wordOctets < text.size(); i += wordOctets) {
        found |= unprintableIn(loadWord(text.data() + i));
    }
    return found == 0;
}

void writeOut(std::string_view text) {
    while (!text.empty()) {
        const ssize_t written = ::write(STDOUT_FILENO, text.data(), text.size());
        if (written >= 0) {
            text.remove_prefix(static_cast<std::size_t>(written));
        } else if (errno == EPIPE) {
            throw OutputClosed();
        } else if (errno != EINTR) {
            throw OutputError(std::string("the output cannot be written: ") + std::strerror(errno) + ".");
        }
    }
}

} // namespace

void Output::octet(std::uint8_t octet) {
    char *const to = room(2);
    to[0] = hexDigits[octet >> 4U];
    to[1] = hexDigits[octet & 0xfU];
    next_ = to + 2;
}

void Output::untrusted(std::string_view text) {
    if (areAllPrintable(text)) {
        *this << text;
        return;
    }
    for (const char character : text) {
        const auto octet = static_cast<unsigned char>(character);
        if (isPrintable(octet)) {
            *this << character;
        } else {
            *this << '\\' << 'x' << hexDigits[octet >> 4U] << hexDigits[octet & 0xfU];
        }
    }
}

void Output::grow(std::size_t octets) {
    const std::size_t size = mark();
    buffer_.resize(2 * buffer_.size() + octets);
    next_ = buffer_.data() + size;
    limit_ = buffer_.data() + buffer_.size();
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
    writeOut(since(0));
    next_ = buffer_.data();
}

void Output::writeThrough(std::string_view text) {
    flush();
    writeOut(text);
}

void Output::exchange(Text &text) {
    text.octets = mark();
    buffer_.swap(text.room);
    buffer_.resize(std::max(buffer_.size(), firstRoom));
    next_ = buffer_.data();
    limit_ = buffer_.data() + buffer_.size();
}

} // namespace netfloor::cli
