// SPDX-License-Identifier: MIT
#include "batch.h"

#include <algorithm>
#include <numeric>
#include <stdexcept>
#include <string>
#include <utility>

namespace netfloor {
namespace {

std::size_t findColumn(const ColumnScan &scan, const std::string &name) {
    const std::span<const Column> table = columns(scan.table);
    const auto found = std::ranges::find_if(
        table, [&](const Column &column) { return column.name == name || plainName(column) == name; });
    if (found == table.end()) {
        std::string sentence =
            "'" + name + "' is no column of the table " + std::string(tableName(scan.table)) + ". It has: ";
        for (const Column &column : table) {
            sentence += (column.name == table.front().name ? "" : ", ") + plainName(column);
        }
        throw std::invalid_argument(sentence + ".");
    }
    return static_cast<std::size_t>(found - table.begin());
}

} // namespace

std::vector<std::size_t> wantedColumns(const ColumnScan &scan) {
    std::vector<std::size_t> wanted(columns(scan.table).size());
    if (scan.columns.empty()) {
        std::iota(wanted.begin(), wanted.end(), 0);
        return wanted;
    }
    wanted.clear();
    for (const std::string &name : scan.columns) {
        const std::size_t column = findColumn(scan, name);
        if (std::ranges::find(wanted, column) != wanted.end()) {
            throw std::invalid_argument("The column '" + name + "' is asked for twice.");
        }
        wanted.push_back(column);
    }
    return wanted;
}

Batch::Batch(const ColumnScan &scan)
    : mostRows_(scan.batchRows), mostOctets_(scan.batchOctets), byColumn_(columns(scan.table).size()) {
    for (const std::size_t column : wantedColumns(scan)) {
        builders_.push_back(makeBuilder(columns(scan.table)[column].type, scan.binaryAddresses));
        byColumn_[column] = builders_.back().get();
    }
}

void Batch::add(const Row &row) {
    row.forEach([&](std::size_t column, const Value &value) {
        if (byColumn_[column] != nullptr) {
            byColumn_[column]->set(rows_, value);
            octets_ += value.text.size() + value.octets.size();
        }
    });
    ++rows_;
}

OwnedArray Batch::finish() {
    ArrayParts parts;
    const std::size_t rows = std::exchange(rows_, 0);
    octets_ = 0;
    parts.length = static_cast<std::int64_t>(rows);
    for (const std::unique_ptr<ColumnBuilder> &builder : builders_) {
        parts.children.push_back(builder->finish(rows));
    }
    return makeArray(std::move(parts));
}

} // namespace netfloor
