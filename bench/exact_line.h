// SPDX-License-Identifier: MIT
// The MV and XTR passes over one IPv4 packet without options, with UDP and a payload, as straight lines written by
// hand: all guards, and every word that a host can see. They show what the boundary itself costs.
#pragma once

#include <netfloor/records.h>

namespace netfloor::bench {

// False where a guard does not hold; then nothing was written.
bool decodeByHand(PreDecodeContext &context);

// The same with the keys, in the places that the null host gave them.
bool extractByHand(XtrContext &context);

} // namespace netfloor::bench
