// SPDX-License-Identifier: MIT
// The exports that describe the plug-in.
#include "netfloor/descriptors.h"
#include "frame/export.h"
#include "tables/descriptors.h"
#include "tables/layout_probes.h"

namespace {

constexpr const char *interfaceVersion = "RW1.02.01";

const void *pointerTo(std::int32_t index) {
    switch (index) {
    case NETFLOOR_TABLE_VERSION: return interfaceVersion;
    case NETFLOOR_TABLE_IDENTITY: return &netfloor::plugin::identity;
    case NETFLOOR_TABLE_FIELDS: return netfloor::plugin::fieldProbe.data();
    case NETFLOOR_TABLE_SAMPLE: return netfloor::plugin::tableProbe.data();
    default: return nullptr;
    }
}

const void *tableOf(std::int32_t index) {
    switch (index) {
    case NETFLOOR_TABLE_VERSION: return interfaceVersion;
    case NETFLOOR_TABLE_IDENTITY: return &netfloor::plugin::identity.slots;
    case NETFLOOR_TABLE_FIELDS: return &netfloor::plugin::fieldTable;
    case NETFLOOR_TABLE_SAMPLE: return netfloor::plugin::tableProbe.data() + netfloor::plugin::probeHead;
    case NETFLOOR_TABLE_VALUES: return netfloor::plugin::valueMap.data();
    case NETFLOOR_TABLE_POOL: return netfloor::plugin::valuePool.data();
    case NETFLOOR_TABLE_TEXTS: return netfloor::plugin::displayStrings.data();
    case NETFLOOR_TABLE_LAYOUTS: return netfloor::plugin::layouts.data();
    default: return nullptr;
    }
}

std::uint32_t give(const void *table, const void **out) {
    *out = table;
    return table == nullptr ? NETFLOOR_TABLE_UNKNOWN : NETFLOOR_TABLE_FOUND;
}

} // namespace

extern "C" NETFLOOR_EXPORT std::uint32_t NETFLOOR_CDECL vx_DLLGetPtr(std::int32_t index, const void **out) {
    return give(pointerTo(index), out);
}

extern "C" NETFLOOR_EXPORT std::uint32_t NETFLOOR_CDECL vx_DLLGetTable(std::int32_t index, const void **out) {
    return give(tableOf(index), out);
}
