// SPDX-License-Identifier: MIT
#include "printers/packed_rows.h"

namespace netfloor::cli {

namespace {

template <typename Plain>
void add(Output &out, const Plain &value) {
    out << std::string_view(reinterpret_cast<const char *>(&value), sizeof value);
}

void addOctets(Output &out, std::string_view octets) {
    add(out, static_cast<std::uint64_t>(octets.size()));
    out << octets;
}

} // namespace

void packRow(Output &out, const Row &row) {
    add(out, row.kind());
    add(out, row.present());
    const std::span<const Column> table = columns(row.kind());
    row.forEach([&](std::size_t column, const Value &value) {
        TextRoom room;
        switch (table[column].type) {
        case ColumnType::text: return addOctets(out, value.text);
        case ColumnType::address: return addOctets(out, addressText(value.octets, room));
        case ColumnType::octets:
            return addOctets(out, {reinterpret_cast<const char *>(value.octets.data()), value.octets.size()});
        default: return add(out, value.number);
        }
    });
}

PackedRows::Head PackedRows::takeHead() {
    const auto kind = take<RowKind>();
    return {kind, take<Row::Columns>()};
}

PackedValue PackedRows::takeValue(ColumnType type) {
    const auto number = take<std::uint64_t>();
    if (type != ColumnType::text && type != ColumnType::address && type != ColumnType::octets) {
        return {static_cast<std::int64_t>(number), {}};
    }
    const std::string_view octets = rest_.substr(0, number);
    rest_.remove_prefix(octets.size());
    return {0, octets};
}

} // namespace netfloor::cli
