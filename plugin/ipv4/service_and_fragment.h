// SPDX-License-Identifier: MIT
// The two productions that the IPv4 header (RFC 791) and the IP in IP header share.
//
//    0   1   2   3   4   5   6   7          0   1   2   3 ...                   15
//  +---+---+---+---+---+---+---+---+      +---+---+---+--------------------------+
//  | Precedence| D | T | R |  Rsvd |      | R | DF| MF|     Fragment Offset      |
//  +---+---+---+---+---+---+---+---+      +---+---+---+--------------------------+
#pragma once

#include <array>

#include "frame/block.h"
#include "frame/field.h"
#include "frame/field_step.h"

namespace netfloor::plugin::ipv4 {

inline constexpr std::array precedenceRows = {
    ValueName{0, "Routine"},
    ValueName{1, "Priority"},
    ValueName{2, "Immediate"},
    ValueName{3, "Flash"},
    ValueName{4, "Flash Override"},
    ValueName{5, "CRITIC/ECP"},
    ValueName{6, "Internetwork Control"},
    ValueName{7, "Network Control"},
};
inline constexpr std::array delayRows = {ValueName{0, "Normal Delay"}, ValueName{1, "Low Delay"}};
inline constexpr std::array throughputRows = {ValueName{0, "Normal Throughput"}, ValueName{1, "High Throughput"}};
inline constexpr std::array reliabilityRows = {ValueName{0, "Normal Reliability"}, ValueName{1, "High Reliability"}};
inline constexpr std::array dontFragmentRows = {ValueName{0, "May Fragment"}, ValueName{1, "Don't Fragment"}};
inline constexpr std::array moreFragmentsRows = {ValueName{0, "Last Fragment"}, ValueName{1, "More Fragments"}};

inline constexpr ValueNames precedenceNames{precedenceRows};
inline constexpr ValueNames delayNames{delayRows};
inline constexpr ValueNames throughputNames{throughputRows};
inline constexpr ValueNames reliabilityNames{reliabilityRows};
inline constexpr ValueNames dontFragmentNames{dontFragmentRows};
inline constexpr ValueNames moreFragmentsNames{moreFragmentsRows};

// clang-format off
inline constexpr Field precedence       {286, "Precedence",      piece(5, 7),                                    "%n=%-S",       &precedenceNames};
inline constexpr Field delay            {287, "Delay",           bit(4),                                         "%n=%-S",       &delayNames};
inline constexpr Field throughput       {288, "Throughput",      bit(3),                                         "%n=%-S",       &throughputNames};
inline constexpr Field reliability      {289, "Reliability",     bit(2),                                         "%n=%-S",       &reliabilityNames};
inline constexpr Field serviceReserved  {290, "Reserved",        piece(0, 1).advancing(8),                       "%n=%x"};

inline constexpr Field fragmentReserved {291, "Reserved",        bit(7),                                         "%n=%x"};
inline constexpr Field dontFragmentFlag {292, "DF",              bit(6),                                         "%n=%-S",       &dontFragmentNames};
inline constexpr Field moreFragments    {293, "MF",              bit(5),                                         "%n=%-S",       &moreFragmentsNames};
inline constexpr Field fragmentOffset   {294, "Fragment Offset", pieces({0, 4}, {8, 15}).advancing(16).times(8), "%n=%u octets"};
// clang-format on

struct FragmentVariables {
    std::uint32_t dontFragment;
    std::uint32_t fragmentOffset; // in units of 8 octets, as on the wire
};

template <class Pass>
NETFLOOR_INLINE inline void typeOfService(Reader<Pass> &reader) {
    if (!reader.live) {
        return;
    }
    const Block<Pass> block{reader, "Type of Service"};
    read<precedence>(reader);
    read<delay>(reader);
    read<throughput>(reader);
    read<reliability>(reader);
    read<serviceReserved>(reader);
}

template <class Pass>
NETFLOOR_INLINE inline void flagAndFragmentOffset(Reader<Pass> &reader) {
    if (!reader.live) {
        return;
    }
    auto &variables = reader.variables();
    const Block<Pass> block{reader, "Flag and Fragment Offset"};
    read<fragmentReserved>(reader);
    read<dontFragmentFlag>(reader, &variables.dontFragment);
    read<moreFragments>(reader);
    read<fragmentOffset>(reader, &variables.fragmentOffset);
}

} // namespace netfloor::plugin::ipv4
