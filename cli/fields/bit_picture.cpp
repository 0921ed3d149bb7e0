// SPDX-License-Identifier: MIT
#include "fields/bit_picture.h"

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <string_view>

namespace netfloor::cli {

namespace {

constexpr std::size_t bitsPerOctet = 8;
constexpr std::size_t bitsPerLine = 32;
constexpr std::string_view margin = "     ";

// The letters of all bits in the order in which they are drawn, up to whole octets.
std::string letters(const FieldDescription &field) {
    constexpr std::string_view alphabet = "abcdefghijklmnopqrstuvwxyzABCDEFGHIJKLMNOPQRSTUVWXYZ";
    std::string drawn;
    std::size_t piece = 0;
    for (const BitSpan &span : field.layOut(1, std::max(field.layout.leastCount, 1u))) {
        drawn.resize(std::max(drawn.size(), (span.last + bitsPerOctet - 1) / bitsPerOctet * bitsPerOctet), '.');
        for (std::size_t bit = span.first - 1; bit < span.last; ++bit) {
            const std::size_t inOctet = bitsPerOctet - 1 - bit % bitsPerOctet;
            drawn[bit / bitsPerOctet * bitsPerOctet + inOctet] = alphabet[piece % alphabet.size()];
        }
        ++piece;
    }
    return drawn;
}

std::string ruler(std::size_t bits) {
    std::string tens(margin);
    std::string ones(margin);
    for (std::size_t bit = 0; bit < bits; ++bit) {
        tens += ' ';
        tens += bit % 10 == 0 ? static_cast<char>('0' + bit / 10) : ' ';
        ones += ' ';
        ones += static_cast<char>('0' + bit % 10);
    }
    tens.resize(tens.find_last_not_of(' ') + 1);
    return tens + '\n' + ones + '\n';
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
    std::string text;
    for (const BitSpan &piece : layout.pieces) {
        text += (text.empty() ? "" : ", ") + std::to_string(piece.first);
        text += piece.first == piece.last ? "" : "-" + std::to_string(piece.last);
    }
    if (layout.mostCount == 1) {
        return text;
    }
    const std::string step = std::to_string(layout.step) + " bits apart";
    if (layout.mostCount == 0) {
        return text + ", as often as the packet tells, " + step;
    }
    const std::string least = layout.leastCount == layout.mostCount ? "" : std::to_string(layout.leastCount) + " to ";
    return text + ", " + least + std::to_string(layout.mostCount) + " times, " + step;
}

std::string bitPicture(const FieldDescription &field) {
    const std::string drawn = letters(field);
    if (drawn.empty()) {
        return {};
    }
    std::string text = ruler(std::min(drawn.size(), bitsPerLine));
    for (std::size_t start = 0; start < drawn.size(); start += bitsPerLine) {
        const std::string line = drawn.substr(start, bitsPerLine);
        if (start == 0) {
            text += border(line.size());
        }
        text += margin;
        for (std::size_t bit = 0; bit < line.size(); ++bit) {
            text += bit == 0 || line[bit] != line[bit - 1] ? '|' : ' ';
            text += line[bit];
        }
        text += "|\n" + border(line.size());
    }
    return text;
}

} // namespace netfloor::cli
