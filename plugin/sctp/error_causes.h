// SPDX-License-Identifier: MIT
// The error causes of ABORT and ERROR (RFC 9260, section 3.3.10).
//
//    0                   1                   2                   3
//    0 1 2 3 4 5 6 7 8 9 0 1 2 3 4 5 6 7 8 9 0 1 2 3 4 5 6 7 8 9 0 1
//   +-------------------------------+-------------------------------+
//   |           Cause Code          |          Cause Length         |
//   +-------------------------------+-------------------------------+
//   |                   Cause-Specific Information                  |
//   +---------------------------------------------------------------+
//
// The Length of a cause does not limit it. The limit of the first cause covers all causes of the chunk, and the end of
// its block skips the others. The limit of each later round is what the previous cause stored.
#pragma once

#include <array>
#include <cstdint>

#include "frame/block.h"
#include "frame/field.h"
#include "frame/field_list.h"
#include "frame/field_step.h"
#include "sctp/counted_list.h"
#include "sctp/length.h"
#include "sctp/unrecognized_parameter.h"

namespace netfloor::plugin::sctp {

enum CauseCode : std::uint32_t {
    invalidStreamIdentifier = 1,
    missingMandatoryParameter = 2,
    staleCookie = 3,
    outOfResource = 4,
    unresolvableAddress = 5,
    unrecognizedChunkType = 6,
    invalidMandatoryParameter = 7,
    unrecognizedParametersCause = 8,
    noUserData = 9,
    cookieWhileShuttingDown = 10,
};

inline constexpr std::array causeCodeRows = {
    ValueName{invalidStreamIdentifier, "Invalid Stream Identifier"},
    ValueName{missingMandatoryParameter, "Missing Mandatory Parameter"},
    ValueName{staleCookie, "Stale Cookie Error"},
    ValueName{outOfResource, "Out Of Resource"},
    ValueName{unresolvableAddress, "Unresolvable Address"},
    ValueName{unrecognizedChunkType, "Unrecognized Chunk Type"},
    ValueName{invalidMandatoryParameter, "Invalid Mandatory Parameter"},
    ValueName{unrecognizedParametersCause, "Unrecognized Parameters"},
    ValueName{noUserData, "No User Data"},
    ValueName{cookieWhileShuttingDown, "Cookie Rcvd While Shutting Down"},
};
inline constexpr ValueNames causeCodeNames{.rows = causeCodeRows, .otherwise = "UNKNOWN"};

// Each cause has its own id for its Length, by which the host distinguishes the causes.
constexpr Field causeLengthField(std::uint32_t id) {
    return {id, "      Length", octetPair(), "      %n=%u"};
}

constexpr Field longCauseLengthField(std::uint32_t id) {
    return {id, "      Cause Length", octetPair(), "      %n=%u"};
}

// clang-format off
inline constexpr Field causeCode               {912, "    Cause Code",                       octetPair(),        "    %n=%-S",             &causeCodeNames};
inline constexpr Field invalidStreamLength     = causeLengthField(914);
inline constexpr Field invalidStream           {915, "        Stream Identifier",            octetPair(),        "        %n=%u"};
inline constexpr Field invalidStreamReserved   {916, "        Reserved",                     octetPair(),        "        %n=%u"};
inline constexpr Field missingLength           = causeLengthField(917);
inline constexpr Field missingNumber           {918, "        Number of missing params",     octets(4),          "        %n=%u"};
inline constexpr Field missingType             {920, "        Missing Parameters Type",      octetPair(),        "        %n=%u"};
inline constexpr Field staleCookieLength       = longCauseLengthField(921);
inline constexpr Field staleness               {922, "        Measure of staleness (usec.)", octets(4),          "        %n=%u"};
inline constexpr Field outOfResourceLength     = longCauseLengthField(923);
inline constexpr Field unresolvableLength      = causeLengthField(924);
inline constexpr Field unresolvableValue       {925, "        Unrecognized Address",         octetRunBackward(), R"(        %n=%-["%x"])"};
inline constexpr Field unrecognizedChunkLength = causeLengthField(926);
inline constexpr Field unrecognizedChunk       {927, "        Unrecognized Chunk",           octetRunBackward(), R"(        %n=%-["%x"])"};
inline constexpr Field invalidMandatoryLength  = causeLengthField(928);
inline constexpr Field unrecognizedListLength  = causeLengthField(929);
inline constexpr Field noUserDataLength        = causeLengthField(932);
inline constexpr Field noUserDataTsn           {933, "        TSN value",                    octets(4),          "        %n=%u"};
inline constexpr Field shuttingDownLength      = causeLengthField(934);
inline constexpr Field unknownCauseLength      = causeLengthField(935);
inline constexpr Field unknownCause            {938, "      Unknown Cause",                  octetRun(),         "      %n=%x"};
// clang-format on

template <class Pass>
void missingParameters(Reader<Pass> &reader) {
    std::int32_t &missingParameterCount = reader.variables().missingParameterCount;
    read<missingLength>(reader);
    read<missingNumber>(reader, &missingParameterCount);
    const bool cutShort = countedList(reader, missingParameterCount, [&reader] {
        const Block<Pass> block{reader, "INLINE BLOCK"};
        read<missingType>(reader);
    });
    // The list of causes ends after a last type that is cut short.
    reader.test(!cutShort);
}

// The list ends at a field that does not fit: after the last parameter, this is the type of a next one.
template <class Pass>
void unrecognizedParameterList(Reader<Pass> &reader) {
    std::int32_t &errorOctets = reader.variables().errorOctets;
    read<unrecognizedListLength>(reader, octetsAfterHead(errorOctets));
    if (!reader.live) {
        return;
    }
    const LimitedBlock<Pass> list{reader, "INLINE BLOCK", bitsOf(errorOctets)};
    while (reader.live) {
        unrecognizedParameter(reader);
    }
}

template <class Pass>
void unknownCauseValue(Reader<Pass> &reader) {
    std::int32_t &errorOctets = reader.variables().errorOctets;
    read<unknownCauseLength>(reader, octetsAfterHead(errorOctets));
    if (reader.test(errorOctets >= 1)) {
        readRun<unknownCause>(reader, errorOctets);
    }
}

template <class Pass>
void causeOf(Reader<Pass> &reader, std::uint32_t code) {
    std::int32_t &errorOctets = reader.variables().errorOctets;
    switch (code) {
    case invalidStreamIdentifier:
        read<invalidStreamLength>(reader);
        read<invalidStream>(reader);
        return read<invalidStreamReserved>(reader);
    case missingMandatoryParameter: return missingParameters(reader);
    case staleCookie: read<staleCookieLength>(reader); return read<staleness>(reader);
    case outOfResource: return read<outOfResourceLength>(reader);
    case unresolvableAddress:
        read<unresolvableLength>(reader, octetsAfterHead(errorOctets));
        return readRun<unresolvableValue>(reader, errorOctets);
    case unrecognizedChunkType:
        read<unrecognizedChunkLength>(reader, octetsAfterHead(errorOctets));
        return readRun<unrecognizedChunk>(reader, errorOctets);
    case invalidMandatoryParameter: return read<invalidMandatoryLength>(reader);
    case unrecognizedParametersCause: return unrecognizedParameterList(reader);
    case noUserData: read<noUserDataLength>(reader, octetsAfterHead(errorOctets)); return read<noUserDataTsn>(reader);
    case cookieWhileShuttingDown: return read<shuttingDownLength>(reader, octetsAfterHead(errorOctets));
    default: return unknownCauseValue(reader);
    }
}

// The block of a cause has the name of its code.
[[nodiscard]] constexpr BlockName causeBlock(std::uint32_t code) {
    const std::uint32_t row = rowNumber<causeCodeNames>(code);
    return row == 0 ? BlockName{"Unknown Cause Code"} : BlockName{causeCodeRows[row - 1].text};
}

// The list goes on while a round ends with a true condition, which mostly is that of a field that fitted. Whether
// anything is left does not matter. Usually the list ends with a limit that is longer than the bits left.
template <class Pass>
void causeList(Reader<Pass> &reader) {
    while (reader.live && reader.state->condition != 0) {
        const LimitedBlock<Pass> cause{reader, "Error Causes", bitsOf(reader.variables().errorOctets)};
        std::uint32_t code = 0;
        read<causeCode>(reader, &code);
        if (reader.live) {
            const Block<Pass> block{reader, causeBlock(code)};
            causeOf(reader, code);
        }
    }
}

template <class Pass>
void errorCauses(Reader<Pass> &reader) {
    reader.test(true);
    runOutOfLine<causeList<Pass>>(reader);
}

// clang-format off
using CauseFields = FieldList<
    causeCode,
    invalidStreamLength, invalidStream, invalidStreamReserved,
    missingLength, missingNumber, missingType,
    staleCookieLength, staleness,
    outOfResourceLength,
    unresolvableLength, unresolvableValue,
    unrecognizedChunkLength, unrecognizedChunk,
    invalidMandatoryLength,
    unrecognizedListLength,
    noUserDataLength, noUserDataTsn,
    shuttingDownLength,
    unknownCauseLength, unknownCause>;
// clang-format on

} // namespace netfloor::plugin::sctp
