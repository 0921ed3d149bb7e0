// SPDX-License-Identifier: MIT
// Results on standard output: buffered, coloured on a terminal, and quiet when the reader goes away.
#pragma once

#include <cstdint>
#include <stdexcept>
#include <string>
#include <string_view>

namespace netfloor::cli {

// Whoever reads the output has closed it.
class OutputClosed {};

// The output cannot be written. what() is a sentence for the user.
class OutputError : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

enum class Style : std::uint8_t { plain, dim, bold, good, warning, bad };

class Output {
public:
    // `eachPacket`: flush behind each packet, for who waits in front of a live capture.
    Output(bool colour, bool eachPacket) : colour_(colour), eachPacket_(eachPacket) {}

    Output &operator<<(std::string_view text) {
        buffer_ += text;
        return *this;
    }
    Output &operator<<(char character) {
        buffer_ += character;
        return *this;
    }
    Output &operator<<(std::uint64_t number) { return *this << std::string_view(std::to_string(number)); }

    // Text that came out of a packet: what a terminal would not just print is shown as \x1b.
    void untrusted(std::string_view text);

    void styled(Style style, std::string_view text);

    // Blanks up to `width`, then `text`.
    void rightAligned(std::string_view text, std::size_t width);
    void blanks(std::size_t count) { buffer_.append(count, ' '); }

    // A packet, or the whole, is through. Both throw OutputClosed and OutputError.
    void endPacket();
    void flush();

private:
    std::string buffer_;
    bool colour_;
    bool eachPacket_;
};

} // namespace netfloor::cli
