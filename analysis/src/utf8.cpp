// SPDX-License-Identifier: MIT
#include "netfloor-analysis/utf8.h"

#include <algorithm>
#include <cstdint>

namespace netfloor {
namespace {

bool isContinuation(unsigned char octet) {
    return (octet & 0xc0U) == 0x80;
}

bool isPlain(char character) {
    const auto octet = static_cast<unsigned char>(character);
    return octet != 0 && octet < 0x80;
}

} // namespace

std::size_t utf8Octets(std::string_view text) {
    const auto octet = [text](std::size_t place) { return static_cast<unsigned char>(text[place]); };
    const unsigned char first = octet(0);
    if (first < 0x80) {
        return 1;
    }
    const std::size_t octets = first >= 0xc2 && first < 0xe0   ? 2
                               : first >= 0xe0 && first < 0xf0 ? 3
                               : first >= 0xf0 && first < 0xf5 ? 4
                                                               : 0;
    if (octets == 0 || octets > text.size()) {
        return 0;
    }
    for (std::size_t place = 1; place < octets; ++place) {
        if (!isContinuation(octet(place))) {
            return 0;
        }
    }
    // Longer than it needs to be, a half of a UTF-16 pair, above the last character.
    const unsigned char second = octet(1);
    const bool isWrong = (first == 0xe0 && second < 0xa0) || (first == 0xed && second >= 0xa0) ||
                         (first == 0xf0 && second < 0x90) || (first == 0xf4 && second >= 0x90);
    return isWrong ? 0 : octets;
}

std::string_view asUtf8(std::string_view text, std::string &room) {
    if (std::ranges::all_of(text, isPlain)) {
        return text;
    }
    room.clear();
    while (!text.empty()) {
        const std::size_t octets = text.front() == 0 ? 0 : utf8Octets(text);
        room += octets == 0 ? replacementCharacter : text.substr(0, octets);
        text.remove_prefix(std::max<std::size_t>(1, octets));
    }
    return room;
}

} // namespace netfloor
