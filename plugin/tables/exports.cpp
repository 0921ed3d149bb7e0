// SPDX-License-Identifier: MIT
// The exports that describe the plug-in.
#include "frame/export.h"
#include "netfloor/descriptors.h"
#include "tables/descriptors.h"
#include "tables/probes.h"

namespace {

constexpr const char *interfaceVersion = "RW1.02.01";

const void *pointerTo(std::int32_t index) {
    switch (index) {
    case NETFLOOR_TABLE_VERSION: return interfaceVersion;
    case NETFLOOR_TABLE_IDENTITY: return &netfloor::identity;
    case NETFLOOR_TABLE_FIELDS: return netfloor::fieldProbe.data();
    case NETFLOOR_TABLE_SAMPLE: return netfloor::tableProbe.data();
    default: return nullptr;
    }
}

const void *tableOf(std::int32_t index) {
    switch (index) {
    case NETFLOOR_TABLE_VERSION: return interfaceVersion;
    case NETFLOOR_TABLE_IDENTITY: return &netfloor::identity.slots;
    case NETFLOOR_TABLE_FIELDS: return &netfloor::fieldTable;
    case NETFLOOR_TABLE_SAMPLE: return netfloor::tableProbe.data() + netfloor::probeHead;
    case NETFLOOR_TABLE_VALUES: return netfloor::valueMap.data();
    case NETFLOOR_TABLE_POOL: return netfloor::valuePool.data();
    case NETFLOOR_TABLE_TEXTS: return netfloor::displayStrings.data();
    case NETFLOOR_TABLE_LAYOUTS: return netfloor::layouts.data();
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
