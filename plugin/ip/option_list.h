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
#include "frame/field_step.h"

namespace netfloor::plugin {

// The octets in which the options stand.
struct OptionArea {
    std::int32_t octets; // still to decode; below 0 where an option says that it is longer than the area
    bool taken = false;  // an option was taken in this round

    void take(std::int32_t optionOctets) {
        octets -= optionOctets;
        taken = true;
    }
};

// The place of every type in the order of turns; behind the last one where the type is not known.
template <std::size_t count>
[[nodiscard]] consteval std::array<std::uint8_t, 256> turnsOf(const std::array<std::uint8_t, count> &types) {
    std::array<std::uint8_t, 256> turns{};
    turns.fill(count);
    for (std::size_t turn = 0; turn < count; ++turn) {
        turns[types[turn]] = static_cast<std::uint8_t>(turn);
    }
    return turns;
}

template <const auto &types>
inline constexpr auto turnOf = turnsOf(types);

// Looks whose turn, from `turn` on, takes the option under the cursor: types.size() where none does.
template <const auto &types, class Pass>
[[nodiscard]] NETFLOOR_INLINE inline std::size_t nextTaker(Reader<Pass> &reader, std::size_t turn) {
    const std::optional<std::uint32_t> type = peek(reader, octets(1));
    if (!type || turnOf<types>[*type] < turn) {
        return types.size();
    }
    return turnOf<types>[*type];
}

// An option of one octet.
template <const Field &type, class Pass>
NETFLOOR_INLINE inline void optionOfOneOctet(Reader<Pass> &reader, BlockName name, OptionArea &area) {
    const Block<Pass> option{reader, name};
    read<type>(reader);
    if (reader.live) {
        area.take(1);
    }
}

// The block of an option with a length: its limit is read ahead.
template <class Pass>
class [[nodiscard]] OptionBlock : public LimitedBlock<Pass> {
public:
    NETFLOOR_INLINE OptionBlock(Reader<Pass> &reader, BlockName name) : LimitedBlock<Pass>(reader, name) {
        this->limit(peek(reader, piece(8, 15)).value_or(0) * bitsPerOctet);
    }
};

// Reads the type and the length of an option, which counts for as many octets as its length says.
template <const Field &type, const Field &length, class Pass>
NETFLOOR_INLINE inline void optionHead(Reader<Pass> &reader, OptionArea &area) {
    read<type>(reader);
    std::int32_t lengthOctets = 0;
    read<length>(reader, &lengthOctets);
    if (reader.live) {
        area.take(lengthOctets);
    }
}

// The same for an option that counts for a fixed number of octets, whatever its length says.
template <const Field &type, const Field &length, class Pass>
NETFLOOR_INLINE inline void optionHead(Reader<Pass> &reader, OptionArea &area, std::int32_t countedOctets) {
    read<type>(reader);
    read<length>(reader);
    if (reader.live) {
        area.take(countedOctets);
    }
}

} // namespace netfloor::plugin
