// SPDX-License-Identifier: MIT
// ICMPv6 (RFC 2463).
//
//    0      7 8     15 16            31
//   +--------+--------+----------------+
//   |  Type  |  Code  |    Checksum    |
//   +--------+--------+----------------+
//   | Unused, MTU, Pointer, or         |
//   | Identifier     | Sequence Number |
//   +----------------+-----------------+
//   | Invoking packet, or data ...     |
//
// The invoking packet is not decoded: it is a list of octets. Messages above 129, such as those of neighbour discovery,
// are not read after the type.
#pragma once

#include <array>
#include <cstdint>

#include "frame/block.h"
#include "frame/field.h"
#include "frame/field_list.h"
#include "frame/field_step.h"
#include "ip/unknown_data.h"

namespace netfloor::plugin::icmpv6 {

enum : std::uint32_t {
    typeUnreachable = 1,
    typeTooBig = 2,
    typeTimeExceeded = 3,
    typeParameterProblem = 4,
    typeFirstUndefined = 5,
    typeLastUndefined = 127,
    typeEchoRequest = 128,
    typeEchoReply = 129,
};

inline constexpr std::array classRows = {ValueName{0, "Error Message"}, ValueName{1, "Informational Message"}};
inline constexpr std::array typeRows = {
    ValueName{typeUnreachable, "Destination Unreachable"},
    ValueName{typeTooBig, "Packet Too Big"},
    ValueName{typeTimeExceeded, "Time Exceeded"},
    ValueName{typeParameterProblem, "Parameter Problem"},
    ValueName{typeFirstUndefined, typeLastUndefined, "Undefined"},
    ValueName{typeEchoRequest, "Echo Request"},
    ValueName{typeEchoReply, "Echo Reply"},
};
inline constexpr std::array unreachableRows = {
    ValueName{0, "no route to destination"},
    ValueName{1, "communication with destination administratively prohibited"},
    ValueName{2, "no assigned"},
    ValueName{3, "address unreachable"},
    ValueName{4, "port unreachable"},
};
inline constexpr std::array timeExceededRows = {
    ValueName{0, "hop limit exceeded in transit "},
    ValueName{1, "fragment reassembly time exceeded "},
};
inline constexpr std::array parameterProblemRows = {
    ValueName{0, "erroraneous header field encountered "},
    ValueName{1, "unrecognized Next Header type encountered "},
    ValueName{2, "unrecognized IPv6 option encountered "},
};

inline constexpr ValueNames classNames{classRows};
inline constexpr ValueNames typeNames{typeRows};
inline constexpr ValueNames unreachableNames{unreachableRows};
inline constexpr ValueNames timeExceededNames{timeExceededRows};
inline constexpr ValueNames parameterProblemNames{parameterProblemRows};

// Each octet of the checksum, the data and the invoking packet is a field of its own.
// clang-format off
inline constexpr Field messageClass             {246, "Message Type",      bit(7),    "%n=%-S", &classNames};
inline constexpr Field messageType              {247, "ICMP Message Type", octets(1), "%n=%-S", &typeNames};

inline constexpr Field unreachableCode          {251, "Code ",             octets(1), "%n=%-S", &unreachableNames};
inline constexpr Field unreachableChecksum      {252, "Checksum ",         octets(1), "%n=%x"};
inline constexpr Field unreachableUnused        {253, "Unused",            octets(4), "%n",     noNames,                "%x"};
inline constexpr Field unreachablePacket        {255, "Invoking Packet ",  octets(1), "%n=%x"};

inline constexpr Field tooBigCode               {256, "Code ",             octets(1), "%n=%u"};
inline constexpr Field tooBigChecksum           {257, "Checksum ",         octets(1), "%n=%x"};
inline constexpr Field tooBigMtu                {258, "MTU ",              octets(4), "%n=%u"};
inline constexpr Field tooBigPacket             {260, "Invoking Packet ",  octets(1), "%n=%x"};

inline constexpr Field timeExceededCode         {261, "Code ",             octets(1), "%n=%-S", &timeExceededNames};
inline constexpr Field timeExceededChecksum     {262, "Checksum ",         octets(1), "%n=%x"};
inline constexpr Field timeExceededUnused       {263, "Unused",            octets(4), "%n",     noNames,                "%x"};
inline constexpr Field timeExceededPacket       {265, "Invoking Packet ",  octets(1), "%n=%x"};

inline constexpr Field parameterProblemCode     {266, "Code ",             octets(1), "%n=%-S", &parameterProblemNames};
inline constexpr Field parameterProblemChecksum {267, "Checksum ",         octets(1), "%n=%x"};
inline constexpr Field parameterProblemPointer  {268, "Pointer ",          octets(4), "%n=%x"};
inline constexpr Field parameterProblemPacket   {270, "Invoking Packet ",  octets(1), "%n=%x"};

inline constexpr Field echoRequestCode          {271, "Code ",             octets(1), "%n=%u"};
inline constexpr Field echoRequestChecksum      {272, "Checksum ",         octets(1), "%n=%x"};
inline constexpr Field echoRequestIdentifier    {273, "Identifier ",       octets(2), "%n=%x"};
inline constexpr Field echoRequestSequence      {274, "Sequence Number ",  octets(2), "%n=%x"};
inline constexpr Field echoRequestData          {276, "Data ",             octets(1), "%n=%x"};

inline constexpr Field echoReplyCode            {277, "Code ",             octets(1), "%n=%u"};
inline constexpr Field echoReplyChecksum        {278, "Checksum ",         octets(1), "%n=%x"};
inline constexpr Field echoReplyIdentifier      {279, "Identifier ",       octets(2), "%n=%x"};
inline constexpr Field echoReplySequence        {280, "Sequence Number ",  octets(2), "%n=%x"};
inline constexpr Field echoReplyData            {282, "Data ",             octets(1), "%n=%x"};
// clang-format on

inline constexpr std::int32_t typeOctets = 1;
inline constexpr std::int32_t octetsAfterType = 7;

// Reads the message after its type: `fixed` are the fields of the header's second word.
template <const Field &code, const Field &checksum, const Field &data, const Field &...fixed, class Pass>
NETFLOOR_INLINE inline void body(Reader<Pass> &reader) {
    auto &variables = reader.variables();
    const Block<Pass> block{reader, ""};
    read<code>(reader);
    readCounted<checksum>(reader, 2);
    (read<fixed>(reader), ...);
    if (reader.live) {
        variables.payloadOctets -= octetsAfterType;
    }
    readCounted<data>(reader, variables.payloadOctets);
}

template <class Pass>
NETFLOOR_INLINE inline void bodyOf(Reader<Pass> &reader, std::uint32_t type) {
    switch (type) {
    case typeUnreachable:
        return body<unreachableCode, unreachableChecksum, unreachablePacket, unreachableUnused>(reader);
    case typeTooBig: return body<tooBigCode, tooBigChecksum, tooBigPacket, tooBigMtu>(reader);
    case typeTimeExceeded:
        return body<timeExceededCode, timeExceededChecksum, timeExceededPacket, timeExceededUnused>(reader);
    case typeParameterProblem:
        return body<parameterProblemCode, parameterProblemChecksum, parameterProblemPacket, parameterProblemPointer>(
            reader);
    case typeEchoRequest:
        return body<echoRequestCode, echoRequestChecksum, echoRequestData, echoRequestIdentifier, echoRequestSequence>(
            reader);
    case typeEchoReply:
        return body<echoReplyCode, echoReplyChecksum, echoReplyData, echoReplyIdentifier, echoReplySequence>(reader);
    default:
        if (type >= typeFirstUndefined && type <= typeLastUndefined) {
            runOutOfLine<unknownData<Pass>>(reader);
        }
    }
}

template <class Pass>
NETFLOOR_INLINE inline void message(Reader<Pass> &reader) {
    std::uint32_t type = 0;
    const Block<Pass> block{reader, " IPv6 - ICMP"};
    read<messageClass>(reader);
    read<messageType>(reader, &type);
    if (reader.live) {
        reader.variables().payloadOctets -= typeOctets;
        bodyOf(reader, type);
    }
}

// clang-format off
using MessageRows = Rows<
    FieldList<
        messageClass, messageType,
        unreachableCode, unreachableChecksum, unreachableUnused, unreachablePacket,
        tooBigCode, tooBigChecksum, tooBigMtu, tooBigPacket,
        timeExceededCode, timeExceededChecksum, timeExceededUnused, timeExceededPacket,
        parameterProblemCode, parameterProblemChecksum, parameterProblemPointer, parameterProblemPacket,
        echoRequestCode, echoRequestChecksum, echoRequestIdentifier, echoRequestSequence, echoRequestData,
        echoReplyCode, echoReplyChecksum, echoReplyIdentifier, echoReplySequence, echoReplyData>,
    FieldList<
        messageType, unreachableCode, tooBigCode, timeExceededCode, parameterProblemCode,
        echoRequestCode, echoReplyCode>>;
// clang-format on

} // namespace netfloor::plugin::icmpv6
