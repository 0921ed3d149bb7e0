// SPDX-License-Identifier: MIT
// The options of a Hop-by-Hop or Destination Options header (RFC 2460, section 4.2).
//
//   +---------------+---------------+------------- - - -
//   |  Option Type  |  Option Length| Option Data
//   +---------------+---------------+------------- - - -
//
// Only the first option of a header is read. The octets after it are read as the next header, so that the second option
// of a header is shown as something that it is not.
#pragma once

#include <cstdint>

#include "frame/block.h"
#include "frame/field.h"
#include "frame/field_list.h"
#include "frame/field_step.h"
#include "ip/unknown_data.h"

namespace netfloor::plugin::ipv6 {

// clang-format off
inline constexpr Field optionTypeAhead     {223, "Option type",          ahead(0, 7), "%n=%x"};
inline constexpr Field pad1Type            {232, "Option Type",          octets(1),   " %n=Pad1 option",                    noNames, "%u"};
inline constexpr Field padNType            {226, "Option Type",          octets(1),   " %n=PadN option",                    noNames, "%u"};
inline constexpr Field padNLength          {227, "Option Length",        octets(1),   "%n=%u Octetc(s)"};
inline constexpr Field paddingData         {229, "Padding Data",         nibbleRun(), R"(%n=%-["%x"] (Hex))"};
inline constexpr Field actionAhead         {235, "highest-order 2 bits", ahead(6, 7), "%n=%x"};
inline constexpr Field unknownOptionType   {238, "Option Type",          octets(1),   " %n=Unknown",                        noNames, "%u"};
inline constexpr Field unknownOptionLength {239, "Opt Data Length",      octets(1),   " %n=%u Octet(s)",                    noNames, "%u"};
inline constexpr Field skippedOctet        {240, "Skip",                 octets(1),   "%n=%x"};
inline constexpr Field discardedOptionType {243, "discard packet",       octets(1),   "unkown option type, %n", noNames, "%u", "unkown option type, discard packet"};
// clang-format on

struct OptionVariables {
    std::int32_t optionLength; // of the last option whose length was read
};

enum : std::uint32_t { optionPad1 = 0, optionPadN = 1 };

// What to do with an unknown option, as the two top bits of its type say.
inline constexpr std::uint32_t actionSkip = 0;

inline constexpr std::int32_t nibblesPerOctet = 2;

template <class Pass>
NETFLOOR_INLINE inline void padN(Reader<Pass> &reader) {
    auto &variables = reader.variables();
    read<padNType>(reader);
    read<padNLength>(reader, &variables.optionLength);
    readRun<paddingData>(reader, variables.optionLength * nibblesPerOctet);
}

template <class Pass>
NETFLOOR_INLINE inline void skippedOption(Reader<Pass> &reader) {
    auto &variables = reader.variables();
    read<unknownOptionType>(reader);
    read<unknownOptionLength>(reader, &variables.optionLength);
    readCounted<skippedOctet>(reader, variables.optionLength);
}

// An option whose type forbids to go on. Its length is not read: everything after the type is data.
template <class Pass>
NETFLOOR_INLINE inline void discardedOption(Reader<Pass> &reader) {
    read<discardedOptionType>(reader);
    if (reader.variables().payloadOctets >= 1) {
        runOutOfLine<unknownData<Pass>>(reader);
    }
}

// Reads an option, whose blocks stay open in `chain`. Returns whether the chain goes on after it.
template <class Pass>
[[nodiscard]] NETFLOOR_INLINE inline bool option(Reader<Pass> &reader, BlockChain<Pass> &chain) {
    std::uint32_t type = 0;
    chain.open("Options");
    read<optionTypeAhead>(reader, &type);
    if (!reader.live) {
        return false;
    }
    switch (type) {
    case optionPad1:
        chain.open("Pad1 option");
        read<pad1Type>(reader);
        return true;
    case optionPadN:
        chain.open("PadN Option");
        padN(reader);
        return true;
    default: break;
    }
    std::uint32_t action = 0;
    chain.open("Unknown Option");
    read<actionAhead>(reader, &action);
    chain.open("");
    if (action != actionSkip) {
        discardedOption(reader);
        return false;
    }
    skippedOption(reader);
    return true;
}

// clang-format off
using OptionRows = Rows<
    FieldList<
        optionTypeAhead,
        pad1Type,
        padNType, padNLength, paddingData,
        actionAhead, unknownOptionType, unknownOptionLength, skippedOctet, discardedOptionType>,
    FieldList<pad1Type, padNType, unknownOptionType, unknownOptionLength>>;
// clang-format on

} // namespace netfloor::plugin::ipv6
