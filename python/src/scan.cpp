// SPDX-License-Identifier: MIT
// Columns: Arrow records in capsules, as the Arrow PyCapsule interface has them.
#include <memory>
#include <optional>
#include <stdexcept>
#include <string>
#include <string_view>
#include <tuple>
#include <vector>

#include <nanobind/stl/optional.h>
#include <nanobind/stl/string.h>
#include <nanobind/stl/tuple.h>
#include <nanobind/stl/vector.h>

#include "module.h"
#include "netfloor-columns/column_stream.h"
#include "shards.h"

namespace nb = nanobind;

namespace netfloor::python {
namespace {

RowKind tableOf(std::string_view name) {
    std::string names;
    for (std::size_t kind = 0; kind < rowKinds; ++kind) {
        const std::string_view known = tableName(static_cast<RowKind>(kind));
        if (known == name) {
            return static_cast<RowKind>(kind);
        }
        names.append(names.empty() ? "" : ", ").append(known);
    }
    throw std::invalid_argument("'" + std::string(name) + "' is no table. There are: " + names + ".");
}

// Releases the record unless somebody has taken it out of the capsule.
template <typename Record>
void destroy(void *pointer) noexcept {
    const std::unique_ptr<Record> record(static_cast<Record *>(pointer));
    if (record->release != nullptr) {
        record->release(record.get());
    }
}

template <typename Record, typename Fill>
nb::capsule inCapsule(const char *name, Fill fill) {
    auto record = std::make_unique<Record>();
    fill(*record);
    return {record.release(), name, &destroy<Record>};
}

nb::capsule stream(const ColumnScan &scan) {
    return inCapsule<ArrowArrayStream>("arrow_array_stream", [&](ArrowArrayStream &out) { openColumns(scan, out); });
}

nb::capsule schema(const ColumnScan &scan) {
    return inCapsule<ArrowSchema>("arrow_schema", [&](ArrowSchema &out) { columnSchema(scan, out); });
}

using ColumnTuple = std::tuple<std::string, std::string, std::string, std::string, bool>;

std::vector<ColumnTuple> columnsOf(const std::string &table) {
    std::vector<ColumnTuple> rows;
    for (const Column &column : columns(tableOf(table))) {
        rows.emplace_back(plainName(column), column.name, typeName(column.type), column.meaning, column.isRequired);
    }
    return rows;
}

} // namespace

void addScan(nb::module_ &module) {
    nb::class_<ColumnScan>(module, "ColumnScan")
        .def(
            "__init__",
            [](ColumnScan *self, std::string path, const std::string &plugin, const std::string &table,
               std::vector<std::string> columns, std::string where, bool binaryAddresses,
               const std::optional<PlannedShard> &shard) {
                ColumnScan scan = {.path = std::move(path),
                                   .plugin = plugin,
                                   .table = tableOf(table),
                                   .columns = std::move(columns),
                                   .where = std::move(where),
                                   .binaryAddresses = binaryAddresses};
                if (shard) {
                    scan.shard = shard->plan;
                    scan.shard->path = scan.path; // which may be that of a copy
                }
                checkScan(scan);
                new (self) ColumnScan(std::move(scan));
            },
            nb::arg("path"), nb::arg("plugin"), nb::arg("table"), nb::arg("columns"), nb::arg("where"),
            nb::arg("binary_addresses"), nb::arg("shard").none())
        .def("stream", &stream)
        .def("schema", &schema);
    module.def("columns", &columnsOf, nb::arg("table"));
}

} // namespace netfloor::python
