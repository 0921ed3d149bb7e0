// SPDX-License-Identifier: MIT
// Results on standard output: buffered, coloured on a terminal, and quiet when the reader goes away.
#pragma once

#include <array>
#include <charconv>
#include <concepts>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <memory>
#include <stdexcept>
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

// A number in hexadecimal, without leading zeros.
struct Hex {
    std::uint32_t number;
};

class Output {
public:
    // `eachPacket`: flush after each packet, for who waits in front of a live capture.
    Output(bool colour, bool eachPacket) : colour_(colour), eachPacket_(eachPacket) { grow(firstRoom); }

    Output &operator<<(std::string_view text);
    // A literal is copied in place, by an instruction or two.
    template <std::size_t Size>
    [[gnu::always_inline]] Output &operator<<(const char (&literal)[Size]) {
        return append({literal, Size - 1});
    }
    [[gnu::always_inline]] Output &operator<<(char character) {
        char *const to = room(1);
        *to = character;
        next_ = to + 1;
        return *this;
    }
    Output &operator<<(std::uint64_t number) { return decimal(number); }
    Output &operator<<(std::uint32_t number) { return decimal(number); }
    Output &operator<<(Hex value) {
        char *const to = room(mostDigits);
        return advanceTo(std::to_chars(to, to + mostDigits, value.number, 16).ptr);
    }

    // "1 octet", "2 octets".
    Output &count(std::uint64_t number, std::string_view thing) {
        *this << number << ' ' << thing;
        return number == 1 ? *this : *this << 's';
    }

    // Two digits.
    void octet(std::uint8_t octet);

    // Text that came out of a packet, after blanks: what a terminal would not just print is shown as \x1b.
    void untrusted(std::string_view text, std::size_t blanksBefore = 0) {
        if (char *const end = copiedAfter(blanksBefore, text)) {
            next_ = end;
        } else {
            untrustedOrEscaped(text, blanksBefore);
        }
    }
    // The same, and the end of the line. Inside its callers, as nearly all of a detailed view is such lines.
    [[gnu::always_inline]] void untrustedLine(std::string_view text, std::size_t blanksBefore) {
        if (char *const end = copiedAfter(blanksBefore, text)) {
            *end = '\n';
            next_ = end + 1;
        } else {
            untrustedOrEscaped(text, blanksBefore);
            *this << '\n';
        }
    }

    // What stands between the two is in that style, if there is colour.
    Output &start(Style style) { return colour_ ? startStyle(style) : *this; }
    Output &stop(Style style) { return colour_ && style != Style::plain ? *this << "\x1b[0m" : *this; }
    void styled(Style style, std::string_view text) { (start(style) << text).stop(style); }
    // A line of that style.
    [[gnu::always_inline]] void styledLine(Style style, std::string_view text, std::size_t blanksBefore) {
        if (!colour_) {
            return untrustedLine(text, blanksBefore);
        }
        blanks(blanksBefore);
        startStyle(style).untrusted(text);
        stop(style) << '\n';
    }

    // Blanks up to `width`, then the text or the number.
    void rightAligned(std::string_view text, std::size_t width);
    void rightAligned(std::uint64_t number, std::size_t width);
    void blanks(std::size_t count) { next_ = roomAfterBlanks(count, 0); }
    void repeated(char character, std::size_t count) {
        char *const to = room(count);
        std::memset(to, character, count);
        next_ = to + count;
    }

    // A place in the text, up to which it can be taken back or looked at until `mayFlush`, `endPacket` or `flush`.
    using Mark = std::size_t;
    [[nodiscard]] Mark mark() const { return static_cast<std::size_t>(next_ - buffer_.data()); }
    void takeBack(Mark mark) { next_ = buffer_.data() + mark; }
    void erase(Mark from, std::size_t count) {
        const std::string_view rest = since(from + count);
        std::memmove(buffer_.data() + from, rest.data(), rest.size());
        next_ -= count;
    }
    [[nodiscard]] std::string_view since(Mark mark) const { return {buffer_.data() + mark, next_}; }

    // The text may leave the buffer, which grows as long as it may not. Throws OutputClosed and OutputError.
    void mayFlush() {
        if (mark() >= flushAt_) {
            flush();
        }
    }

    // Octets that are written before they are read: those that are not used take no memory.
    class Room {
    public:
        Room() = default;
        explicit Room(std::size_t size) : octets_(std::make_unique_for_overwrite<char[]>(size)), size_(size) {}
        [[nodiscard]] char *data() const { return octets_.get(); }
        [[nodiscard]] std::size_t size() const { return size_; }

    private:
        std::unique_ptr<char[]> octets_;
        std::size_t size_ = 0;
    };

    // Text that is written elsewhere or later.
    struct Text {
        Room room;
        std::size_t octets = 0;
        [[nodiscard]] std::string_view view() const { return {room.data(), octets}; }
    };
    // From now on nothing leaves the buffer.
    void keepAll() { flushAt_ = static_cast<std::size_t>(-1); }
    // Gives all text, and takes the room of an earlier one for what follows.
    void exchange(Text &text);
    // Writes text that stands elsewhere, after the buffer. Throws OutputClosed and OutputError.
    void writeThrough(std::string_view text);

    // A packet, or the whole, is through. Both throw OutputClosed and OutputError.
    void endPacket() { eachPacket_ ? flush() : mayFlush(); }
    void flush();

private:
    // Larger blocks take the kernel no less time; with 256 KiB it takes a sixth more.
    static constexpr std::size_t flushOctets = std::size_t{512} * 1024;
    static constexpr std::size_t firstRoom = flushOctets + std::size_t{64} * 1024;
    static constexpr std::size_t mostDigits = 24;
    static constexpr std::size_t usualBlanks = 32;

