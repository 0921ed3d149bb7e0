// SPDX-License-Identifier: MIT
// Rows of one table, and those of its columns that are wanted, until they are handed over as a batch.
#pragma once

#include <cstddef>
#include <memory>
#include <vector>

#include "column_builder.h"
#include "netfloor-columns/column_stream.h"

namespace netfloor {

// The wanted columns by their places in the table. Throws std::invalid_argument for a name that is none.
[[nodiscard]] std::vector<std::size_t> wantedColumns(const ColumnScan &scan);

class Batch {
public:
    explicit Batch(const ColumnScan &scan);

    void add(const Row &row);
    [[nodiscard]] std::size_t rows() const { return rows_; }
    [[nodiscard]] bool isFull() const { return rows_ >= mostRows_ || octets_ >= mostOctets_; }

    // A record of the columns; the batch is empty again.
    [[nodiscard]] OwnedArray finish();

private:
    std::size_t mostRows_;
    std::size_t mostOctets_;
    std::size_t rows_ = 0;
    std::size_t octets_ = 0; // of all texts, addresses and runs of octets
    std::vector<std::unique_ptr<ColumnBuilder>> builders_;
    std::vector<ColumnBuilder *> byColumn_; // of the table; null where a column is not wanted
};

} // namespace netfloor
