// SPDX-License-Identifier: MIT
// Payload of a protocol that the grammar does not know, after any header: one field for each octet.
#pragma once

#include "frame/block.h"
#include "frame/field.h"
#include "frame/field_list.h"
#include "frame/field_step.h"

namespace netfloor::plugin {

inline constexpr Field unknownProtocolData{285, "Unknown Protocol Data", octets(1), "%n=%x"};

template <class Pass>
void unknownData(Reader<Pass> &reader) {
    const Block<Pass> block{reader, ""};
    const std::int32_t payloadOctets = reader.variables().payloadOctets;
    if (payloadOctets > 0) {
        readCounted<unknownProtocolData>(reader, payloadOctets);
    }
}

using UnknownDataRows = Rows<FieldList<unknownProtocolData>>;

} // namespace netfloor::plugin
