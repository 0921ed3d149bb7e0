// SPDX-License-Identifier: MIT
// TCP (RFC 9293).
//
//    0                   1                   2                   3
//    0 1 2 3 4 5 6 7 8 9 0 1 2 3 4 5 6 7 8 9 0 1 2 3 4 5 6 7 8 9 0 1
//   +-------------------------------+-------------------------------+
//   |          Source Port          |       Destination Port        |
//   +-------------------------------+-------------------------------+
//   |                        Sequence Number                        |
//   +---------------------------------------------------------------+
//   |                    Acknowledgement Number                     |
//   +-------+-------+---+-+-+-+-+-+-+-------------------------------+
//   |  Data | Reser-|Re-|U|A|P|R|S|F|                               |
//   | Offset|  ved  |ser|R|C|S|S|Y|I|          Window Size          |
//   |       |       |ved|G|K|H|T|N|N|                               |
//   +-------+-------+---+-+-+-+-+-+-+-------------------------------+
//   |           Checksum            |        Urgent Pointer         |
//   +-------------------------------+-------------------------------+
//   |                      Options and padding                      |
//   +---------------------------------------------------------------+
//
// The checksum is not verified. The part after the acknowledgement number is a limited block, whose length comes from
// the Data Offset. If the Data Offset is below 3 or reaches past the packet, the payload is not handed to the next
// layer.
#pragma once

#include <cstdint>

#include "frame/block.h"
#include "frame/checked_run.h"
#include "frame/field.h"
#include "frame/field_list.h"
#include "frame/field_step.h"
#include "ip/hand_off.h"
#include "ip/outer_protocol.h"
#include "names/ports.h"
#include "transport/tcp_options.h"

