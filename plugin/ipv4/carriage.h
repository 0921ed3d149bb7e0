// SPDX-License-Identifier: MIT
// Fields that have one declaration for each kind of carriage, so that a host sees by the id what a transport or
// ICMP header came in.
#pragma once

#include "frame/field.h"
#include "frame/step.h"
#include "tables/protocol_numbers.h"

namespace netfloor {

// Reads the variant for the protocol of the outermost header.
template <const Field &inIpInIp, const Field &inMinimalEncapsulation, const Field &other, class Pass,
          class Store = Unstored>
NETFLOOR_INLINE inline void readByCarriage(Reader<Pass> &at, Store into = {}) {
    switch (at.variables().outerProtocol) {
    case protocolIpInIp: return read<inIpInIp>(at, into);
    case protocolMinimalEncapsulation: return read<inMinimalEncapsulation>(at, into);
    default: return read<other>(at, into);
    }
}

} // namespace netfloor
