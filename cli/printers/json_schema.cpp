// SPDX-License-Identifier: MIT
#include "printers/json_schema.h"

#include <nlohmann/json.hpp>

#include "output.h"

namespace netfloor::cli {

namespace {

using Json = nlohmann::ordered_json;

constexpr const char *addressPattern = R"(^([0-9]{1,3}(\.[0-9]{1,3}){3}|[0-9a-f:]+(\.[0-9.]+)?)$)";
constexpr const char *octetsPattern = "^([0-9a-f]{2})*$";
constexpr const char *timePattern = R"(^[0-9]{4}-[0-9]{2}-[0-9]{2}T[0-9]{2}:[0-9]{2}:[0-9]{2}\.[0-9]{9}Z$)";

Json number(unsigned bits) {
    return {{"type", "integer"}, {"minimum", 0}, {"maximum", (std::uint64_t{1} << bits) - 1}};
}

Json pattern(const char *text) {
    return {{"type", "string"}, {"pattern", text}};
}

Json typeOf(ColumnType type) {
    constexpr unsigned mostExactBits = 53; // in programs that read a number as a double
    switch (type) {
    case ColumnType::boolean: return {{"type", "boolean"}};
    case ColumnType::u8: return number(8);
    case ColumnType::u16: return number(16);
    case ColumnType::u32: return number(32);
    case ColumnType::u64: return number(mostExactBits);
    case ColumnType::time: return pattern(timePattern);
    case ColumnType::address: return pattern(addressPattern);
    case ColumnType::text: return {{"type", "string"}};
    case ColumnType::octets: break;
    }
    return pattern(octetsPattern);
}

Json object() {
    return {{"type", "object"},
            {"additionalProperties", false},
            {"required", Json::array()},
            {"properties", Json::object()}};
}

void add(Json &object, const std::string &key, Json value, bool isRequired) {
    object["properties"][key] = std::move(value);
    if (isRequired) {
        object["required"].push_back(key);
    }
}

// A group of columns is an object of its own, except in chunks and causes.
void addColumns(Json &row, RowKind kind) {
    const bool hasGroups = kind == RowKind::packet || kind == RowKind::layer;
    for (const Column &column : columns(kind)) {
        if (!isInJson(column)) {
            continue;
        }
        Json value = typeOf(column.type);
        value["description"] = column.meaning;
        const std::string group(column.group());
        const std::string field(column.field());
        if (!hasGroups || group.empty()) {
            add(row, field, std::move(value), column.isRequired);
            continue;
        }
        if (!row["properties"].contains(group)) {
            add(row, group, object(), column.isRequired);
        }
        add(row["properties"][group], field, std::move(value), column.isRequired);
    }
}

// An array of rows of this kind, with those inside them.
Json arrayOf(RowKind kind) {
    Json row = object();
    addColumns(row, kind);
    if (kind == RowKind::layer || kind == RowKind::chunk) {
        const RowKind inner = kind == RowKind::layer ? RowKind::chunk : RowKind::cause;
        add(row, std::string(tableName(inner)), arrayOf(inner), true);
    }
    return {{"type", "array"}, {"items", std::move(row)}};
}

Json fieldObject() {
    Json field = object();
    Json value = {{"type", {"integer", "string"}},
                  {"description",
                   "a number; hexadecimal digits or an IPv6 address where the field is wider than 32 bits "
                   "or as wide as the packet says; none for a field without bits of its own"}};
    Json bits = {{"type", "array"},
                 {"description", "from bit to bit, from the first IP header on; within an octet bit 1 is the lowest"},
                 {"items", {{"type", "array"}, {"items", number(32)}, {"minItems", 2}, {"maxItems", 2}}}};
    add(field, "id", number(32), true);
    add(field, "name", {{"type", "string"}}, true);
    add(field, "block", {{"type", "string"}, {"description", "the innermost block of the grammar"}}, false);
    add(field, "value", std::move(value), false);
    Json octets = pattern(octetsPattern);
    octets["description"] = "in the place of value and text: five or more fields of one octet in a row";
    add(field, "octets", std::move(octets), false);
    add(field, "text", {{"type", "string"}, {"description", "as the plug-in displays it"}}, false);
    add(field, "bits", std::move(bits), true);
    return field;
}

} // namespace

void showPacketSchema() {
    Json schema = {{"$schema", "http://json-schema.org/draft-07/schema#"},
                   {"title", "A packet, as 'netfloor json' writes it"},
                   {"description",
                    "A line for each packet. What a packet does not have is left out; arrays may be empty. "
                    "'netfloor json --schema' writes this file."}};
    schema.update(object());
    add(schema, "schema",
        {{"const", packetSchemaNumber}, {"description", "rises when a key goes away or changes its meaning"}}, true);
    add(schema, "file", {{"type", "string"}, {"description", "the capture, where several are read"}}, false);
    addColumns(schema, RowKind::packet);
    add(schema, "layers", arrayOf(RowKind::layer), true);
    Json fields = {
        {"type", "array"}, {"description", "with --fields: in the order of the packet"}, {"items", fieldObject()}};
    add(schema, "fields", std::move(fields), false);
    Output out(false, false);
    out << schema.dump(2) << '\n';
    out.flush();
}

} // namespace netfloor::cli
