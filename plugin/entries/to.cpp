// SPDX-License-Identifier: MIT
// The entry of the TO pass.
#include "entries/grammar.h"
#include "frame/entry.h"
#include "frame/export.h"
#include "frame/passes.h"

extern "C" NETFLOOR_EXPORT std::uint8_t NETFLOOR_CDECL vex_PreDecodeTO(PreDecodeContext *context) {
    using namespace netfloor::plugin;
    return runPass<ToPass<Grammar>, Grammar>(*context);
}
