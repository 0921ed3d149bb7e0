// SPDX-License-Identifier: MIT
// The entry of the XTR pass.
#include "entries/grammar.h"
#include "frame/entry.h"
#include "frame/export.h"
#include "frame/passes.h"

extern "C" NETFLOOR_EXPORT std::int32_t NETFLOOR_CDECL XTR_netfloor(XtrContext *context) {
    using namespace netfloor::plugin;
    using Pass = XtrPass<Grammar>;
    const std::optional<Outcome> outcome = runPass<Pass, Grammar>(*context);
    if (!outcome) {
        return Pass::keyFieldStatus;
    }
    return *outcome == Outcome::cutOff ? 0 : 1;
}
