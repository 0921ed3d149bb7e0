// SPDX-License-Identifier: MIT
// JSON lines: an object for each packet, out of its rows; docs/packet.schema.json describes it.
#include <array>
#include <string>
#include <vector>

#include "json_text.h"
#include "netfloor-analysis/columns.h"
#include "netfloor-analysis/rows.h"
#include "printers/json_fields.h"
#include "printers/json_schema.h"
#include "printers/printer.h"

namespace netfloor::cli {

namespace {

class JsonPrinter final : public Printer, private RowSink {
public:
    JsonPrinter(const Options &options, Output &out, Host &host) : Printer(options, out, host), rows_(host) {
        for (std::size_t kind = 0; kind < rowKinds; ++kind) {
            addKeys(static_cast<RowKind>(kind));
        }
        if (options.withFields) {
            fields_.emplace(host, out);
        }
    }

    void print(const PacketToPrint &packet) override {
        out() << "{\"schema\":" << packetSchemaNumber;
        if (!packet.file.empty()) {
            out() << ",\"file\":";
            writeJsonText(out(), packet.file);
        }
        out() << ',';
        rows_.read(packet.input(), *this);
        closeTo(1);
        out() << ']';
        if (fields_) {
            out() << ",\"fields\":[";
            fields_->write(packet.input());
            out() << ']';
        }
        out() << "}\n";
        open_ = 0;
    }

    void finish(const Tally & /*tally*/) override {}

    [[nodiscard]] bool hasHeadings() const override { return false; }

private:
    struct Key {
        std::string text; // "\"ttl\":"; empty: not shown
        std::string groupText;
        std::size_t group = 0; // 0: none
        ColumnType type = ColumnType::u32;
    };

    void addKeys(RowKind kind) {
        // Chunks and causes have fields of SCTP alone.
        const bool hasGroups = kind == RowKind::packet || kind == RowKind::layer;
        std::vector<Key> &keys = keys_[static_cast<std::size_t>(kind)];
        std::string_view before;
        std::size_t groups = 0;
        for (const Column &column : columns(kind)) {
            Key &key = keys.emplace_back();
            key.type = column.type;
            if (!isInJson(column)) {
                continue;
            }
            key.text = '"' + std::string(column.field()) + "\":";
            if (hasGroups && !column.group().empty()) {
                groups += column.group() == before ? 0 : 1;
                key.group = groups;
                key.groupText = '"' + std::string(column.group()) + "\":{";
            }
            before = column.group();
        }
    }

    // An object inside that of the kind before, all of which are still open.
    void row(const Row &row) override {
        const auto level = static_cast<std::size_t>(row.kind());
        closeTo(level);
        if (level != 0) {
            out() << (isFirst_ ? "{" : ",{");
        }
        writeValues(row);
        constexpr std::array<std::string_view, rowKinds> inner = {",\"layers\":[", ",\"chunks\":[", ",\"causes\":[",
                                                                  "}"};
        out() << inner[level];
        open_ = level + 1;
        if (row.kind() == RowKind::cause) { // has nothing inside
            open_ = level;
        }
        isFirst_ = row.kind() != RowKind::cause;
        if (level != 0) {
            out().mayFlush();
        }
    }

    void closeTo(std::size_t level) {
        for (; open_ > level; --open_) {
            out() << "]}";
            isFirst_ = false;
        }
    }

    void writeValues(const Row &row) {
        const std::vector<Key> &keys = keys_[static_cast<std::size_t>(row.kind())];
        std::size_t group = 0;
        bool isFirst = true;
        row.forEach([&](std::size_t column, const Value &value) {
            const Key &key = keys[column];
            if (key.text.empty()) {
                return;
            }
            if (group != 0 && key.group != group) {
                out() << '}';
                isFirst = false;
            }
            out() << (isFirst ? "" : ",");
            if (key.group != 0 && key.group != group) {
                out() << key.groupText;
            }
            out() << key.text;
            writeValue(key.type, value);
            group = key.group;
            isFirst = false;
        });
        out() << (group != 0 ? "}" : "");
    }

    void writeValue(ColumnType type, const Value &value) {
        switch (type) {
        case ColumnType::boolean: out() << (value.number != 0 ? "true" : "false"); break;
        case ColumnType::u8:
        case ColumnType::u16:
        case ColumnType::u32:
        case ColumnType::u64: out() << value.number; break;
        case ColumnType::time: time_.write(out(), value.time()); break;
        case ColumnType::text: writeJsonText(out(), value.text); break;
        case ColumnType::octets: writeJsonOctets(out(), value.octets); break;
        case ColumnType::address: {
            TextRoom room;
            out() << '"' << addressText(value.octets, room) << '"';
            break;
        }
        }
    }

    PacketRows rows_;
    std::optional<JsonFields> fields_;
    std::array<std::vector<Key>, rowKinds> keys_; // by kind and column
    JsonTime time_;
    std::size_t open_ = 0; // objects, one inside the other
    bool isFirst_ = true;  // of the objects in the innermost array
};

} // namespace

std::unique_ptr<Printer> makeJsonPrinter(const Options &options, Output &out, Host &host) {
    return std::make_unique<JsonPrinter>(options, out, host);
}

} // namespace netfloor::cli
