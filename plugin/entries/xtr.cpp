// SPDX-License-Identifier: MIT
// The entry of the XTR pass.
#include "entries/grammar.h"
#include "frame/entry.h"
#include "frame/export.h"
#include "frame/passes.h"

extern "C" NETFLOOR_EXPORT std::int32_t NETFLOOR_CDECL XTR_netfloor(XtrContext *context) {
    using namespace netfloor::plugin;
    return runPass<XtrPass<Grammar>, Grammar>(*context);
}
