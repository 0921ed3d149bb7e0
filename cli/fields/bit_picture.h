// SPDX-License-Identifier: MIT
// Where the bits of a field lie, in words and as a picture.
#pragma once

#include <string>

#include "netfloor-host/field_tables.h"

namespace netfloor::cli {

// "5-8", "1-5, 9-16", "1-8, 4 times, 8 bits apart", "1-8, as often as the packet tells, 8 bits apart". Bits count from
// 1, within an octet from the least significant up.
[[nodiscard]] std::string placeText(const FieldLayout &layout);

// The octets from the cursor on, as RFCs draw them, the most significant bit of each octet first. Each piece of the
// field has a letter, in the order of the table; a dot is a bit of another field. A variable field is drawn once.
//
//      0
//      0 1 2 3 4 5 6 7
//     +-+-+-+-+-+-+-+-+
//     |a a a a|. . . .|
//     +-+-+-+-+-+-+-+-+
[[nodiscard]] std::string bitPicture(const FieldDescription &field);

} // namespace netfloor::cli
