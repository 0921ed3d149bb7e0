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

struct OptionVariables {
    OptionArea tcpOptions; // after the fixed header
};

template <class Pass>
NETFLOOR_INLINE inline void maximumSegmentOption(Reader<Pass> &reader, OptionArea &area) {
    const OptionBlock<Pass> option{reader, ""};
    optionHead<maximumSegment, maximumLength>(reader, area, maximumSegmentOctets);
    read<maximumSize>(reader);
}

template <class Pass>
NETFLOOR_INLINE inline void windowScaleOption(Reader<Pass> &reader, OptionArea &area) {
    const OptionBlock<Pass> option{reader, ""};
    optionHead<windowScale, windowScaleLength>(reader, area, windowScaleOctets);
    read<shiftCount>(reader);
}

template <class Pass>
NETFLOOR_INLINE inline void sackPermittedOption(Reader<Pass> &reader, OptionArea &area) {
    const OptionBlock<Pass> option{reader, ""};
    optionHead<sackPermitted, permittedLength>(reader, area, sackPermittedOctets);
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

// The production of a checked run has no other parameter than the reader.
template <class Pass>
NETFLOOR_INLINE inline void timestampsFields(Reader<Pass> &reader) {
    optionHead<timestamps, timestampsLength>(reader, reader.variables().tcpOptions, timestampsOctets);
    read<timestampValue>(reader);
    read<timestampEcho>(reader);
}

// The one option that nearly every segment carries.
template <class Pass>
NETFLOOR_INLINE inline void timestampsOption(Reader<Pass> &reader) {
    const OptionBlock<Pass> option{reader, ""};
    checkedRun<timestamps, timestampEcho, timestampsFields<Pass>>(reader);
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
    case 2: return maximumSegmentOption(reader, area);
    case 3: return windowScaleOption(reader, area);
    case 4: return sackPermittedOption(reader, area);
    case 5: return sackOption(reader, area);
    case 8: return timestampsOption(reader);
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

// One turn for each kind, in order. No kind reads an option once the area is used up. If no kind read an option, the
// rest is padding, which ends the list.
template <class Pass>
NETFLOOR_INLINE inline void optionRound(Reader<Pass> &reader, OptionArea &area) {
    area.taken = false;
    reader.check();
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
    if (!area.taken && area.octets >= 1) {
        padding(reader, area);
    } else {
        reader.raise(Flag::expectation);
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
        optionRound(reader, area);
    } while (reader.live && area.octets >= 1);
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
