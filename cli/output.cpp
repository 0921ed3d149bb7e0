// SPDX-License-Identifier: MIT
#include "output.h"
#include "text.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <string>
#include <utility>

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

Output &Output::operator<<(std::string_view text) {
    return append(text);
}

void Output::octet(std::uint8_t octet) {
    char *const to = room(2);
    to[0] = hexDigits[octet >> 4U];
    to[1] = hexDigits[octet & 0xfU];
    next_ = to + 2;
}

void Output::escaped(std::string_view text) {
    for (const char character : text) {
        const auto octet = static_cast<unsigned char>(character);
        if (isPrintable(octet)) {
            *this << character;
        } else {
            *this << '\\' << 'x' << hexDigits[octet >> 4U] << hexDigits[octet & 0xfU];
        }
    }
}

void Output::untrustedOrEscaped(std::string_view text, std::size_t blanksBefore) {
    blanks(blanksBefore);
    (void)room(usualBlanks + text.size() + 1);
    if (char *const end = copiedAfter(0, text)) {
        next_ = end;
    } else {
        escaped(text);
    }
}

void Output::grow(std::size_t octets) {
    const std::size_t size = mark();
    Room larger(2 * buffer_.size() + octets);
    std::copy_n(buffer_.data(), size, larger.data());
    buffer_ = std::move(larger);
    next_ = buffer_.data() + size;
    limit_ = buffer_.data() + buffer_.size();
}

Output &Output::startStyle(Style style) {
    return *this << startOf(style);
}

void Output::rightAligned(std::string_view text, std::size_t width) {
    char *const to = roomAfterBlanks(text.size() < width ? width - text.size() : 0, text.size());
    if (!text.empty()) {
        std::memcpy(to, text.data(), text.size());
    }
    next_ = to + text.size();
}

void Output::rightAligned(std::uint64_t number, std::size_t width) {
    constexpr std::uint64_t base = 10;
    char *const end = roomAfterBlanks(width, 0);
    std::uint64_t rest = number;
    std::size_t digits = 0;
    do {
        end[-static_cast<std::ptrdiff_t>(++digits)] = static_cast<char>('0' + rest % base);
        rest /= base;
    } while (rest != 0 && digits < width);
    if (rest == 0) {
        next_ = end;
    } else { // it is wider
        *this << number;
    }
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
    std::swap(buffer_, text.room);
    if (buffer_.size() < firstRoom) {
        buffer_ = Room(firstRoom);
    }
    next_ = buffer_.data();
    limit_ = buffer_.data() + buffer_.size();
}

} // namespace netfloor::cli
