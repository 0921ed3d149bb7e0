// SPDX-License-Identifier: MIT
// libhd_HostDispatch: gives the next layer to its owner.
#include "links.h"

NETFLOOR_STANDIN std::int32_t hd_PreDecode(PreDecodeContext *context, std::uint32_t mode) {
    return netfloor::standin::operationsOf(context).preDecode(mode);
}
