// SPDX-License-Identifier: MIT
#include "output.h"

#include <cerrno>
#include <cstring>

#include <unistd.h>

namespace netfloor::cli {

namespace {

constexpr std::size_t flushOctets = std::size_t{64} * 1024;

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

} // namespace

void Output::untrusted(std::string_view text) {
    constexpr std::string_view digits = "0123456789abcdef";
    for (const char character : text) {
        const auto octet = static_cast<unsigned char>(character);
        if (octet >= 0x20 && octet < 0x7f) {
            buffer_ += character;
        } else {
            buffer_ += {'\\', 'x', digits[octet >> 4U], digits[octet & 0xfU]};
        }
    }
}

void Output::styled(Style style, std::string_view text) {
    if (!colour_ || style == Style::plain) {
        buffer_ += text;
        return;
    }
    buffer_ += startOf(style);
    buffer_ += text;
    buffer_ += "\x1b[0m";
}

void Output::rightAligned(std::string_view text, std::size_t width) {
    if (text.size() < width) {
        blanks(width - text.size());
    }
    buffer_ += text;
}

void Output::endPacket() {
    if (eachPacket_ || buffer_.size() >= flushOctets) {
        flush();
    }
}

void Output::flush() {
    std::string_view rest = buffer_;
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
    buffer_.clear();
}

} // namespace netfloor::cli
