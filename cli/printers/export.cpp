// SPDX-License-Identifier: MIT
// Rows into the tables of a SQLite file, in one transaction for each capture: it is there as a whole, or not at all.
#include <optional>
#include <string>
#include <vector>

#include "database.h"
#include "netfloor-analysis/columns.h"
#include "netfloor-analysis/rows.h"
#include "netfloor-host/field_tables.h"
#include "printers/export_schema.h"
#include "printers/packed_rows.h"
#include "printers/printer.h"

namespace netfloor::cli {

namespace {

// An INSERT for the rows of one kind.
class Table {
public:
    Table(const Database &database, RowKind kind)
        : columns_(columns(kind)), insert_(database.prepare(insertText(kind))) {}

    // A row of which the head has been taken.
    void add(std::int64_t capture, const Row::Columns &present, PackedRows &values) {
        insert_.bind(1, capture);
        for (std::size_t word = 0; word < present.size(); ++word) {
            before_[word] &= ~present[word];
        }
        Row::forEachColumn(before_, [&](std::size_t column) { insert_.unbind(place(column)); });
        Row::forEachColumn(present, [&](std::size_t column) { bind(column, values); });
        insert_.step();
        before_ = present;
    }

private:
    static int place(std::size_t column) { return static_cast<int>(column) + 2; } // the capture is the first

    void bind(std::size_t column, PackedRows &values) const {
        const ColumnType type = columns_[column].type;
        const PackedValue value = values.takeValue(type);
        switch (type) {
        case ColumnType::text:
        case ColumnType::address: insert_.bind(place(column), value.octets); break;
        case ColumnType::octets: insert_.bindOctets(place(column), value.octets); break;
        default: insert_.bind(place(column), value.number); break;
        }
    }

    std::span<const Column> columns_;
    Statement insert_;
    Row::Columns before_ = {}; // what the row before had
};

// The file, from the first capture on.
struct Tables {
    explicit Tables(const std::filesystem::path &path) : database(path) {}

    Database database;
    std::vector<Table> tables; // by kind of row; none as long as the file has no tables
    bool isNew = false;        // the tables are not committed
};

class ExportPrinter final : public Printer, private RowSink {
public:
    ExportPrinter(const Options &options, Output &out, Host &host) : Printer(options, out, host), rows_(host) {}

    void startCapture(std::string_view name) override {
        if (!file_) {
            file_.emplace(options().to);
        } else if (isOpen_) { // the capture before did not come to its end
            file_->database.run("ROLLBACK");
            file_->tables.clear();
        }
        file_->database.run("BEGIN IMMEDIATE");
        isOpen_ = true;
        if (file_->tables.empty()) {
            openTables();
        }
        const Statement insert = file_->database.prepare("INSERT INTO captures(file, packets) VALUES(?1, 0)");
        insert.bind(1, name);
        insert.step();
        capture_ = file_->database.lastRow();
    }

    // In a thread that has no captures, the rows are what it prints.
    void print(const PacketToPrint &packet) override {
        const Output::Mark start = out().mark();
        rows_.read(packet.input(), *this);
        if (isOpen_) {
            write(out().since(start));
            out().takeBack(start);
        }
    }

    void write(std::string_view printed) override {
        PackedRows rows(printed);
        while (!rows.isEmpty()) {
            const PackedRows::Head head = rows.takeHead();
            file_->tables[static_cast<std::size_t>(head.kind)].add(capture_, head.present, rows);
        }
    }

    void endCapture(std::string_view problem) override {
        const Statement update = file_->database.prepare(
            "UPDATE captures SET (packets, first_time, last_time) = "
            "(SELECT count(*), min(time), max(time) FROM packets WHERE packets.capture = ?1), problem = ?2 "
            "WHERE capture = ?1");
        update.bind(1, capture_);
        if (!problem.empty()) {
            update.bind(2, problem);
        }
        if (file_->isNew) { // before the update, which needs an index; sorting at the end is faster than keeping order
            file_->database.run(indexesText());
        }
        update.step();
        file_->database.run("COMMIT");
        file_->isNew = false;
        isOpen_ = false;
    }

    void finish(const Tally & /*tally*/) override {}

    [[nodiscard]] bool hasHeadings() const override { return false; }

private:
    void openTables() {
        const Database &database = file_->database;
        const std::int64_t version = database.number("PRAGMA user_version");
        file_->isNew = database.number("SELECT count(*) FROM sqlite_schema") == 0;
        if (file_->isNew) {
            database.run(tablesText(host()));
        } else if (version != exportSchemaNumber || database.number("PRAGMA application_id") != exportApplication) {
            throw UsageError("--append: " + options().to.string() +
                             " has other tables than this version of export writes. Name another file.");
        }
        for (std::size_t kind = 0; kind < rowKinds; ++kind) {
            file_->tables.emplace_back(database, static_cast<RowKind>(kind));
        }
    }

    void row(const Row &row) override { packRow(out(), row); }

    PacketRows rows_;
    std::optional<Tables> file_;
    bool isOpen_ = false; // a transaction
    std::int64_t capture_ = 0;
};

} // namespace

std::unique_ptr<Printer> makeExportPrinter(const Options &options, Output &out, Host &host) {
    return std::make_unique<ExportPrinter>(options, out, host);
}

} // namespace netfloor::cli
