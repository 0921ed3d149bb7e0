// SPDX-License-Identifier: MIT
// The parameters of INIT and INIT ACK (RFC 9260, sections 3.2.1, 3.3.2 and 3.3.3).
//
//    0                   1                   2                   3
//    0 1 2 3 4 5 6 7 8 9 0 1 2 3 4 5 6 7 8 9 0 1 2 3 4 5 6 7 8 9 0 1
//   +-------------------------------+-------------------------------+
//   |         Parameter Type        |            Length             |
//   +-------------------------------+-------------------------------+
//   |                             Value                             |
//   +---------------------------------------------------------------+
//
// The two lists differ in the types that they know. A parameter of INIT is a limited block: a field that does not fit
// ends the parameter only, and octets after its value are skipped. In an INIT ACK the next parameter starts after the
// last field of the previous one, with padding or not, and a field that does not fit ends the walk over the chunks.
#pragma once

#include <array>
#include <cstdint>

#include "frame/block.h"
#include "frame/field.h"
#include "frame/field_list.h"
#include "frame/field_step.h"
#include "ip/ipv6_address.h"
#include "sctp/length.h"
#include "sctp/unrecognized_parameter.h"

namespace netfloor::plugin::sctp {

enum ParameterType : std::uint32_t {
    ipv4AddressType = 5,
    ipv6AddressType = 6,
    stateCookieType = 7,
    unrecognizedParametersType = 8,
    cookiePreservativeType = 9,
    hostNameType = 11,
    supportedAddressesType = 12,
    ecnCapableType = 32768,
};

inline constexpr std::array initParameterRows = {
    ValueName{ipv4AddressType, "IPv4 Address"},
    ValueName{ipv6AddressType, "IPv6 Address"},
    ValueName{cookiePreservativeType, "Cookie Preservative"},
    ValueName{hostNameType, "Host Name Address"},
    ValueName{supportedAddressesType, "Supported Address Types"},
    ValueName{ecnCapableType, "Reserved for ECN Capable"},
};
inline constexpr std::array initAckParameterRows = {
    ValueName{ipv4AddressType, "IPv4 Address"},   ValueName{ipv6AddressType, "IPv6 Address"},
    ValueName{stateCookieType, "State Cookie"},   ValueName{unrecognizedParametersType, "Unrecognized Parameters"},
    ValueName{hostNameType, "Host Name Address"}, ValueName{ecnCapableType, "Reserved for ECN Capable"},
};
inline constexpr std::array addressTypeRows = {
    ValueName{ipv4AddressType, "IPv4 Address"},
    ValueName{ipv6AddressType, "IPv6 Address"},
    ValueName{hostNameType, "Host Name Address"},
};

inline constexpr ValueNames initParameterNames{.rows = initParameterRows, .otherwise = "UNKNOWN"};
inline constexpr ValueNames initAckParameterNames{.rows = initAckParameterRows, .otherwise = "UNKNOWN"};
inline constexpr ValueNames addressTypeNames{.rows = addressTypeRows, .otherwise = "Unknow Address Type"};

// clang-format off
inline constexpr Field initParameterType       {847, "Parameter Type",                               octets(2),  "%n=%-S",                     &initParameterNames};
inline constexpr Field initParameterLength     {848, "      Length",                                 octets(2),  "      %n=%u octet(s)"};
inline constexpr Field initAckParameterType    {851, "Parameter Type",                               octets(2),  "%n=%-S",                     &initAckParameterNames};
inline constexpr Field initAckParameterLength  {852, "      Length",                                 octets(2),  "      %n=%u octet(s)"};

inline constexpr Field ipv4Address             {855, "        IP Address",                           octets(4),  R"(        %n=%-["%u":"."])"};
inline constexpr Field cookieLifeSpanIncrement {867, "        Suggested Cookie Life-span Increment", octets(4),  "        %n=%u (msec.)"};
inline constexpr Field hostName                {868, "        Host Name",                            octetRun(), R"(        %n=%-["%c"])"};
inline constexpr Field supportedAddressType    {870, "        Address Type",                         octets(2),  "        %n=%-S",             &addressTypeNames};
inline constexpr Field ecnCapable              {871, "        Reserved",                             octetRun(), "        %n",                 noNames,                "%x"};
inline constexpr Field unknownParameter        {872, "        Reserved",                             octetRun(), "        %n",                 noNames,                "%x"};
inline constexpr Field stateCookie             {857, "        State Cookie",                         octetRun(), R"(        %n=%-["%x"])"};
// clang-format on

// Subtracts a parameter from the octets of its list: its Length less 8, not its Length. So a list seldom ends with its
// last parameter; it ends with the bits.
template <class Pass>
void subtractParameter(Reader<Pass> &reader, std::int32_t &listOctets) {
    if (reader.live) {
        listOctets -= reader.variables().parameterOctets - headOctets;
    }
}

// Whether the list has another parameter, by that count. The test is made also after a field that did not fit.
template <class Pass>
[[nodiscard]] bool listGoesOn(Reader<Pass> &reader, std::int32_t listOctets) {
    return reader.test(listOctets >= 1) && reader.live;
}

// A parameter whose value is one field, of a fixed size or of the size that the Length gives.
template <const Field &field, class Pass>
void parameterOf(Reader<Pass> &reader, BlockName name) {
    if (!reader.live) {
        return;
    }
    const Block<Pass> block{reader, name};
    if constexpr (field.place.isRun()) {
        readRun<field>(reader, reader.variables().parameterOctets);
    } else {
        read<field>(reader);
    }
}

template <class Pass>
void ipv6AddressParameter(Reader<Pass> &reader) {
    if (!reader.live) {
        return;
    }
    const Block<Pass> block{reader, "IPv6 Address"};
    runOutOfLine<ipv6::reversedAddress<Report::toldToHost, Pass>>(reader);
}

// The types that both lists know, and those that neither does.
template <class Pass>
void commonParameter(Reader<Pass> &reader, std::uint32_t type) {
    switch (type) {
    case ipv4AddressType: return parameterOf<ipv4Address>(reader, "IPv4 Address");
    case ipv6AddressType: return ipv6AddressParameter(reader);
    case hostNameType: return parameterOf<hostName>(reader, "Host Name Address");
    case ecnCapableType: return parameterOf<ecnCapable>(reader, "Reserved for ECN Capable");
    default: return parameterOf<unknownParameter>(reader, "Reserved for ECN Capable");
    }
}

// From here on `parameterOctets` is the number of types, which is then subtracted from the list.
template <class Pass>
void supportedAddressTypes(Reader<Pass> &reader) {
    if (!reader.live) {
        return;
    }
    std::int32_t &typeCount = reader.variables().parameterOctets;
    const Block<Pass> block{reader, "Supported Address Types"};
    typeCount /= 2;
    readCounted<supportedAddressType>(reader, typeCount);
}

template <class Pass>
void initParameter(Reader<Pass> &reader) {
    std::uint32_t type = 0;
    read<initParameterType>(reader, &type);
    read<initParameterLength>(reader, octetsAfterHead(reader.variables().parameterOctets));
    switch (type) {
    case cookiePreservativeType: return parameterOf<cookieLifeSpanIncrement>(reader, "Cookie Preservative");
    case supportedAddressesType: return supportedAddressTypes(reader);
    default: return commonParameter(reader, type);
    }
}

template <class Pass>
void initParameters(Reader<Pass> &reader) {
    auto &variables = reader.variables();
    BlockChain<Pass> chain{reader};
    while (listGoesOn(reader, variables.chunkOctets)) {
        chain.open("Init Option Container");
        const std::uint32_t start = reader.cursor;
        {
            LimitedBlock<Pass> parameter{reader, "Init Option"};
            parameter.limit(limitFromLength<valueLengthAhead>(reader, octetsAfterHead(variables.parameterOctets)));
            initParameter(reader);
            subtractParameter(reader, variables.chunkOctets);
        }
        // A parameter of Length 0 would be read again for ever. If less than a type is left, the next round computes
        // another limit, which ends the list and raises its flag.
        if (reader.cursor == start && reader.left >= typeBits) {
            reader.live = false;
        }
    }
}

// The inner parameters overwrite `parameterOctets`, so that the last of them is subtracted from the outer list.
template <class Pass>
void unrecognizedParameters(Reader<Pass> &reader) {
    if (!reader.live) {
        return;
    }
    std::int32_t unrecognizedOctets = reader.variables().parameterOctets;
    const Block<Pass> block{reader, "Unrecognized Parameters"};
    BlockChain<Pass> chain{reader};
    while (listGoesOn(reader, unrecognizedOctets)) {
        chain.open("");
        unrecognizedParameter(reader);
        subtractParameter(reader, unrecognizedOctets);
    }
}

template <class Pass>
void initAckParameter(Reader<Pass> &reader) {
    std::uint32_t type = 0;
    read<initAckParameterType>(reader, &type);
    read<initAckParameterLength>(reader, octetsAfterHead(reader.variables().parameterOctets));
    switch (type) {
    case stateCookieType: return parameterOf<stateCookie>(reader, "State Cookie");
    case unrecognizedParametersType: return unrecognizedParameters(reader);
    default: return commonParameter(reader, type);
    }
}

template <class Pass>
void initAckParameters(Reader<Pass> &reader) {
    auto &variables = reader.variables();
    BlockChain<Pass> chain{reader};
    while (listGoesOn(reader, variables.chunkOctets)) {
        chain.open("InitAck Options Container");
        {
            const Block<Pass> parameter{reader, "InitAck Option"};
            initAckParameter(reader);
        }
        subtractParameter(reader, variables.chunkOctets);
    }
}

// The parameters that both chunks know are listed with INIT, which comes first.
// clang-format off
using InitParameterFields = FieldList<
    initParameterType, initParameterLength,
    ipv4Address, cookieLifeSpanIncrement, ecnCapable, hostName, supportedAddressType, unknownParameter>;

using InitAckParameterFields = Joined<
    FieldList<initAckParameterType, initAckParameterLength, stateCookie>,
    UnrecognizedParameterFields>;

using FieldsOfTopOctet6 = FieldList<initParameterLength, initAckParameterLength>;
// clang-format on

} // namespace netfloor::plugin::sctp
