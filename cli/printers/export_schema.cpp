// SPDX-License-Identifier: MIT
#include "printers/export_schema.h"

#include <algorithm>
#include <map>
#include <set>
#include <string_view>

#include "netfloor-host/field_tables.h"
#include "netfloor-host/layer_fields.h"

namespace netfloor::cli {

namespace {

// Times are nanoseconds since 1970; datetime(time / 1000000000, 'unixepoch') shows one.
constexpr std::string_view captures = R"(
CREATE TABLE captures(capture INTEGER PRIMARY KEY, file TEXT NOT NULL, packets INTEGER NOT NULL, first_time INTEGER,
    last_time INTEGER, problem TEXT);
CREATE TABLE value_names(column TEXT NOT NULL, value INTEGER NOT NULL, name TEXT NOT NULL, PRIMARY KEY(column, value))
    WITHOUT ROWID;
)";

constexpr std::string_view views = R"(
-- Who sent to whom, also inside tunnels: a row for each pair of addresses and ports.
CREATE VIEW flows AS
    SELECT capture, layer, tunnel, ip_source, source_port, ip_destination, destination_port, ip_protocol,
        count(*) AS packets, min(time) AS first_time, max(time) AS last_time
    FROM layers
    GROUP BY capture, layer, tunnel, ip_source, source_port, ip_destination, destination_port, ip_protocol;

-- Each layer inside a tunnel with the layer that carries it.
CREATE VIEW tunnels AS
    SELECT inside.capture, inside.packet, inside.time, inside.tunnel, inside.tunnel_id,
        outside.ip_source AS outer_source, outside.ip_destination AS outer_destination,
        inside.ip_source, inside.source_port, inside.ip_destination, inside.destination_port, inside.ip_protocol
    FROM layers AS inside JOIN layers AS outside
        ON outside.capture = inside.capture AND outside.packet = inside.packet AND outside.layer = inside.layer - 1;

-- Each ABORT with its causes; without a cause, once.
CREATE VIEW aborts AS
    SELECT chunks.capture, chunks.packet, chunks.time, chunks.ip_source, chunks.sctp_source_port,
        chunks.ip_destination, chunks.sctp_destination_port, chunks.sctp_verification_tag, causes.cause_code,
        value_names.name AS cause_name, causes.cause_value
    FROM chunks
        LEFT JOIN causes USING(capture, packet, layer, chunk)
        LEFT JOIN value_names ON value_names.column = 'sctp_cause' AND value_names.value = causes.cause_code
    WHERE chunks.sctp_chunk_type = 6;

-- TSNs that a side of an association sent several times. Where it has several addresses, they may go to another one.
CREATE VIEW retransmissions AS
    SELECT capture, sctp_source_port, sctp_destination_port, sctp_verification_tag, sctp_tsn, sctp_stream,
        count(*) AS times, min(packet) AS first_packet, max(packet) AS last_packet,
        max(time) - min(time) AS nanoseconds
    FROM chunks
    WHERE sctp_chunk_type = 0 AND sctp_tsn IS NOT NULL
    GROUP BY capture, sctp_source_port, sctp_destination_port, sctp_verification_tag, sctp_tsn, sctp_stream
    HAVING count(*) > 1;
)";

std::string_view sqlType(ColumnType type) {
    switch (type) {
    case ColumnType::text:
    case ColumnType::address: return "TEXT";
    case ColumnType::octets: return "BLOB";
    default: return "INTEGER";
    }
}

std::string tableText(RowKind kind) {
    std::string text = "CREATE TABLE " + std::string(tableName(kind)) + "(capture INTEGER NOT NULL REFERENCES captures";
    for (const Column &column : columns(kind)) {
        text += ", " + plainName(column) + " ";
        text.append(sqlType(column.type)).append(column.isRequired ? " NOT NULL" : "");
    }
    return text + ");\n";
}

std::string sqlText(std::string_view text) {
    std::string result = "'";
    for (const char character : text) {
        result += character == '\'' ? "''" : std::string(1, character);
    }
    return result + "'";
}

// What the plug-in's tables call the values of a column. A column whose fields call one value by two names has none: a
// code of ICMP means what its type says.
std::string valueNamesText(std::span<const FieldDescription> fields) {
    std::map<std::string_view, std::map<std::uint32_t, std::string>> names; // by column
    std::set<std::string_view> ambiguous;
    for (const LayerFieldSource &row : layerFieldSources()) {
        const auto field = std::ranges::find_if(fields, [&row](const auto &one) { return row.field.fits(one); });
        if (field == fields.end()) {
            continue;
        }
        for (const NamedValue &value : field->values) {
            const std::string name = field->valueName(value.from);
            if (value.from == value.to && names[row.name].try_emplace(value.from, name).first->second != name) {
                ambiguous.insert(row.name);
            }
        }
    }
    std::string text;
    for (const auto &[column, values] : names) {
        for (const auto &[value, name] : values) {
            if (!ambiguous.contains(column)) {
                text += (text.empty() ? "INSERT INTO value_names VALUES(" : ",(") +
                        sqlText(plainName(Column{column, ColumnType::u32, {}})) + "," + std::to_string(value) + "," +
                        sqlText(name) + ")";
            }
        }
    }
    return text + ";\n";
}

} // namespace

std::string tablesText(Host &host) {
    std::string text = "PRAGMA application_id = " + std::to_string(exportApplication) +
                       ";\nPRAGMA user_version = " + std::to_string(exportSchemaNumber) + ";\n";
    text += captures;
    for (std::size_t kind = 0; kind < rowKinds; ++kind) {
        text += tableText(static_cast<RowKind>(kind));
    }
    text += views;
    return text + valueNamesText(host.fieldTables().fields());
}

std::string indexesText() {
    return "CREATE INDEX packets_by_number ON packets(capture, packet);\n"
           "CREATE INDEX layers_by_number ON layers(capture, packet, layer);\n"
           "CREATE INDEX layers_by_source ON layers(ip_source);\n"
           "CREATE INDEX layers_by_destination ON layers(ip_destination);\n"
           "CREATE INDEX chunks_by_number ON chunks(capture, packet, layer, chunk);\n"
           "CREATE INDEX chunks_by_type ON chunks(sctp_chunk_type);\n"
           "CREATE INDEX causes_by_number ON causes(capture, packet, layer, chunk, cause);\n";
}

std::string insertText(RowKind kind) {
    std::string text = "INSERT INTO " + std::string(tableName(kind)) + " VALUES(?";
    for (std::size_t column = 0; column < columns(kind).size(); ++column) {
        text += ",?";
    }
    return text + ")";
}

} // namespace netfloor::cli
