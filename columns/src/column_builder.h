// SPDX-License-Identifier: MIT
// Builds one column of a batch. Values come in the order of the rows; a row without a value is left out, and becomes
// null.
#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <memory>
#include <utility>

#include "arrays.h"
#include "netfloor-analysis/rows.h"

namespace netfloor {

// Zeros, and what was set among them.
class GrowingBuffer {
public:
    void setBit(std::size_t bit) {
        growTo(bit / 8 + 1);
        octets_[bit / 8] = static_cast<std::uint8_t>(octets_[bit / 8] | 1U << bit % 8);
    }
    template <typename Number>
    void setNumber(std::size_t place, Number number) {
        growTo((place + 1) * sizeof number);
        std::memcpy(&octets_[place * sizeof number], &number, sizeof number);
    }

    // So many octets of it; it is empty again.
    [[nodiscard]] Buffer take(std::size_t octets) {
        octets_.resize(octets);
        expected_ = octets;
        return std::exchange(octets_, {});
    }

private:
    void growTo(std::size_t octets) {
        if (octets_.size() < octets) {
            octets_.resize(std::max({octets, 2 * octets_.size(), expected_}));
        }
    }

    Buffer octets_;
    std::size_t expected_ = 0; // as many as the last time
};

class ColumnBuilder {
public:
    ColumnBuilder() = default;
    ColumnBuilder(const ColumnBuilder &) = delete;
    ColumnBuilder &operator=(const ColumnBuilder &) = delete;
    virtual ~ColumnBuilder() = default;

    virtual void set(std::size_t row, const Value &value) = 0;

    // The column with so many rows; the builder is empty again.
    [[nodiscard]] OwnedArray finish(std::size_t rows);

protected:
    void markPresent(std::size_t row) {
        present_.setBit(row);
        ++values_;
    }
    // Fills the buffers of the values.
    virtual void finishValues(std::size_t rows, ArrayParts &parts) = 0;

private:
    GrowingBuffer present_;
    std::size_t values_ = 0;
};

[[nodiscard]] std::unique_ptr<ColumnBuilder> makeBuilder(ColumnType type, bool binaryAddresses);

// The type of such a column.
[[nodiscard]] OwnedSchema makeColumnSchema(const Column &column, bool binaryAddresses);

} // namespace netfloor