namespace netfloor::plugin::tcp {

// clang-format off
inline constexpr Field sourcePort               {384, "TCP Source Port",        octetPair(),              "  %n=%-S (%u)",    &portNames, "TCP - %-s (%u)"};
inline constexpr Field destinationPortIpInIp    {387, "TCP Destination Port",   octetPair(),              "  %n=%-S (%u)",    &portNames, "IPinIP - TCP - %-s (%u)"};
inline constexpr Field destinationPortMinimal   {391, "TCP Destination Port",   octetPair(),              "  %n=%-S (%u)",    &portNames, "MIPinIP - TCP - %-s (%u)"};
inline constexpr Field destinationPort          {393, "TCP Destination Port",   octetPair(),              "  %n=%-S (%u)",    &portNames, "TCP - %-s (%u)"};
inline constexpr Field sequenceNumber           {394, "Sequence Number",        octets(4),                "%n=%u(dec)"};
inline constexpr Field acknowledgementNumber    {395, "Acknowledgement Number", octets(4),                "%n=%u(dec)"};
inline constexpr Field reservedBesideDataOffset {396, "Reserved",               piece(0, 3),              "  %n=%u"};

inline constexpr Field dataOffset               {398, "Data Offset",            piece(4, 7).advancing(8), "  %n=%u*4 octets"};
inline constexpr Field reservedBesideFlags      {399, "Reserved",               piece(6, 7),              "  %n=%u"};
inline constexpr Field urgent                   {400, "URG",                    bit(5),                   "  %n=%u"};
inline constexpr Field acknowledgement          {401, "ACK",                    bit(4),                   "  %n=%u"};
inline constexpr Field push                     {402, "PSH",                    bit(3),                   "  %n=%u"};
inline constexpr Field reset                    {403, "RST",                    bit(2),                   "  %n=%u"};
inline constexpr Field synchronize              {404, "SYN",                    bit(1),                   "  %n=%u"};
inline constexpr Field finish                   {405, "FIN",                    bit(0).advancing(8),      "  %n=%u"};
inline constexpr Field windowSize               {406, "Window Size",            octetPair(),              "  %n=%u(dec)",     noNames,    "%u"};
inline constexpr Field checksum                 {407, "Checksum",               octetPair(),              "  %n=%x"};
inline constexpr Field urgentPointer            {408, "Urgent Pointer",         octetPair(),              "  %n=%x"};
// clang-format on

struct TcpVariables : OptionVariables {
    std::uint32_t tcpLengthShort; // 1 once a header was longer than the payload of its datagram
};

inline constexpr std::int32_t fixedHeaderOctets = 20;

// The words of the header before its limited block.
inline constexpr std::uint32_t wordsBeforeLimit = 3;
inline constexpr std::uint32_t bitsPerWord = 32;
inline constexpr std::uint32_t bitsBeforeLimit = wordsBeforeLimit * bitsPerWord;

inline constexpr BlockName segmentName{"Transmission Control Protocol"};

// The fields in the limited block.
template <class Pass>
NETFLOOR_INLINE inline void fieldsFromDataOffset(Reader<Pass> &reader) {
    read<dataOffset>(reader);
    read<reservedBesideFlags>(reader);
    read<urgent>(reader);
    read<acknowledgement>(reader);
    read<push>(reader);
    read<reset>(reader);
    read<synchronize>(reader);
    read<finish>(reader);
    read<windowSize>(reader);
    read<checksum>(reader);
    read<urgentPointer>(reader);
}

// Reads the header from the Data Offset on and gives its length in octets. A Data Offset of 3 or 4 is too short for the
// fixed header: then the result is 3 or 4 octets, and the payload starts after the block.
template <class Pass>
NETFLOOR_INLINE inline std::int32_t limitedPart(Reader<Pass> &reader) {
    LimitedBlock<Pass> block{reader, limitedPartName};
    const std::uint32_t words = peek(reader, dataOffset.place).value_or(0);
    // For fewer than three words this wraps to a number larger than any packet.
    block.limit((words - wordsBeforeLimit) * bitsPerWord);
    fieldsFromDataOffset(reader);
    if (!reader.live) {
        return static_cast<std::int32_t>(words);
    }
    const auto headerOctets = static_cast<std::int32_t>(words * bitsPerWord / bitsPerOctet);
    reader.variables().tcpOptions.octets = headerOctets - fixedHeaderOctets;
    runOutOfLine<options<Pass>>(reader);
    return headerOctets;
}

// Subtracts the header from the payload. Once a header was longer than its payload, later headers of the packet are not
// subtracted.
template <class Pass>
NETFLOOR_INLINE inline void accountFor(Reader<Pass> &reader, std::int32_t headerOctets) {
    auto &variables = reader.variables();
    if (variables.payloadOctets < headerOctets) {
        variables.tcpLengthShort = 1;
        variables.payloadOctets = 0;
    }
    if (variables.tcpLengthShort == 0) {
        variables.payloadOctets -= headerOctets;
    }
}

template <class Pass>
NETFLOOR_INLINE inline void fieldsUpToDataOffset(Reader<Pass> &reader) {
    auto &variables = reader.variables();
    read<sourcePort>(reader, &variables.sourcePort);
    readByOuterProtocol<destinationPortIpInIp, destinationPortMinimal, destinationPort>(reader,
                                                                                        &variables.destinationPort);
    read<sequenceNumber>(reader);
    read<acknowledgementNumber>(reader);
    read<reservedBesideDataOffset>(reader);
}

template <class Pass>
NETFLOOR_INLINE inline void afterHeader(Reader<Pass> &reader, std::int32_t headerOctets) {
    if (reader.live) {
        accountFor(reader, headerOctets);
        tellNextLayer(reader);
    }
    if (reader.left > handOffAbove) {
        handOff(reader);
    }
}

template <class Pass>
NETFLOOR_INLINE inline void fromDataOffset(Reader<Pass> &reader) {
    afterHeader(reader, limitedPart(reader));
}

// The same in a checked run, for a header with a usual list of options.
template <const auto &kinds, class Pass>
NETFLOOR_INLINE inline void fromDataOffsetInRun(Reader<Pass> &reader) {
    constexpr std::uint32_t headerOctets = fixedHeaderOctets + octetsOfList<kinds>;
    {
        const LimitedBlock<Pass> block{reader, limitedPartName, headerOctets * bitsPerOctet - bitsBeforeLimit};
        expectFields<dataOffset, urgentPointer>(reader);
        fieldsFromDataOffset(reader);
        listInRun<kinds>(reader);
    }
    afterHeader(reader, headerOctets);
}

// Whether a checked run that has come to the Data Offset can go on with such a header.
template <const auto &kinds, class Pass>
[[nodiscard]] NETFLOOR_INLINE inline bool hasList(const Reader<Pass> &reader) {
    constexpr std::uint32_t headerBits = (fixedHeaderOctets + octetsOfList<kinds>)*bitsPerOctet;
    const auto &writer = reader.writer;
    return writer.isInRun() && reader.left >= headerBits - bitsBeforeLimit &&
           valueAt<dataOffset.place>(writer.octets(), writer.bit(), dataOffset.place.count) ==
               headerBits / bitsPerWord &&
           isList<kinds>(writer.octets(), writer.bit() + fixedHeaderOctets * bitsPerOctet - bitsBeforeLimit);
}

template <class Pass>
NETFLOOR_INLINE inline void headerAndPayload(Reader<Pass> &reader) {
    const Block<Pass> header{reader, segmentName};
    fieldsUpToDataOffset(reader);
    if constexpr (Pass::Writer::hasCheckedRuns) {
        if (hasList<timestampsAligned>(reader)) {
            return fromDataOffsetInRun<timestampsAligned>(reader);
        }
        if (hasList<noOptions>(reader)) {
            return fromDataOffsetInRun<noOptions>(reader);
        }
        runOutOfLine<fromDataOffset<Pass>>(reader);
    } else if (reader.live) {
        fromDataOffset(reader);
    }
}

template <class Pass>
NETFLOOR_INLINE inline void segment(Reader<Pass> &reader) {
    checkedRun<sourcePort, urgentPointer, headerAndPayload<Pass>>(reader);
}

// clang-format off
using SegmentRows = Rows<
    Joined<
        FieldList<
            sourcePort, destinationPortIpInIp, destinationPortMinimal, destinationPort,
            sequenceNumber, acknowledgementNumber,
            reservedBesideDataOffset, dataOffset, reservedBesideFlags,
            urgent, acknowledgement, push, reset, synchronize, finish,
            windowSize, checksum, urgentPointer>,
        OptionFields>,
    FieldList<
        sourcePort, destinationPortIpInIp, destinationPortMinimal, destinationPort,
        sequenceNumber, acknowledgementNumber, dataOffset, reset, synchronize, finish>>;

using FieldsOfTopOctet6 = FieldList<
    reservedBesideDataOffset, dataOffset, reservedBesideFlags,
    urgent, acknowledgement, push, reset, synchronize, finish,
    windowSize, checksum, urgentPointer>;
// clang-format on

} // namespace netfloor::plugin::tcp
