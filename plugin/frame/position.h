// SPDX-License-Identifier: MIT
// Where a reader is, and how the run stands: what goes along when a production runs out of line.
//
// Two questions are kept apart. `live` says whether the grammar can still read: a field that does not fit
// clears it, later fields are skipped, and blocks close in the normal way. `outcome` says whether the run
// itself goes on. Once it has ended, nothing has an effect any more, neither fields nor the closing of blocks,
// so that productions need no test for it: they run out.
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <string_view>

#include "frame/inline.h"

namespace netfloor::plugin {

// Whether the run goes on.
enum class Outcome : std::uint8_t {
    running,
    stopped, // at a hand-off, from which the host goes on by itself
    cutOff,  // storage ran out, or the host refused
};

// The name of a block: a literal. Compilers know its length where they know which one it is.
struct BlockName {
    const char *text = nullptr;

    BlockName() = default;
    template <std::size_t octets>
    consteval BlockName(const char (&literal)[octets]) : text(literal) {}
    // The name of a value, which is a literal too.
    constexpr explicit BlockName(std::string_view literal) : text(literal.data()) {}

    // Copies the name and its terminating zero.
    NETFLOOR_INLINE void copyTo(char *buffer) const { std::memcpy(buffer, text, std::strlen(text) + 1); }
};

struct Position {
    std::uint32_t cursor = 0; // the next bit, counted from 1
    std::uint32_t left = 0;   // bits from the cursor to the limit
    std::uint32_t blockDepth = 0;
    std::uint32_t limitDepth = 0;
    bool live = true;
    Outcome outcome = Outcome::running;
    bool unchecked = false;     // a flag was raised that the verdict has not taken in yet
    std::uint32_t bitOrder = 0; // 8 where the bits of each octet are read reversed
    BlockName block = {};       // name of the innermost open block
    BlockName fieldBlock = {};  // block of the last field, whose name the state is still to get

    // A copy, member by member: as a whole it would go through memory in pieces that were just written in smaller ones,
    // which processors wait for.
    [[nodiscard]] NETFLOOR_INLINE Position position() const {
        return {cursor, left, blockDepth, limitDepth, live, outcome, unchecked, bitOrder, block, fieldBlock};
    }

    [[nodiscard]] NETFLOOR_INLINE bool ended() const { return outcome != Outcome::running; }
};

} // namespace netfloor::plugin
