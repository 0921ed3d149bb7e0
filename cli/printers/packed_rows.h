// SPDX-License-Identifier: MIT
// Rows as octets, so that one thread can read them out of packets and another one can write them to a database.
#pragma once

#include <cstdint>
#include <cstring>
#include <string_view>

#include "netfloor-analysis/rows.h"
#include "output.h"

namespace netfloor::cli {

// What a database keeps of a value: a number, or the characters of a text, or octets. An address is text.
struct PackedValue {
    std::int64_t number = 0;
    std::string_view octets;
};

// Adds a row to the output.
void packRow(Output &out, const Row &row);

// Takes rows from the front of such an output.
class PackedRows {
public:
    explicit PackedRows(std::string_view packed) : rest_(packed) {}

    [[nodiscard]] bool isEmpty() const { return rest_.empty(); }

    // Of the first row. Its values follow by `takeValue`, one for each column that is present.
    struct Head {
        RowKind kind;
        Row::Columns present;
    };
    [[nodiscard]] Head takeHead();
    [[nodiscard]] PackedValue takeValue(ColumnType type);

private:
    template <typename Plain>
    [[nodiscard]] Plain take() {
        Plain value;
        std::memcpy(&value, rest_.data(), sizeof value);
        rest_.remove_prefix(sizeof value);
        return value;
    }

    std::string_view rest_;
};

} // namespace netfloor::cli
