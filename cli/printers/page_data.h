// SPDX-License-Identifier: MIT
// The data of the page that `netfloor html` makes, as its script reads them (page/data.js). Each line is a letter and
// a JSON value:
//
//   f  {"version":...,"filter":...,"where":...,"files":[...]}    once, the first line
//   n  "label"                                    the next label; items name labels by their index, from 0 on
//   t  [item, ...]                                the tree of a packet
//   o  "octets in base64"                         of the packet as captured
//   p  [number, time, octets, protocol, source, destination, text, state, octet of the IP header, file]    ends a
//      packet; without the file where there is one
//   e  {"total":...,"remarks":[...]}              once, the last line
//
//   item: [4 * depth + kind, label, value, first bit, bits, first bit, bits, ...]
//
// A label is an index, or a string where there are too many of them. The value and the bits may be missing. Bits count
// from the IP header on. A page that was not written to its end shows the packets whose line `p` it has.
#pragma once

#include <cstdint>
#include <functional>
#include <span>
#include <string>
#include <string_view>
#include <unordered_map>
#include <vector>

#include "output.h"

namespace netfloor::cli {

// Text that came from outside as a JSON string in UTF-8. No part of it can end the element of the page in which it
// stands. What is no character, or none to be seen, is shown as \x1b.
void writePageText(Output &out, std::string_view text);

void writeBase64(Output &out, std::span<const std::uint8_t> octets);

class PageItems {
public:
    enum class Kind : std::uint8_t { block, field, note, damage };

    explicit PageItems(Output &out) : out_(out) {}

    // The line `t` of a packet.
    void begin();
    void end();

    // An item, in this order: start, value (if any), bits (any number), close.
    void start(Kind kind, std::uint32_t depth, std::string_view label);
    void value(std::string_view text);
    void bits(std::uint32_t first, std::uint32_t count);
    void close() { out_ << ']'; }

    // The lines `n` of the labels that were new since the last call.
    void writeNewLabels();

private:
    struct Hash {
        using is_transparent = void;
        std::size_t operator()(std::string_view text) const { return std::hash<std::string_view>()(text); }
    };

    void writeLabel(std::string_view label);

    Output &out_;
    std::unordered_map<std::string, std::uint32_t, Hash, std::equal_to<>> labels_;
    std::vector<std::string_view> newLabels_; // keys of labels_
    bool isFirst_ = true;
};

} // namespace netfloor::cli
