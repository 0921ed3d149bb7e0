// SPDX-License-Identifier: MIT
// The option list after a header, as in IPv4 (RFC 791) and TCP (RFC 9293). Each option starts with an octet for its
// type. An octet for its length follows, except in options of one octet.
//
//   +--------+     +--------+--------+---------------+
//   |  type  |     |  type  | length |     data      |
//   +--------+     +--------+--------+---------------+
//
// A list is read in rounds. In a round each known type has one turn, in a fixed order. A type that has its turn reads
// the option at the cursor if the option is of this type. So one round reads several options if they come in that
// order.
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <optional>

#include "frame/block.h"
#include "frame/field.h"
#include "frame/field_step.h"

namespace netfloor::plugin {

// The octets that hold the options.
struct OptionArea {
    std::int32_t octets; // still to decode; below 0 if the length of an option is larger than what was left
    bool taken = false;  // an option was read in this round

    void take(std::int32_t optionOctets) {
        octets -= optionOctets;
        taken = true;
    }
};

// The turn of every type; `count`, which is past the last turn, for a type that is not known.
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

// Peeks at the type of the option at the cursor and gives its turn, if that is `turn` or later; else types.size().
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

// The block of an option with a length. The limit is the option's length, which is peeked.
template <class Pass>
class [[nodiscard]] OptionBlock : public LimitedBlock<Pass> {
public:
    NETFLOOR_INLINE OptionBlock(Reader<Pass> &reader, BlockName name) : LimitedBlock<Pass>(reader, name) {
        this->limit(peek(reader, piece(8, 15)).value_or(0) * bitsPerOctet);
    }
};

// Reads the type and the length of an option, and takes that length off the area.
template <const Field &type, const Field &length, class Pass>
NETFLOOR_INLINE inline void optionHead(Reader<Pass> &reader, OptionArea &area) {
    read<type>(reader);
    std::int32_t lengthOctets = 0;
    read<length>(reader, &lengthOctets);
    if (reader.live) {
        area.take(lengthOctets);
    }
}

// The same, but takes a fixed number of octets off the area, whatever the option's length is.
template <const Field &type, const Field &length, class Pass>
NETFLOOR_INLINE inline void optionHead(Reader<Pass> &reader, OptionArea &area, std::int32_t countedOctets) {
    read<type>(reader);
    read<length>(reader);
    if (reader.live) {
        area.take(countedOctets);
    }
}

} // namespace netfloor::plugin