    // As many characters as a register of nearly all machines holds, and half of them.
    using Characters [[gnu::vector_size(16)]] = unsigned char;
    using SignedCharacters [[gnu::vector_size(16)]] = signed char;

    // Has the top bit of an octet set if one of the characters is not printable: below a blank, DEL, or with its own
    // top bit set. A borrow or a carry goes only to octets above one for which the answer is known already.
    template <std::unsigned_integral Word>
    [[nodiscard]] static constexpr Word unprintableIn(Word word) {
        constexpr Word ones = static_cast<Word>(0x0101010101010101);
        return (word | (word - ones * 0x20) | (word + ones)) & ones * 0x80;
    }
    // The same. One more than a printable character is a positive number above a blank; one more than any other is not.
    [[nodiscard]] static constexpr Characters unprintableIn(Characters characters) {
        return Characters(SignedCharacters(characters + 1) <= ' ');
    }
    [[nodiscard]] static constexpr bool isPrintable(unsigned char octet) { return octet >= 0x20 && octet < 0x7f; }

    [[nodiscard]] static bool isAnySet(std::unsigned_integral auto word) { return word != 0; }
    [[nodiscard]] static bool isAnySet(Characters characters) {
        std::array<std::uint64_t, 2> words;
        std::memcpy(words.data(), &characters, sizeof characters);
        return (words[0] | words[1]) != 0;
    }

    // Copies a piece and gives what is not printable in it.
    template <typename Piece>
    [[nodiscard, gnu::always_inline]] static Piece copyPiece(const char *from, char *to) {
        Piece piece;
        std::memcpy(&piece, from, sizeof piece);
        std::memcpy(to, &piece, sizeof piece);
        return unprintableIn(piece);
    }
    // Copies a text of at least one piece and tells whether all of it is printable, in one go.
    template <typename Piece>
    [[nodiscard, gnu::always_inline]] static bool copyPieces(std::string_view text, char *to) {
        const std::size_t last = text.size() - sizeof(Piece); // overlaps the piece before
        auto found = copyPiece<Piece>(text.data() + last, to + last);
        for (std::size_t at = 0; at < last; at += sizeof(Piece)) {
            found |= copyPiece<Piece>(text.data() + at, to + at);
        }
        return !isAnySet(found);
    }
    [[nodiscard, gnu::always_inline]] static bool copyPrintable(std::string_view text, char *to) {
        return text.size() >= sizeof(Characters) ? copyPieces<Characters>(text, to) : copyShort(text, to);
    }
    [[nodiscard]] static bool copyShort(std::string_view text, char *to) {
        if (text.size() >= sizeof(std::uint64_t)) {
            return copyPieces<std::uint64_t>(text, to);
        }
        if (text.size() >= sizeof(std::uint32_t)) {
            return copyPieces<std::uint32_t>(text, to);
        }
        bool all = true;
        for (std::size_t i = 0; i < text.size(); ++i) {
            all &= isPrintable(static_cast<unsigned char>(text[i]));
            to[i] = text[i];
        }
        return all;
    }
    // Puts blanks and the text after what is there, with room for one more character, and gives the end of it. They
    // are not part of the text yet. Null where that takes more than a few instructions: for room, many blanks, or what
    // is not printable.
    [[nodiscard, gnu::always_inline]] char *copiedAfter(std::size_t blanks, std::string_view text) {
        if (blanks > usualBlanks || roomLeft() <= usualBlanks + text.size()) {
            return nullptr;
        }
        std::memset(next_, ' ', usualBlanks); // of a known size, which is one or two instructions
        char *const to = next_ + blanks;
        return copyPrintable(text, to) ? to + text.size() : nullptr;
    }
    void untrustedOrEscaped(std::string_view text, std::size_t blanksBefore);
    void escaped(std::string_view text);

    [[nodiscard]] std::size_t roomLeft() const { return static_cast<std::size_t>(limit_ - next_); }
    // The end of the text, with room for so many octets.
    [[nodiscard]] char *room(std::size_t octets) {
        if (roomLeft() < octets) {
            grow(octets);
        }
        return next_;
    }
    // The end of so many blanks after the text, with room for so many octets. They are not part of the text yet.
    [[nodiscard]] char *roomAfterBlanks(std::size_t blanks, std::size_t octets) {
        char *const to = room(blanks + usualBlanks + octets);
        if (blanks > usualBlanks) {
            std::memset(to, ' ', blanks);
        } else {
            std::memset(to, ' ', usualBlanks); // as above
        }
        return to + blanks;
    }
    [[gnu::always_inline]] Output &append(std::string_view text) {
        char *const to = room(text.size());
        if (!text.empty()) { // which may have no address, and memcpy wants one
            std::memcpy(to, text.data(), text.size());
        }
        return advanceTo(to + text.size());
    }
    Output &advanceTo(char *end) {
        next_ = end;
        return *this;
    }
    template <typename Number>
    Output &decimal(Number number) {
        constexpr Number base = 10;
        if (number < base) { // as many are
            return *this << static_cast<char>('0' + number);
        }
        char *const to = room(mostDigits);
        return advanceTo(std::to_chars(to, to + mostDigits, number).ptr);
    }
    void grow(std::size_t octets);
    Output &startStyle(Style style);

    bool colour_;
    bool eachPacket_;
    std::size_t flushAt_ = flushOctets;
    Room buffer_;
    char *next_ = nullptr; // the end of the text in it
    char *limit_ = nullptr;
};

} // namespace netfloor::cli
