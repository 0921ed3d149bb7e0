// SPDX-License-Identifier: MIT
// The functions of SQLite that are used, loaded when the first of them is: one command of several needs them, and the
// loader would relocate SQLite at each start.
#pragma once

#include <sqlite3.h>

namespace netfloor::cli {

struct SqliteLibrary {
    decltype(&sqlite3_open_v2) open;
    decltype(&sqlite3_close_v2) close;
    decltype(&sqlite3_busy_timeout) busyTimeout;
    decltype(&sqlite3_errcode) errorCode;
    decltype(&sqlite3_errmsg) error;
    decltype(&sqlite3_exec) run;
    decltype(&sqlite3_prepare_v3) prepare;
    decltype(&sqlite3_bind_int64) bindNumber;
    decltype(&sqlite3_bind_text64) bindText;
    decltype(&sqlite3_bind_blob64) bindOctets;
    decltype(&sqlite3_bind_null) bindNull;
    decltype(&sqlite3_step) step;
    decltype(&sqlite3_reset) reset;
    decltype(&sqlite3_finalize) finish;
    decltype(&sqlite3_column_int64) columnNumber;
    decltype(&sqlite3_last_insert_rowid) lastRow;
};

// Throws OutputError when SQLite is not installed. It stays loaded.
[[nodiscard]] const SqliteLibrary &sqlite();

} // namespace netfloor::cli
