// SPDX-License-Identifier: MIT
// A parameter that the peer did not recognize, quoted in an INIT ACK (RFC 9260, section 3.3.3.1) or in an error cause
// (section 3.3.10.8).
#pragma once

#include "frame/block.h"
#include "frame/field.h"
#include "frame/field_list.h"
#include "frame/field_step.h"
#include "sctp/length.h"

namespace netfloor::plugin::sctp {

// clang-format off
inline constexpr Field unrecognizedType   {863, "        Unrecoginzed Parameter Type", octets(2),  "        %n=%u"};
inline constexpr Field unrecognizedLength {864, "        Length",                      octets(2),  "        %n=%u octet(s)"};
inline constexpr Field unrecognizedValue  {865, "                Value",               octetRun(), "                %n",     noNames, "0x%x"};
// clang-format on

template <class Pass>
void unrecognizedParameter(Reader<Pass> &reader) {
    std::int32_t &parameterOctets = reader.variables().parameterOctets;
    const Block<Pass> block{reader, "Unrecogonized Parameters"};
    read<unrecognizedType>(reader);
    read<unrecognizedLength>(reader, octetsAfterHead(parameterOctets));
    readRun<unrecognizedValue>(reader, parameterOctets);
}

using UnrecognizedParameterFields = FieldList<unrecognizedType, unrecognizedLength, unrecognizedValue>;

} // namespace netfloor::plugin::sctp
