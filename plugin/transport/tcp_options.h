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

struct OptionVariables {
    OptionArea tcpOptions; // after the fixed header
};

// The options of fixed size.

template <auto fields, class Pass>
NETFLOOR_INLINE inline void fixedOption(Reader<Pass> &reader, OptionArea &area) {
    const OptionBlock<Pass> option{reader, ""};
    fields(reader, area);
}

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

// Reads the option at the cursor, which is of a known kind.
template <class Pass>
NETFLOOR_INLINE inline void option(Reader<Pass> &reader, std::uint8_t kind, OptionArea &area) {
    switch (kind) {
    case 0: return optionOfOneOctet<endOfList>(reader, "", area);
    case 1: return optionOfOneOctet<noOperation>(reader, "", area);
    case 2: return fixedOption<maximumSegmentFields<Pass>>(reader, area);
    case 3: return fixedOption<windowScaleFields<Pass>>(reader, area);
    case 4: return fixedOption<sackPermittedFields<Pass>>(reader, area);
    case 5: return sackOption(reader, area);
    case 8: return fixedOption<timestampsFields<Pass>>(reader, area);
    default: return md5SignatureOption(reader, area);
    }
}

template <class Pass>
NETFLOOR_INLINE inline void padding(Reader<Pass> &reader, OptionArea &area) {
    const Block<Pass> block{reader, "Padding"};
    readRun<optionPadding>(reader, area.octets);
    if (reader.live) {
        area.octets = 0;
    }
}

// The turns of a round, in order. No kind reads an option once the area is used up. If no kind read an option, the rest
// is padding, which ends the list.
template <class Pass>
NETFLOOR_INLINE inline void optionRound(Reader<Pass> &reader, OptionArea &area) {
    for (std::size_t turn = 0; reader.live && turn < optionKinds.size(); ++turn) {
        std::size_t taker = nextTaker<optionKinds>(reader, turn);
        if (area.octets < 1) {
            taker = optionKinds.size();
        }
        if (taker != turn) {
            reader.raise(Flag::expectation);
        }
        turn = taker;
        if (turn < optionKinds.size()) {
            option(reader, optionKinds[turn], area);
        }
    }
    if (!reader.live) {
        return;
    }
    if (area.taken || area.octets < 1) {
        reader.raise(Flag::expectation);
    } else {
        padding(reader, area);
    }
}

// The options lie in the block that the Data Offset limits, and use the live flag of that block. So an option that
// reaches past the header ends the list, but not the segment. The payload starts at the Data Offset.
template <class Pass>
NETFLOOR_INLINE inline void options(Reader<Pass> &reader) {
    OptionArea &area = reader.variables().tcpOptions;
    BlockChain<Pass> rounds{reader};
    do {
        rounds.open("options");
        area.taken = false;
        reader.check();
        optionRound(reader, area);
    } while (reader.live && area.octets >= 1);
}

// Usual option lists: their kinds, in their order.
inline constexpr std::array<std::uint8_t, 0> noOptions{};
inline constexpr std::array<std::uint8_t, 3> timestampsAligned = {1, 1, 8};

[[nodiscard]] constexpr std::uint32_t octetsOfKind(std::uint8_t kind) {
    switch (kind) {
    case 1: return 1;
    case 8: return timestampsOctets;
    default: return 0;
    }
}

template <const auto &kinds>
inline constexpr std::uint32_t octetsOfList = [] {
    std::uint32_t octets = 0;
    for (const std::uint8_t kind : kinds) {
        octets += octetsOfKind(kind);
    }
    return octets;
}();

// Whether the options at an octet border are such a list, each of its proper length.
template <const auto &kinds>
[[nodiscard]] NETFLOOR_INLINE inline bool isList(const std::uint8_t *data, std::uint32_t first) {
    bool is = true;
    forEach<kinds.size()>([&]<std::size_t i>() NETFLOOR_INLINE {
        is = is && octetAt(data, first) == kinds[i] &&
             (octetsOfKind(kinds[i]) == 1 || octetAt(data, first + bitsPerOctet) == octetsOfKind(kinds[i]));
        first += octetsOfKind(kinds[i]) * bitsPerOctet;
    });
    return is;
}

// Reads an option of such a list in a checked run.
template <std::uint8_t kind, class Pass>
NETFLOOR_INLINE inline void optionInRun(Reader<Pass> &reader, OptionArea &area) {
    if constexpr (kind == 1) {
        expectFields<noOperation, noOperation>(reader);
        optionOfOneOctet<noOperation>(reader, "", area);
    } else {
        static_assert(kind == 8, "a kind in a usual list needs its octets in octetsOfKind, and its fields here");
        const LimitedBlock<Pass> option{reader, "", octetsOfKind(kind) * bitsPerOctet};
        expectFields<timestamps, timestampEcho>(reader);
        timestampsFields(reader, area);
    }
}

// Reads such a list in a checked run, from the option `next` and the turn of a round on: the same as options(), but the
// compiler knows which kind has which turn.
template <const auto &kinds, std::size_t next, std::size_t turn, class Pass>
NETFLOOR_INLINE inline void listInRun(Reader<Pass> &reader, BlockChain<Pass> &rounds, OptionArea &area) {
    if constexpr (turn == 0) {
        rounds.open("options");
    }
    constexpr std::size_t taker = [] {
        const std::size_t wanted = next < kinds.size() ? turnOf<optionKinds>[kinds[next]] : optionKinds.size();
        return wanted < turn ? optionKinds.size() : wanted;
    }();
    if constexpr (turn < optionKinds.size() && taker != turn) {
        reader.raise(Flag::expectation);
    }
    if constexpr (taker < optionKinds.size()) {
        optionInRun<kinds[next]>(reader, area);
        return listInRun<kinds, next + 1, taker + 1>(reader, rounds, area);
    } else {
        reader.raise(Flag::expectation); // that the rest is padding
        if constexpr (next < kinds.size()) {
            listInRun<kinds, next, 0>(reader, rounds, area);
        }
    }
}

template <const auto &kinds, class Pass>
NETFLOOR_INLINE inline void listInRun(Reader<Pass> &reader) {
    OptionArea area{octetsOfList<kinds>};
    BlockChain<Pass> rounds{reader};
    listInRun<kinds, 0, 0>(reader, rounds, area);
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
