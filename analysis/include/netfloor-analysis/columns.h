// SPDX-License-Identifier: MIT
// The columns of all tables: what a row of each kind can hold, with its name, type, unit and meaning. Each column is
// stated once, in src/column_table.h; outputs as tables, JSON and the page docs/columns.md take it from here.
#pragma once

#include <cstddef>
#include <cstdint>
#include <span>
#include <string>
#include <string_view>

namespace netfloor {

// What a row is about. A packet has rows of the other kinds inside it, each inside one of the kind before.
enum class RowKind : std::uint8_t {
    packet,
    layer, // an IP header with all that it carries up to the next IP header
    chunk, // of SCTP
    cause, // an error cause in an ABORT or ERROR chunk
};
inline constexpr std::size_t rowKinds = 4;

enum class ColumnType : std::uint8_t {
    boolean,
    u8,
    u16,
    u32,
    u64,
    time,    // signed nanoseconds since 1970-01-01 00:00:00 UTC
    address, // 4 octets of IPv4 or 16 of IPv6
    text,    // valid UTF-8
    octets,
};

struct Column {
    // "ip.ttl", as --where has it. A name without a dot is no field of a protocol.
    std::string_view name;
    ColumnType type = ColumnType::u32;
    std::string_view meaning;
    bool isRequired = false; // each row has it
    bool isRepeated = false; // from the row around this one, so that a table needs no join
    bool isEitherOf = false; // of columns for one protocol each, which have the same value

    // "ip" and "ttl".
    [[nodiscard]] constexpr std::string_view group() const {
        const std::size_t dot = name.find('.');
        return dot == std::string_view::npos ? std::string_view() : name.substr(0, dot);
    }
    [[nodiscard]] constexpr std::string_view field() const {
        return name.substr(name.find('.') + 1); // from 0 on without a dot: npos + 1 is 0
    }
};

// In the order in which outputs have them.
[[nodiscard]] std::span<const Column> columns(RowKind kind);

// "packets", "layers", "chunks", "causes".
[[nodiscard]] std::string_view tableName(RowKind kind);

// "a packet": what a row of the table is.
[[nodiscard]] std::string_view rowMeaning(RowKind kind);

// "ip_ttl": the name where a dot is no part of a name, as in SQL.
[[nodiscard]] std::string plainName(const Column &column);

// "u8", "time"...
[[nodiscard]] std::string_view typeName(ColumnType type);

} // namespace netfloor
