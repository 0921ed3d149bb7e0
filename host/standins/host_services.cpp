// SPDX-License-Identifier: MIT
// libhs_HostServices: the heap, the list of layers and the output of fields.
#include "links.h"

using netfloor::standin::allocateBlock;
using netfloor::standin::BlockHead;
using netfloor::standin::headOf;
using netfloor::standin::operationsOf;

NETFLOOR_STANDIN void *hs_Malloc(std::size_t size) {
    return allocateBlock(nullptr, size);
}

NETFLOOR_STANDIN void *hs_Realloc(void *old, std::size_t size) {
    if (old == nullptr) {
        return allocateBlock(nullptr, size);
    }
    BlockHead *const head = headOf(old);
    const bool allowed = head->keeper == nullptr || head->keeper->allowsGrowth(size);
    if (!allowed || size > SIZE_MAX - sizeof(BlockHead)) {
        return nullptr;
    }
    auto *const moved = static_cast<BlockHead *>(std::realloc(head, sizeof(BlockHead) + size));
    return moved == nullptr ? nullptr : moved + 1;
}

NETFLOOR_STANDIN std::int32_t hs_CreateNewLayerInfo(PreDecodeContext *context) {
    operationsOf(context).growLayerInfo();
    return 0;
}

NETFLOOR_STANDIN std::int32_t hs_AddDecodedFieldsData(PreDecodeContext *context, std::uint32_t outputRangeCount,
                                                      const BitRange *ranges, const char *display, std::uint32_t zero,
                                                      const char *fieldName, std::uint32_t fieldId,
                                                      std::uint32_t otherZero, std::uint32_t bitOrder) {
    return operationsOf(context).addField(outputRangeCount, ranges, display, zero, fieldName, fieldId, otherZero,
                                          bitOrder);
}

NETFLOOR_STANDIN std::int32_t hs_AddFieldsToDisplayData(PreDecodeContext *context, const char *display,
                                                        std::uint32_t displayId) {
    operationsOf(context).addDisplay(display, displayId);
    return 0;
}
