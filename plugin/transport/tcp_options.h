// SPDX-License-Identifier: MIT
// The options of a TCP header (RFC 9293; window scale and timestamps RFC 7323, selective acknowledgements RFC 2018,
// MD5 signature RFC 2385).
//
//   kind 0  End of Option List         kind  4  SACK-Permitted
//   kind 1  No Operation               kind  5  SACK
//   kind 2  Maximum Segment Size       kind  8  Timestamps
//   kind 3  Window Scale               kind 19  MD5 Signature
//
// Kind 0 does not end the list: the next option follows. Any other kind makes the rest of the area padding.
//
// A kind that has its turn in a round and does not find its option raises the flag of a failed expectation, and so does
// a round without padding. So every TCP header raises this flag, also a valid one and one without options. In TCP the
// flag does not mean damage.
#pragma once

#include <algorithm>
#include <array>
#include <cstddef>
#include <cstdint>

#include "frame/bits.h"
#include "frame/block.h"
#include "frame/checked_run.h"
#include "frame/field.h"
#include "frame/field_list.h"
#include "frame/field_step.h"
#include "ip/option_list.h"

namespace netfloor::plugin::tcp {

// clang-format off
inline constexpr Field endOfList         {441, "TCP Option Kind=0 (End of Option List)", octets(1),   "%n=%x"};
inline constexpr Field noOperation       {444, "TCP Option Kind",                        octets(1),   "%n=%u (No Operation)"};

inline constexpr Field maximumSegment    {447, "TCP Option Kind",                        octets(1),   "%n=%u (Maximum Segment Size)"};
inline constexpr Field maximumLength     {448, "Length",                                 octets(1),   "  %n=%u octet(s)"};
inline constexpr Field maximumSize       {451, "max seg size",                           octetPair(), "  %n=%u"};

inline constexpr Field windowScale       {452, "TCP Option Kind",                        octets(1),   "%n=%u (Window Scale Option)"};
inline constexpr Field windowScaleLength {453, "Length",                                 octets(1),   "  %n=%u octet(s)"};
inline constexpr Field shiftCount        {456, "shift count",                            octets(1),   "  %n=%u"};

inline constexpr Field sackPermitted     {457, "TCP Option Kind",                        octets(1),   "%n=%u (SACK-Permitted)"};
inline constexpr Field permittedLength   {458, "Length",                                 octets(1),   "  %n=%u octet(s)"};

inline constexpr Field sack              {461, "TCP Option Kind",                        octets(1),   "%n=%u (SACK Option)"};
inline constexpr Field sackLength        {462, "Length",                                 octets(1),   "  %n=%u octet(s)"};
inline constexpr Field leftEdge          {466, "Left Edge of Block",                     octets(4),   "  %n=%x"};
inline constexpr Field rightEdge         {467, "Right Edge of Block",                    octets(4),   "  %n=%x"};

// Both timestamps are read as little-endian numbers.
inline constexpr Field timestamps       {468, "TCP Option Kind", octets(1),                  "%n=%u (Timestamps Option)"};
inline constexpr Field timestampsLength {469, "Length",          octets(1),                  "  %n=%u octet(s)"};
inline constexpr Field timestampValue   {472, "TS value",        piece(0, 31).advancing(32), "  %n=%u"};
inline constexpr Field timestampEcho    {473, "TS Echo Reply",   piece(0, 31).advancing(32), "  %n=%u"};

inline constexpr Field md5Signature     {474, "TCP Option Kind", octets(1),                  "%n=%u (MD5 Signature Option)"};
inline constexpr Field md5Length        {475, "Length",          octets(1),                  "  %n=%u octet(s)"};
inline constexpr Field md5Digest        {478, "MD5 digest",      octetRun().atMost(16),      R"(    %n=%-["%x"])",           noNames, "%x"};

inline constexpr Field optionPadding    {439, "Padding",         octetRun(),                 "  %n=%x"};
// clang-format on

// The kinds, in the order of their turns in a round.
inline constexpr std::array<std::uint8_t, 8> optionKinds = {0, 1, 2, 3, 4, 5, 8, 19};

// These options always take their proper length off the area, whatever their length field says.
inline constexpr std::int32_t maximumSegmentOctets = 4;
inline constexpr std::int32_t windowScaleOctets = 3;
inline constexpr std::int32_t sackPermittedOctets = 2;
inline constexpr std::int32_t timestampsOctets = 10;

// The block that holds the options.
inline constexpr BlockName limitedPartName{"INLINE BLOCK"};

// A round opens its own block, and one for an option at a time.
inline constexpr std::uint32_t blocksOfRound = 2;

struct OptionVariables {
    OptionArea tcpOptions;   // after the fixed header
    std::uint32_t tcpTurn;   // in the round that is open; the number of kinds if none is
    std::uint32_t tcpRounds; // that are open
};

// The options of fixed size.

template <class Pass>
NETFLOOR_INLINE inline void maximumSegmentFields(Reader<Pass> &reader, OptionArea &area) {
    optionHead<maximumSegment, maximumLength>(reader, area, maximumSegmentOctets);
    read<maximumSize>(reader);
}

template <class Pass>
NETFLOOR_INLINE inline void windowScaleFields(Reader<Pass> &reader, OptionArea &area) {
    optionHead<windowScale, windowScaleLength>(reader, area, windowScaleOctets);
    read<shiftCount>(reader);
}

template <class Pass>
NETFLOOR_INLINE inline void sackPermittedFields(Reader<Pass> &reader, OptionArea &area) {
    optionHead<sackPermitted, permittedLength>(reader, area, sackPermittedOctets);
}

template <class Pass>
NETFLOOR_INLINE inline void timestampsFields(Reader<Pass> &reader, OptionArea &area) {
    optionHead<timestamps, timestampsLength>(reader, area, timestampsOctets);
    read<timestampValue>(reader);
    read<timestampEcho>(reader);
}

// The limit ends the list: at the first edge that does not fit.
template <class Pass>
NETFLOOR_INLINE inline void sackOption(Reader<Pass> &reader, OptionArea &area) {
    const OptionBlock<Pass> option{reader, ""};
    optionHead<sack, sackLength>(reader, area);
    while (reader.live) {
        const Block<Pass> edges{reader, ""};
        read<leftEdge>(reader);
        read<rightEdge>(reader);
    }
}

// The digest is the rest of the option, but at least one octet: if nothing is left, the digest is cut short.
template <class Pass>
NETFLOOR_INLINE inline void md5SignatureOption(Reader<Pass> &reader, OptionArea &area) {
    const OptionBlock<Pass> option{reader, ""};
    optionHead<md5Signature, md5Length>(reader, area);
    const std::uint32_t digestOctets = std::clamp(reader.left / bitsPerOctet, 1U, md5Digest.place.mostUnits);
    readRun<md5Digest>(reader, static_cast<std::int32_t>(digestOctets));
}

// How options are read: any option, or in a checked run only those of fixed size whose length says so.
enum class Options : std::uint8_t { any, usual };

// Reads an option with the fields from `first` to `last`. False where it is not a usual one.
template <Options which, const Field &first, const Field &last, auto fields, class Pass>
[[nodiscard]] NETFLOOR_INLINE inline bool fixedOption(Reader<Pass> &reader, OptionArea &area) {
    if constexpr (which == Options::any) {
        const OptionBlock<Pass> option{reader, ""};
        fields(reader, area);
    } else {
        constexpr std::uint32_t bitCount = bitsFromTo<typename Pass::Fields>(first, last);
        if (reader.left < bitCount ||
            octetAt(reader.writer.octets(), reader.writer.bit() + bitsPerOctet) != bitCount / bitsPerOctet) {
            return false;
        }
        const LimitedBlock<Pass> option{reader, "", bitCount};
        expectFields<first, last>(reader);
        fields(reader, area);
    }
    return true;
}

template <Options which, const Field &type, class Pass>
[[nodiscard]] NETFLOOR_INLINE inline bool octetOption(Reader<Pass> &reader, OptionArea &area) {
    if constexpr (which == Options::usual) {
        expectFields<type, type>(reader); // its octet was peeked
    }
    optionOfOneOctet<type>(reader, "", area);
    return true;
}

// Reads the option at the cursor, which is of a known kind. False where it is not a usual one.
template <Options which, class Pass>
[[nodiscard]] NETFLOOR_INLINE inline bool option(Reader<Pass> &reader, std::uint8_t kind, OptionArea &area) {
    switch (kind) {
    case 0: return octetOption<which, endOfList>(reader, area);
    case 1: return octetOption<which, noOperation>(reader, area);
    case 2: return fixedOption<which, maximumSegment, maximumSize, maximumSegmentFields<Pass>>(reader, area);
    case 3: return fixedOption<which, windowScale, shiftCount, windowScaleFields<Pass>>(reader, area);
    case 4: return fixedOption<which, sackPermitted, permittedLength, sackPermittedFields<Pass>>(reader, area);
    case 8: return fixedOption<which, timestamps, timestampEcho, timestampsFields<Pass>>(reader, area);
    default: break;
    }
    if constexpr (which == Options::any) {
        kind == 5 ? sackOption(reader, area) : md5SignatureOption(reader, area);
    }
    return which == Options::any;
}

template <class Pass>
NETFLOOR_INLINE inline void padding(Reader<Pass> &reader, OptionArea &area) {
    const Block<Pass> block{reader, "Padding"};
    readRun<optionPadding>(reader, area.octets);
    if (reader.live) {
        area.octets = 0;
    }
}

// The turns of a round from `turn` on, in order. No kind reads an option once the area is used up. If no kind read an
// option, the rest is padding, which ends the list. Gives the turn of an option that is not a usual one, to go on from
// there; else the number of kinds.
template <Options which, class Pass>
[[nodiscard]] NETFLOOR_INLINE inline std::size_t optionRound(Reader<Pass> &reader, OptionArea &area, std::size_t turn) {
    for (; reader.live && turn < optionKinds.size(); ++turn) {
        std::size_t taker = nextTaker<optionKinds>(reader, turn);
        if (area.octets < 1) {
            taker = optionKinds.size();
        }
        if (taker != turn) {
            reader.raise(Flag::expectation);
        }
        turn = taker;
        if (turn < optionKinds.size() && !option<which>(reader, optionKinds[turn], area)) {
            return turn;
        }
    }
    if (!reader.live) {
        return optionKinds.size();
    }
    if (area.taken || area.octets < 1) {
        reader.raise(Flag::expectation);
    } else if constexpr (which == Options::usual) {
        return optionKinds.size() - 1; // no kind takes what is there
    } else {
        padding(reader, area);
    }
    return optionKinds.size();
}

// The options lie in the block that the Data Offset limits, and use the live flag of that block. So an option that
// reaches past the header ends the list, but not the segment. The payload starts at the Data Offset.
template <class Pass>
NETFLOOR_INLINE inline void restOfOptions(Reader<Pass> &reader) {
    auto &variables = reader.variables();
    OptionArea &area = variables.tcpOptions;
    BlockChain<Pass> rounds{reader, limitedPartName, variables.tcpRounds};
    std::size_t turn = variables.tcpTurn;
    do {
        if (turn == optionKinds.size()) {
            rounds.open("options");
            area.taken = false;
            reader.check();
            turn = 0;
        }
        turn = optionRound<Options::any>(reader, area, turn);
    } while (reader.live && area.octets >= 1);
}

// Reads options in a checked run. False where it comes to one that is not usual: then restOfOptions goes on.
template <class Pass>
[[nodiscard]] NETFLOOR_INLINE inline bool usualOptions(Reader<Pass> &reader, std::int32_t octetCount) {
    OptionArea area{octetCount};
    std::size_t turn = optionKinds.size();
    BlockChain<Pass> rounds{reader};
    do {
        if (reader.writer.blockRoom() < blocksOfRound) {
            break;
        }
        rounds.open("options");
        area.taken = false;
        turn = optionRound<Options::usual>(reader, area, 0);
        if (turn != optionKinds.size()) {
            break;
        }
        if (area.octets < 1) {
            return true;
        }
    } while (true);
    auto &variables = reader.variables();
    variables.tcpOptions = area;
    variables.tcpTurn = static_cast<std::uint32_t>(turn);
    variables.tcpRounds = rounds.release();
    return false;
}

// clang-format off
using OptionFields = FieldList<
    endOfList, noOperation,
    maximumSegment, maximumLength, maximumSize,
    windowScale, windowScaleLength, shiftCount,
    sackPermitted, permittedLength,
    sack, sackLength, leftEdge, rightEdge,
    timestamps, timestampsLength, timestampValue, timestampEcho,
    md5Signature, md5Length, md5Digest,
    optionPadding>;
// clang-format on

} // namespace netfloor::plugin::tcp
