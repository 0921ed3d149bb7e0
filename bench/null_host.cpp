// SPDX-License-Identifier: MIT
#include "null_host.h"

#include <cstdlib>

#include <netfloor/host.h>

using namespace netfloor::bench;

void *hs_Malloc(std::size_t size) {
    return std::malloc(size);
}

void *hs_Realloc(void *old, std::size_t size) {
    return std::realloc(old, size);
}

std::int32_t hs_CreateNewLayerInfo(PreDecodeContext *) {
    return 0;
}

std::int32_t hs_AddDecodedFieldsData(PreDecodeContext *, std::uint32_t, const BitRange *, const char *, std::uint32_t,
                                     const char *, std::uint32_t, std::uint32_t, std::uint32_t) {
    return 0;
}

std::int32_t hs_AddFieldsToDisplayData(PreDecodeContext *, const char *, std::uint32_t) {
    return 0;
}

// The owner of every next layer takes all that is left.
std::int32_t hd_PreDecode(PreDecodeContext *context, std::uint32_t) {
    DecodeState &state = *context->decodeState;
    state.cursor += state.bitsLeft;
    state.bitsLeft = 0;
    return 0;
}

std::int32_t hx_InitialiseOptXTR(KeyFieldRow *table, std::uint32_t rowCount, std::uint16_t *) {
    if (rowCount > mostKeyRows) {
        return -1;
    }
    for (std::size_t row = 0; row < rowCount; ++row) {
        table[row].presenceOffset = static_cast<std::uint32_t>(presencePlace(row));
        table[row].presenceMask = presenceMask(row);
        table[row].valueOffset = static_cast<std::uint32_t>(valuePlace(row));
    }
    return 1;
}
