// SPDX-License-Identifier: MIT
// Code by hand for one kind of packet and nothing else: IPv4 without options + UDP, whole and unfragmented. It is
// the least cost, with which the passes are compared.
#pragma once

#include <cstdint>

#include <netfloor/records.h>

namespace netfloor::bench {

// The 22 fields with the texts, names, ids and bit ranges of the MD pass, a call of the host for each.
void reportByHand(PreDecodeContext &context, const std::uint8_t *packet);

// The key fields of the XTR pass, by direct loads into the places that the null host gave them.
void storeKeysByHand(std::uint8_t *keyRecord, const std::uint8_t *packet);

} // namespace netfloor::bench
