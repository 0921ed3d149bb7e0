// SPDX-License-Identifier: MIT
#include "netfloor-analysis/columns.h"

#include <algorithm>
#include <array>

#include "column_table.h"

namespace netfloor {

std::span<const Column> columns(RowKind kind) {
    return column_table::of(kind);
}

std::string_view tableName(RowKind kind) {
    constexpr std::array<std::string_view, rowKinds> names = {"packets", "layers", "chunks", "causes"};
    return names[static_cast<std::size_t>(kind)];
}

std::string_view rowMeaning(RowKind kind) {
    constexpr std::array<std::string_view, rowKinds> meanings = {
        "a packet", "an IP header with all that it carries up to the next IP header", "a chunk of SCTP",
        "an error cause in an ABORT or ERROR chunk of SCTP"};
    return meanings[static_cast<std::size_t>(kind)];
}

std::string plainName(const Column &column) {
    std::string name(column.name);
    std::ranges::replace(name, '.', '_');
    return name;
}

std::string_view typeName(ColumnType type) {
    constexpr std::array<std::string_view, 9> names = {"boolean", "u8",      "u16",  "u32",   "u64",
                                                       "time",    "address", "text", "octets"};
    return names[static_cast<std::size_t>(type)];
}

} // namespace netfloor
