// SPDX-License-Identifier: MIT
// Builds one column of a batch. Values come in the order of the rows; a row without a value is left out, and becomes
// null.
#pragma once

#include <cstddef>
#include <memory>

#include "arrays.h"
#include "netfloor-analysis/rows.h"

namespace netfloor {

class ColumnBuilder {
public:
    ColumnBuilder() = default;
    ColumnBuilder(const ColumnBuilder &) = delete;
    ColumnBuilder &operator=(const ColumnBuilder &) = delete;
    virtual ~ColumnBuilder() = default;

    void set(std::size_t row, const Value &value);

    // The column with so many rows; the builder is empty again.
    [[nodiscard]] OwnedArray finish(std::size_t rows);

protected:
    // Fills the buffers of the values.
    virtual void finishValues(std::size_t rows, ArrayParts &parts) = 0;

private:
    virtual void keep(std::size_t row, const Value &value) = 0;

    Buffer present_;
    std::size_t values_ = 0;
};

[[nodiscard]] std::unique_ptr<ColumnBuilder> makeBuilder(ColumnType type, bool binaryAddresses);

// The type of such a column.
[[nodiscard]] OwnedSchema makeColumnSchema(const Column &column, bool binaryAddresses);

} // namespace netfloor
