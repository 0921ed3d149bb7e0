// SPDX-License-Identifier: MIT
// Reads Arrow records as a strict consumer: each rule of the C interface is checked, and each octet that a record
// promises is read, so that the address sanitizer sees it.
#pragma once

#include <string>
#include <vector>

#include "netfloor-columns/arrow_abi.h"

namespace netfloor::test {

using TextRow = std::vector<std::string>; // "-" for null

struct TextTable {
    std::vector<std::string> names;
    std::vector<std::string> formats;
    std::vector<TextRow> rows;
    std::vector<std::size_t> batches; // their rows
    std::string error;                // with which it ended
};

// Takes a stream to its end and releases all. A broken rule fails the test.
[[nodiscard]] TextTable readTable(ArrowArrayStream &stream);

// The values of one column; checks it.
[[nodiscard]] TextRow readColumn(const ArrowSchema &schema, const ArrowArray &array);

} // namespace netfloor::test
