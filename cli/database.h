// SPDX-License-Identifier: MIT
// A SQLite file that is written to, by one thread at a time. All functions throw OutputError, with SQLite's own words.
#pragma once

#include <cstdint>
#include <filesystem>
#include <memory>
#include <string>
#include <string_view>

struct sqlite3;
struct sqlite3_stmt;

namespace netfloor::cli {

class Statement;

class Database {
public:
    // Opens the file, or creates it. A transaction that was not committed is undone at the end.
    explicit Database(const std::filesystem::path &path);

    void run(const std::string &sql) const;
    [[nodiscard]] Statement prepare(const std::string &sql) const;
    // The one number that a query gives.
    [[nodiscard]] std::int64_t number(const std::string &sql) const;

    [[nodiscard]] std::int64_t lastRow() const;

private:
    friend class Statement;
    struct Close {
        void operator()(sqlite3 *database) const;
    };

    [[noreturn]] void fail() const;

    std::string name_;
    std::unique_ptr<sqlite3, Close> database_;
};

// Places of values are counted from 1. Texts and octets must live until `step`. What is not bound is null.
class Statement {
public:
    void bind(int place, std::int64_t number) const;
    void bind(int place, std::string_view text) const;
    void bindOctets(int place, std::string_view octets) const;
    void unbind(int place) const;

    // Runs it, and makes it ready to be run again. Values stay bound until others are.
    void step() const;

private:
    friend class Database;
    struct Close {
        void operator()(sqlite3_stmt *statement) const;
    };

    Statement(const Database &database, sqlite3_stmt *statement) : database_(&database), statement_(statement) {}
    void check(int result) const;

    const Database *database_;
    std::unique_ptr<sqlite3_stmt, Close> statement_;
};

} // namespace netfloor::cli
