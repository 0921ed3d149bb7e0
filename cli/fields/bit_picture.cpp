// SPDX-License-Identifier: MIT
#include "fields/bit_picture.h"

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <string_view>
#include <vector>

#include "netfloor-host/sink.h"

namespace netfloor::cli {

namespace {

constexpr std::uint32_t bitsPerNibble = 4;
constexpr std::size_t bitsPerLine = 32;
constexpr std::string_view margin = "     ";

// The number of the bit that is drawn at a place, and the place of a bit, both from 1.
std::uint32_t mirrored(std::uint32_t bit) {
    return (bit - 1) / bitsPerOctet * bitsPerOctet + bitsPerOctet - (bit - 1) % bitsPerOctet;
}

// For each bit, as drawn, the piece that it belongs to, from 1, or 0 for a bit of another field; up to whole octets.
std::vector<std::size_t> drawnPieces(const FieldDescription &field) {
    const bool isNibbleRun = field.layout.kind == FieldLayout::Kind::variable && field.layout.step == bitsPerNibble;
    std::vector<std::size_t> drawn;
    std::size_t piece = 0;
    for (const BitSpan &span : field.layOut(1, std::max(field.layout.leastCount, isNibbleRun ? 2U : 1U))) {
        ++piece;
        const std::size_t octets = (span.last + bitsPerOctet - 1) / bitsPerOctet;
        drawn.resize(std::max(drawn.size(), octets * bitsPerOctet));
        for (std::uint32_t bit = span.first; bit <= span.last; ++bit) {
            drawn[mirrored(bit) - 1] = piece;
        }
    }
    return drawn;
}

std::string ruler(std::size_t bits) {
    std::string tens(margin);
    std::string ones(margin);
    for (std::uint32_t place = 1; place <= bits; ++place) {
        const std::uint32_t bit = mirrored(place);
        tens += ' ';
        tens += bit < 10 ? ' ' : static_cast<char>('0' + bit / 10);
        ones += ' ';
        ones += static_cast<char>('0' + bit % 10);
    }
    tens.resize(tens.find_last_not_of(' ') + 1);
    return (bits > bitsPerOctet ? tens + '\n' : "") + ones + '\n';
}

std::string border(std::size_t bits) {
    std::string line(margin);
    line += '+';
    for (std::size_t bit = 0; bit < bits; ++bit) {
        line += "-+";
    }
    return line + '\n';
}

} // namespace

std::string placeText(const FieldLayout &layout) {
    if (layout.kind == FieldLayout::Kind::none) {
        return "not told";
    }
    const bool isRow = layout.pieces == std::vector{BitSpan{1, layout.step}}; // one repeat is the next one's neighbour
    if (isRow && layout.mostCount != 1 && layout.step <= bitsPerOctet) {
        const std::string unit = layout.step == bitsPerNibble ? "nibble by nibble" : "octet by octet";
        if (layout.mostCount == 0) {
            return "from 1 on, " + unit + ", as far as the packet tells";
        }
        const std::string last = std::to_string(layout.advance(layout.mostCount));
        return (layout.leastCount == layout.mostCount ? "1-" + last : "from 1 up to " + last) + ", " + unit;
    }
    std::string text;
    for (const BitSpan &piece : layout.pieces) {
        text += (text.empty() ? "" : ", ") + std::to_string(piece.first);
        text += piece.first == piece.last ? "" : "-" + std::to_string(piece.last);
    }
    if (layout.mostCount == 1) {
        return text;
    }
    const std::string times =
        layout.mostCount == 0 ? "as often as the packet tells" : std::to_string(layout.mostCount) + " times";
    return text + ", " + times + ", " + std::to_string(layout.step) + " bits apart";
}

std::string bitPicture(const FieldDescription &field) {
    const std::vector<std::size_t> drawn = drawnPieces(field);
    std::string text = drawn.empty() ? "" : ruler(std::min(drawn.size(), bitsPerLine));
    for (std::size_t start = 0; start < drawn.size(); start += bitsPerLine) {
        const std::size_t end = std::min(start + bitsPerLine, drawn.size());
        text += start == 0 ? border(end) : "";
        text += margin;
        for (std::size_t bit = start; bit < end; ++bit) {
            text += bit == start || drawn[bit] != drawn[bit - 1] ? '|' : ' ';
            text += drawn[bit] == 0 ? '.' : 'x';
        }
        text += "|\n" + border(end - start);
    }
    return text;
}

} // namespace netfloor::cli
