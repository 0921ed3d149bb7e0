// SPDX-License-Identifier: MIT
// Where the bits of a field lie, in words and as a picture.
#pragma once

#include <string>

#include "netfloor-host/field_tables.h"

namespace netfloor::cli {

// "5-8", "1-5, 9-16", "1-32, octet by octet", "16-1, 8 times, 16 bits apart", "from 1 on, octet by octet, as far as the
// packet tells". Bits count from 1, within an octet from the least significant up.
[[nodiscard]] std::string placeText(const FieldLayout &layout);

// The octets from the cursor on in the geometry of RFCs, the most significant bit of each octet first, under the
// numbers that all reports have for their bits. The pieces of the field are boxes of x; a dot is a bit of another
// field. Of a variable field whole octets are drawn, once. Empty where the tables do not tell.
//
//      8 7 6 5 4 3 2 1
//     +-+-+-+-+-+-+-+-+
//     |x x x x|. . . .|
//     +-+-+-+-+-+-+-+-+
[[nodiscard]] std::string bitPicture(const FieldDescription &field);

} // namespace netfloor::cli
