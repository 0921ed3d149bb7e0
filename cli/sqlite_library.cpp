// SPDX-License-Identifier: MIT
#include "sqlite_library.h"

#include <string>

#include <dlfcn.h>

#include "output.h"

namespace netfloor::cli {

namespace {

constexpr const char *fileName = "libsqlite3.so.0";

template <typename Function>
void find(void *library, const char *name, Function &function) {
    function = library == nullptr ? nullptr : reinterpret_cast<Function>(::dlsym(library, name));
    if (function == nullptr) {
        throw OutputError(std::string("a database needs SQLite, and ") + fileName +
                          " is missing or too old (Debian: apt-get install libsqlite3-0).");
    }
}

SqliteLibrary load() {
    void *const library = ::dlopen(fileName, RTLD_LAZY | RTLD_LOCAL);
    SqliteLibrary found{};
    find(library, "sqlite3_open_v2", found.open);
    find(library, "sqlite3_close_v2", found.close);
    find(library, "sqlite3_busy_timeout", found.busyTimeout);
    find(library, "sqlite3_errcode", found.errorCode);
    find(library, "sqlite3_errmsg", found.error);
    find(library, "sqlite3_exec", found.run);
    find(library, "sqlite3_prepare_v3", found.prepare);
    find(library, "sqlite3_bind_int64", found.bindNumber);
    find(library, "sqlite3_bind_text64", found.bindText);
    find(library, "sqlite3_bind_blob64", found.bindOctets);
    find(library, "sqlite3_bind_null", found.bindNull);
    find(library, "sqlite3_step", found.step);
    find(library, "sqlite3_reset", found.reset);
    find(library, "sqlite3_finalize", found.finish);
    find(library, "sqlite3_column_int64", found.columnNumber);
    find(library, "sqlite3_last_insert_rowid", found.lastRow);
    return found;
}

} // namespace

const SqliteLibrary &sqlite() {
    static const SqliteLibrary loaded = load();
    return loaded;
}

} // namespace netfloor::cli
