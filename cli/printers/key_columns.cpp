// SPDX-License-Identifier: MIT
#include "printers/key_columns.h"

#include <algorithm>
#include <array>

#include "exit_code.h"
#include "text.h"

namespace netfloor::cli {

namespace {

// Of the names that stand for several fields, those of which a layer has one.
constexpr std::span portColumns = std::span(jointFields).first(2);

std::optional<KeyColumn> findColumn(std::string_view name) {
    if (const auto ports = std::ranges::find(portColumns, name, &JointField::name); ports != portColumns.end()) {
        return KeyColumn{std::string(name), {ports->fields.begin(), ports->fields.end()}};
    }
    const auto field = findLayerField(name);
    return field ? std::optional(KeyColumn{std::string(name), {*field}}) : std::nullopt;
}

// Each name with the plug-in's own one.
std::string allNames() {
    std::string text = "'source_port', 'destination_port'";
    std::string_view before;
    for (const LayerFieldSource &row : layerFieldSources()) {
        if (row.name != before) {
            text.append(", '").append(row.name).append("' (").append(row.field.name).append(")");
        }
        before = row.name;
    }
    return text;
}

bool needsQuotes(std::string_view text) {
    return text.find_first_of(",\"\r\n") != std::string_view::npos || text.starts_with(' ') || text.ends_with(' ');
}

} // namespace

void writeCsv(Output &out, std::string_view text) {
    if (!needsQuotes(text)) {
        out << text;
        return;
    }
    out << '"';
    for (const char character : text) {
        out << character;
        if (character == '"') {
            out << '"';
        }
    }
    out << '"';
}

std::vector<KeyColumn> keyColumns(const std::vector<std::string> &names, bool perChunk) {
    static const std::vector<std::string> ofLayer = {"ip.source", "source_port", "ip.destination", "destination_port",
                                                     "ip.protocol"};
    static const std::vector<std::string> ofChunk = {"ip.source",        "source_port",          "ip.destination",
                                                     "destination_port", "sctp.chunk_type",      "sctp.tsn",
                                                     "sctp.stream",      "sctp.payload_protocol"};
    std::vector<KeyColumn> columns;
    for (const std::string &name : names.empty() ? (perChunk ? ofChunk : ofLayer) : names) {
        auto column = findColumn(name);
        if (!column) {
            throw UsageError("--column '" + name +
                             "': there is no such column. There are (with the plug-in's name): " + allNames() + ".");
        }
        columns.push_back(std::move(*column));
    }
    return columns;
}

void KeyRows::write(const LayerView &view, std::uint16_t ipLayer, const Layer *chunk) const {
    for (const KeyColumn &column : columns_) {
        out_ << ',';
        bool isFirst = true;
        for (const Layer &layer : view.layers()) {
            if (layer.ipLayer != ipLayer || (chunk != nullptr && layer.kind == LayerKind::chunk && &layer != chunk)) {
                continue;
            }
            const auto field =
                std::ranges::find_if(column.fields, [&](LayerField wanted) { return view.has(layer, wanted); });
            if (field != column.fields.end()) {
                out_ << (isFirst ? "" : ";");
                isFirst = false;
                writeValue(view, layer, *field);
            }
        }
    }
}

void KeyRows::writeValue(const LayerView &view, const Layer &layer, LayerField field) const {
    const LayerValue kind = view.valueKind(layer, field);
    if (kind == LayerValue::number || kind == LayerValue::packetNumber) {
        out_ << *view.number(layer, field);
        return;
    }
    if (!raw_ && kind != LayerValue::octets) {
        TextRoom room;
        out_ << view.address(layer, field, room);
        return;
    }
    for (const std::uint8_t octet : view.octets(layer, field)) {
        out_.octet(octet);
    }
}

} // namespace netfloor::cli
