// SPDX-License-Identifier: MIT
// libhx_KeyOptions: the set-up of the key-field table.
#include "links.h"

namespace {

// What a plug-in gets that is entered without this host.
constexpr std::int32_t keysRefused = -1;

thread_local netfloor::standin::KeyOptions *optionsOfThread = nullptr;

} // namespace

NETFLOOR_STANDIN void netfloor_setKeyOptions(netfloor::standin::KeyOptions *options) {
    optionsOfThread = options;
}

NETFLOOR_STANDIN std::int32_t hx_InitialiseOptXTR(KeyFieldRow *table, std::uint32_t rowCount,
                                                  std::uint16_t *presenceRow) {
    return optionsOfThread == nullptr ? keysRefused : optionsOfThread->initialise(table, rowCount, presenceRow);
}
