// SPDX-License-Identifier: MIT
// The columns of all tables as a page of reference in Markdown.
#include <array>

#include "fields/fields.h"
#include "netfloor-analysis/columns.h"

namespace netfloor::cli {

namespace {

constexpr std::string_view tablesIntroduction =
    R"(# Tables and their columns

What `netfloor json` and `netfloor export` tell of a packet. This page is written by the command, and a test compares the two;
after a change of the columns, write it anew:

    netfloor fields --tables > docs/columns.md

- **column**: the name. `ip.ttl` is a field that `--where` asks for by the same name; it is the column `ip_ttl` of a database, and
  `ttl` of the object `ip` in JSON. In the objects of chunks it is the last part alone: `tsn`.
- **type**: `u8` to `u64` are numbers without a sign of so many bits. An `address` is text, as `10.0.0.1` or in the form of RFC 5952,
  `octets` are a blob or hexadecimal text, and a `time` is a number of nanoseconds or, in JSON, ISO 8601.
- **each row**: whether it is always there. Otherwise it is null, or left out of JSON, where the packet does not have it.
- **repeated** columns have the value of the row around theirs, so that a table needs no join. JSON leaves them out, as it has
  the objects inside one another, and so it does with a column **of either** protocol.
)";

std::string_view remarkOf(const Column &column) {
    return column.isRepeated ? "repeated" : column.isEitherOf ? "of either" : "";
}

} // namespace

std::string tablesText() {
    std::string text(tablesIntroduction);
    for (const RowKind kind : {RowKind::packet, RowKind::layer, RowKind::chunk, RowKind::cause}) {
        text.append("\n## ").append(tableName(kind)).append("\n\nA row is ").append(rowMeaning(kind));
        text += ".\n\n| column | type | each row | remark | meaning |\n|---|---|---|---|---|\n";
        for (const Column &column : columns(kind)) {
            text.append("| `").append(column.name).append("` | ").append(typeName(column.type));
            text.append(" | ").append(column.isRequired ? "yes" : "").append(" | ").append(remarkOf(column));
            text.append(" | ").append(column.meaning).append(" |\n");
        }
    }
    return text;
}

} // namespace netfloor::cli
