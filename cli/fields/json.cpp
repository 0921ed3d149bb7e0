// SPDX-License-Identifier: MIT
// The fields as JSON: an array of them, one field a line.
#include <nlohmann/json.hpp>

#include "fields/fields.h"

namespace netfloor::cli {

namespace {

using Json = nlohmann::ordered_json;

Json valueJson(const NamedValue &row) {
    Json json;
    if (row.isDefault()) {
        json["default"] = true;
    } else {
        json["from"] = row.from;
        json["to"] = row.to;
    }
    json["name"] = row.name;
    return json;
}

Json layoutJson(const FieldLayout &layout) {
    if (layout.kind == FieldLayout::Kind::none) {
        return nullptr;
    }
    Json json;
    for (const BitSpan &piece : layout.pieces) {
        json["pieces"].push_back({piece.first, piece.last});
    }
    if (layout.kind == FieldLayout::Kind::fixed) {
        json["count"] = layout.leastCount;
    } else {
        json["count"] = {layout.leastCount, layout.mostCount == 0 ? Json() : Json(layout.mostCount)};
    }
    json["step"] = layout.step;
    return json;
}

Json fieldJson(const FieldDescription &field, std::string_view section) {
    Json json;
    json["id"] = field.id;
    json["protocol"] = section;
    json["name"] = field.name;
    json["shortName"] = field.shortName;
    json["bits"] = field.width ? Json(*field.width) : Json();
    json["key"] = field.keyIndex == 0 ? Json() : Json(field.keyIndex);
    json["display"] = field.format;
    json["values"] = Json::array();
    for (const NamedValue &row : field.values) {
        json["values"].push_back(valueJson(row));
    }
    json["layout"] = layoutJson(field.layout);
    return json;
}

} // namespace

std::string jsonText(const Fields &fields) {
    std::string text = "[";
    for (const auto &[field, section] : fields) {
        // Another plug-in's texts may be anything.
        text += (text.size() == 1 ? "\n" : ",\n") +
                fieldJson(*field, section).dump(-1, ' ', false, Json::error_handler_t::replace);
    }
    return text + "\n]\n";
}

} // namespace netfloor::cli
