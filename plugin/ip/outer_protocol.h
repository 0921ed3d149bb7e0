// SPDX-License-Identifier: MIT
// Fields that have one declaration for each outer protocol: a host sees by the id whether a transport or ICMP header
// came through a tunnel, and through which.
#pragma once

#include "frame/field.h"
#include "frame/field_step.h"
#include "names/ip_protocols.h"

namespace netfloor::plugin {

// Reads the declaration that belongs to the outer protocol.
template <const Field &inIpInIp, const Field &inMinimalEncapsulation, const Field &other, class Pass,
          class Store = Unstored>
NETFLOOR_INLINE inline void readByOuterProtocol(Reader<Pass> &reader, Store into = {}) {
    switch (reader.variables().outerProtocol) {
    case protocolIpInIp: return read<inIpInIp>(reader, into);
    case protocolMinimalEncapsulation: return read<inMinimalEncapsulation>(reader, into);
    default: return read<other>(reader, into);
    }
}

} // namespace netfloor::plugin
