// SPDX-License-Identifier: MIT
// libhd_HostDispatch: the road from one layer to the next.
#include "links.h"

[[gnu::visibility("default")]] std::int32_t hd_PreDecode(PreDecodeContext *context, std::uint32_t mode) {
    return netfloor::standin::operationsOf(context).preDecode(mode);
}
