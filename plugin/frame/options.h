// SPDX-License-Identifier: MIT
// Option lists behind a header, as IPv4 (RFC 791) and TCP (RFC 9293) have them: each option starts with an
// octet that says its type, and all but the shortest go on with an octet that says its length.
//
//   +--------+     +--------+--------+---------------+
//   |  type  |     |  type  | length |     data      |
//   +--------+     +--------+--------+---------------+
//
// A list is read in rounds. In a round each known type has its turn once, in a fixed order, and takes the option
// under the cursor if it is its own; so a round takes several options where they stand in that order.
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <optional>

#include "frame/block.h"
#include "frame/field.h"
#include "frame/step.h"

namespace netfloor {

// The octets in which the options stand.
struct OptionArea {
    std::int32_t octets; // still to decode; below 0 where an option says that it is longer than the area
    bool taken = false;  // an option was taken in this round
};

// The place of every type in the order of turns; behind the last one where the type is not known.
template <std::size_t count>
[[nodiscard]] consteval std::array<std::uint8_t, 256> turnsOf(const std::array<std::uint8_t, count>& types) {
    std::array<std::uint8_t, 256> turns{};
    turns.fill(count);
    for (std::size_t turn = 0; turn < count; ++turn) {
        turns[types[turn]] = static_cast<std::uint8_t>(turn);
    }
    return turns;
}

template <const auto& types> inline constexpr auto turnOf = turnsOf(types);

// Looks whose turn, from `turn` on, takes the option under the cursor: types.size() where none does.
template <const auto& types, class Pass>
[[nodiscard]] NETFLOOR_INLINE inline std::size_t nextTaker(Reader<Pass>& at, std::size_t turn) {
    const std::optional<std::uint32_t> type = look(at, octets(1));
    if (!type || turnOf<types>[*type] < turn) {
        return types.size();
    }
    return turnOf<types>[*type];
}

// An option of one octet.
template <const Field& type, class Pass>
NETFLOOR_INLINE inline void optionOfOneOctet(Reader<Pass>& at, BlockName name, OptionArea& area) {
    const Block<Pass> option{at, name};
    read<type>(at);
    if (at.live) {
        area.octets -= 1;
        area.taken = true;
    }
}

// The option counts for as many octets as its length says.
inline constexpr std::int32_t countsByLength = -1;

// An option with a length, which is read ahead as the block's limit. Only an option whose length reaches behind
// itself counts as taken. `data` reads what stands behind the length.
template <const Field& type, const Field& length, std::int32_t counts = countsByLength, class Pass, class Data>
NETFLOOR_INLINE inline void optionWithLength(Reader<Pass>& at, BlockName name, OptionArea& area, Data data) {
    LimitedBlock<Pass> option{at, name};
    option.limit(look(at, piece(8, 15)).value_or(0) * bitsPerOctet);
    std::int32_t lengthOctets = 0;
    read<type>(at);
    read<length>(at, &lengthOctets);
    if (at.live) {
        area.octets -= counts == countsByLength ? lengthOctets : counts;
        area.taken = true;
    }
    data();
}

} // namespace netfloor
