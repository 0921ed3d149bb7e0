// SPDX-License-Identifier: MIT
// The tables, indexes and views of `export` as SQL.
#pragma once

#include <cstdint>
#include <string>

#include "netfloor-analysis/columns.h"
#include "netfloor-host/plugin_host.h"

namespace netfloor::cli {

// PRAGMA user_version: rises when a column goes away or changes its meaning.
inline constexpr std::int64_t exportSchemaNumber = 1;
// PRAGMA application_id, by which `file` and others tell what a database is for: "nflr".
inline constexpr std::int64_t exportApplication = 0x6e666c72;

// All tables and views, and the names of values out of the plug-in's tables.
[[nodiscard]] std::string tablesText(Host &host);
[[nodiscard]] std::string indexesText();
// With a parameter for each column, the capture first.
[[nodiscard]] std::string insertText(RowKind kind);

} // namespace netfloor::cli
