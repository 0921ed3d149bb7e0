// SPDX-License-Identifier: MIT
#include "database.h"

#include "output.h"
#include "sqlite_library.h"

namespace netfloor::cli {

namespace {

constexpr int patienceMilliseconds = 5000; // where another program has it locked

} // namespace

void Database::Close::operator()(sqlite3 *database) const {
    sqlite().close(database);
}

void Statement::Close::operator()(sqlite3_stmt *statement) const {
    sqlite().finish(statement);
}

Database::Database(const std::filesystem::path &path) : name_(path.string()) {
    sqlite3 *opened = nullptr;
    // One thread uses it at a time, so that SQLite needs no locks of its own.
    constexpr int flags = SQLITE_OPEN_READWRITE | SQLITE_OPEN_CREATE | SQLITE_OPEN_NOMUTEX;
    const int result = sqlite().open(name_.c_str(), &opened, flags, nullptr);
    database_.reset(opened);
    if (opened == nullptr) {
        throw std::bad_alloc();
    }
    if (result != SQLITE_OK) {
        fail();
    }
    sqlite().busyTimeout(opened, patienceMilliseconds);
}

void Database::fail() const {
    if (sqlite().errorCode(database_.get()) == SQLITE_NOMEM) {
        throw std::bad_alloc();
    }
    throw OutputError(name_ + " cannot be written: " + sqlite().error(database_.get()) + ".");
}

void Database::run(const std::string &sql) const {
    if (sqlite().run(database_.get(), sql.c_str(), nullptr, nullptr, nullptr) != SQLITE_OK) {
        fail();
    }
}

Statement Database::prepare(const std::string &sql) const {
    sqlite3_stmt *statement = nullptr;
    if (sqlite().prepare(database_.get(), sql.c_str(), -1, SQLITE_PREPARE_PERSISTENT, &statement, nullptr) !=
        SQLITE_OK) {
        fail();
    }
    return {*this, statement};
}

std::int64_t Database::number(const std::string &sql) const {
    const Statement statement = prepare(sql);
    if (sqlite().step(statement.statement_.get()) != SQLITE_ROW) {
        fail();
    }
    return sqlite().columnNumber(statement.statement_.get(), 0);
}

std::int64_t Database::lastRow() const {
    return sqlite().lastRow(database_.get());
}

void Statement::check(int result) const {
    if (result != SQLITE_OK) {
        database_->fail();
    }
}

void Statement::bind(int place, std::int64_t number) const {
    check(sqlite().bindNumber(statement_.get(), place, number));
}

void Statement::bind(int place, std::string_view text) const {
    check(sqlite().bindText(statement_.get(), place, text.data(), text.size(), SQLITE_STATIC, SQLITE_UTF8));
}

void Statement::bindOctets(int place, std::string_view octets) const {
    // A null pointer would be a null, and no blob without octets.
    const void *const data = octets.empty() ? "" : octets.data();
    check(sqlite().bindOctets(statement_.get(), place, data, octets.size(), SQLITE_STATIC));
}

void Statement::step() const {
    const int result = sqlite().step(statement_.get());
    if (result != SQLITE_DONE) {
        database_->fail();
    }
    check(sqlite().reset(statement_.get()));
}

void Statement::unbind(int place) const {
    check(sqlite().bindNull(statement_.get(), place));
}

} // namespace netfloor::cli
