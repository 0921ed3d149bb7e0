// SPDX-License-Identifier: MIT
// The options of a TCP header (RFC 9293; window scale and timestamps RFC 7323, selective acknowledgements RFC 2018,
// MD5 signature RFC 2385).
//
//   kind 0  End of Option List         kind  4  SACK-Permitted
//   kind 1  No Operation               kind  5  SACK
//   kind 2  Maximum Segment Size       kind  8  Timestamps
//   kind 3  Window Scale               kind 19  MD5 Signature
//
// Kind 0 ends nothing: the list goes on behind it. Any other kind turns the rest of the area into padding.
//
// Each kind that has its turn in a round and does not find its option raises the mark of a failed expectation, and
// so does a round that needs no padding. So every TCP header raises it, a sound one too, and the one with no
// options: in TCP the mark says nothing about damage.
#pragma once

#include <algorithm>
#include <array>
#include <cstddef>
#include <cstdint>

#include "frame/block.h"
#include "frame/field.h"
#include "frame/options.h"
#include "frame/step.h"
#include "frame/stretch.h"

namespace netfloor::tcp {

// clang-format off
inline constexpr Field endOfList         {441, "TCP Option Kind=0 (End of Option List)", octets(1),                  "TCP Option Kind=0 (End of Option List)=%x"};
inline constexpr Field noOperation       {444, "TCP Option Kind",                        octets(1),                  "TCP Option Kind=%u (No Operation)"};

inline constexpr Field maximumSegment    {447, "TCP Option Kind",                        octets(1),                  "TCP Option Kind=%u (Maximum Segment Size)"};
inline constexpr Field maximumLength     {448, "Length",                                 octets(1),                  "  Length=%u octet(s)"};
inline constexpr Field maximumSize       {451, "max seg size",                           octetPair(),                "  max seg size=%u"};

inline constexpr Field windowScale       {452, "TCP Option Kind",                        octets(1),                  "TCP Option Kind=%u (Window Scale Option)"};
inline constexpr Field windowScaleLength {453, "Length",                                 octets(1),                  "  Length=%u octet(s)"};
inline constexpr Field shiftCount        {456, "shift count",                            octets(1),                  "  shift count=%u"};

inline constexpr Field sackPermitted     {457, "TCP Option Kind",                        octets(1),                  "TCP Option Kind=%u (SACK-Permitted)"};
inline constexpr Field permittedLength   {458, "Length",                                 octets(1),                  "  Length=%u octet(s)"};

inline constexpr Field sack              {461, "TCP Option Kind",                        octets(1),                  "TCP Option Kind=%u (SACK Option)"};
inline constexpr Field sackLength        {462, "Length",                                 octets(1),                  "  Length=%u octet(s)"};
inline constexpr Field leftEdge          {466, "Left Edge of Block",                     octets(4),                  "  Left Edge of Block=%x"};
inline constexpr Field rightEdge         {467, "Right Edge of Block",                    octets(4),                  "  Right Edge of Block=%x"};

// Both stamps are taken as little-endian numbers.
inline constexpr Field timestamps        {468, "TCP Option Kind",                        octets(1),                  "TCP Option Kind=%u (Timestamps Option)"};
inline constexpr Field timestampsLength  {469, "Length",                                 octets(1),                  "  Length=%u octet(s)"};
inline constexpr Field timestampValue    {472, "TS value",                               piece(0, 31).advancing(32), "  TS value=%u"};
inline constexpr Field timestampEcho     {473, "TS Echo Reply",                          piece(0, 31).advancing(32), "  TS Echo Reply=%u"};

inline constexpr Field md5Signature      {474, "TCP Option Kind",                        octets(1),                  "TCP Option Kind=%u (MD5 Signature Option)"};
inline constexpr Field md5Length         {475, "Length",                                 octets(1),                  "  Length=%u octet(s)"};
inline constexpr Field md5Digest         {478, "MD5 digest",                             octetRun().atMost(16),      R"(    MD5 digest=%-["%x"])", noNames, "%x"};

inline constexpr Field optionPadding     {439, "Padding",                                octetRun(),                 "  Padding=%x"};
// clang-format on

// The kinds, in the order of their turns in a round.
inline constexpr std::array<std::uint8_t, 8> optionKinds = {0, 1, 2, 3, 4, 5, 8, 19};

// These count as long as they should be, whatever their length says.
inline constexpr std::int32_t maximumSegmentOctets = 4;
inline constexpr std::int32_t windowScaleOctets = 3;
inline constexpr std::int32_t sackPermittedOctets = 2;
inline constexpr std::int32_t timestampsOctets = 10;

struct OptionVariables {
    OptionArea tcpOptions; // behind the fixed header
};

template <class Pass>
NETFLOOR_INLINE inline void maximumSegmentOption(Reader<Pass> &at, OptionArea &area) {
    const OptionBlock<Pass> option{at, ""};
    optionHead<maximumSegment, maximumLength>(at, area, maximumSegmentOctets);
    read<maximumSize>(at);
}

template <class Pass>
NETFLOOR_INLINE inline void windowScaleOption(Reader<Pass> &at, OptionArea &area) {
    const OptionBlock<Pass> option{at, ""};
    optionHead<windowScale, windowScaleLength>(at, area, windowScaleOctets);
    read<shiftCount>(at);
}

template <class Pass>
NETFLOOR_INLINE inline void sackPermittedOption(Reader<Pass> &at, OptionArea &area) {
    const OptionBlock<Pass> option{at, ""};
    optionHead<sackPermitted, permittedLength>(at, area, sackPermittedOctets);
}

// The limit ends the blocks: the first edge that does not fit in.
template <class Pass>
NETFLOOR_INLINE inline void sackOption(Reader<Pass> &at, OptionArea &area) {
    const OptionBlock<Pass> option{at, ""};
    optionHead<sack, sackLength>(at, area);
    while (at.live) {
        const Block<Pass> edges{at, ""};
        read<leftEdge>(at);
        read<rightEdge>(at);
    }
}

template <class Pass>
NETFLOOR_INLINE inline void timestampsFields(Reader<Pass> &at) {
    optionHead<timestamps, timestampsLength>(at, at.variables().tcpOptions, timestampsOctets);
    read<timestampValue>(at);
    read<timestampEcho>(at);
}

// The one option that nearly every segment carries.
template <class Pass>
NETFLOOR_INLINE inline void timestampsOption(Reader<Pass> &at) {
    const OptionBlock<Pass> option{at, ""};
    stretch<timestampsOctets * bitsPerOctet, timestampsFields<Pass>>(at);
}

// The digest is what the length leaves, and one octet at least, so that it is cut short where nothing is left.
template <class Pass>
NETFLOOR_INLINE inline void md5SignatureOption(Reader<Pass> &at, OptionArea &area) {
    const OptionBlock<Pass> option{at, ""};
    optionHead<md5Signature, md5Length>(at, area);
    const std::uint32_t digestOctets = std::clamp(at.left / bitsPerOctet, 1U, md5Digest.place.mostUnits);
    readRun<md5Digest>(at, static_cast<std::int32_t>(digestOctets));
}

// Takes the option under the cursor, which is of a known kind.
template <class Pass>
NETFLOOR_INLINE inline void option(Reader<Pass> &at, std::uint8_t kind, OptionArea &area) {
    switch (kind) {
    case 0: return optionOfOneOctet<endOfList>(at, "", area);
    case 1: return optionOfOneOctet<noOperation>(at, "", area);
    case 2: return maximumSegmentOption(at, area);
    case 3: return windowScaleOption(at, area);
    case 4: return sackPermittedOption(at, area);
    case 5: return sackOption(at, area);
    case 8: return timestampsOption(at);
    default: return md5SignatureOption(at, area);
    }
}

template <class Pass>
NETFLOOR_INLINE inline void padding(Reader<Pass> &at, OptionArea &area) {
    const Block<Pass> block{at, "Padding"};
    readRun<optionPadding>(at, area.octets);
    if (at.live) {
        area.octets = 0;
    }
}

// Once the area is used up no kind takes an option any more.
template <class Pass>
NETFLOOR_INLINE inline void optionRound(Reader<Pass> &at, OptionArea &area) {
    area.taken = false;
    for (std::size_t turn = 0; at.live && turn < optionKinds.size(); ++turn) {
        std::size_t taker = nextTaker<optionKinds>(at, turn);
        if (area.octets < 1) {
            taker = optionKinds.size();
        }
        if (taker != turn) {
            at.mark(Mark::expectation);
        }
        turn = taker;
        if (turn < optionKinds.size()) {
            option(at, optionKinds[turn], area);
        }
    }
    if (!at.live) {
        return;
    }
    if (!area.taken && area.octets >= 1) {
        padding(at, area);
    } else {
        at.mark(Mark::expectation);
    }
}

// The options stand in the block that the Data Offset limits, and their live flag is that block's: an option that
// reaches past the header ends the list, but not the segment, whose payload starts where the Data Offset says.
template <class Pass>
NETFLOOR_INLINE inline void options(Reader<Pass> &at) {
    if (!at.live) {
        return;
    }
    OptionArea &area = at.variables().tcpOptions;
    BlockChain<Pass> rounds{at};
    do {
        rounds.open("options");
        optionRound(at, area);
    } while (at.live && area.octets >= 1);
}

} // namespace netfloor::tcp
