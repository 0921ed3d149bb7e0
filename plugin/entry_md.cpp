// SPDX-License-Identifier: MIT
// The entry of the MD pass.
#include "frame/entry.h"
#include "frame/export.h"
#include "frame/outputs.h"
#include "grammar.h"

extern "C" NETFLOOR_EXPORT std::uint8_t NETFLOOR_CDECL vex_PreDecodeMD(PreDecodeContext *context) {
    using namespace netfloor;
    return runPass<MdPass<Grammar>, Grammar>(*context) == Outcome::cutOff ? 0 : 1;
}
