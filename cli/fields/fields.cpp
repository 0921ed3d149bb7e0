// SPDX-License-Identifier: MIT
#include "fields/fields.h"

#include <algorithm>
#include <charconv>
#include <cstddef>
#include <cstdint>
#include <optional>
#include <string_view>

#include "exit_code.h"
#include "fields/bit_picture.h"
#include "output.h"
#include "plugin_path.h"
#include "text.h"

namespace netfloor::cli {

namespace {

std::optional<std::uint32_t> idOf(std::string_view text) {
    std::uint32_t id = 0;
    const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), id);
    return error == std::errc() && end == text.data() + text.size() ? std::optional(id) : std::nullopt;
}

Fields choose(const FieldTables &tables, const std::string &wanted) {
    Fields fields;
    if (wanted.empty()) {
        for (const FieldDescription &field : tables.fields()) {
            fields.push_back(&field);
        }
        return fields;
    }
    fields = tables.named(wanted);
    if (const std::optional<std::uint32_t> id = idOf(wanted); fields.empty() && id) {
        if (const FieldDescription *const field = tables.find(*id); field != nullptr) {
            fields.push_back(field);
        }
    }
    if (fields.empty()) {
        throw UsageError("'" + wanted +
                         "': the plug-in has no field of that name or id. 'netfloor fields' lists them.");
    }
    return fields;
}

std::string columnsText(std::string_view id, std::string_view width, std::string_view key, std::string_view name,
                        std::string_view format) {
    constexpr std::size_t numberColumn = 4;
    constexpr std::size_t widthColumn = 8;
    constexpr std::size_t nameColumn = 44;
    const auto right = [](std::string_view text, std::size_t column) {
        return std::string(column - std::min(column, text.size()), ' ').append(text);
    };
    std::string line =
        right(id, numberColumn) + "  " + right(width, widthColumn) + "  " + right(key, numberColumn) + "  ";
    line.append(name).append(nameColumn - std::min(nameColumn, name.size()), ' ').append("  ").append(format);
    line.resize(line.find_last_not_of(' ') + 1);
    return line + '\n';
}

std::string keyText(const FieldDescription &field) {
    return field.keyIndex == 0 ? "" : std::to_string(field.keyIndex);
}

} // namespace

std::string widthText(const FieldDescription &field) {
    return field.width ? std::to_string(*field.width) : "variable";
}

std::string valuesText(const NamedValue &row) {
    if (row.isDefault()) {
        return "other";
    }
    return std::to_string(row.from) + (row.isRange() ? "-" + std::to_string(row.to) : "");
}

std::string listText(const Fields &fields) {
    std::string text = columnsText("id", "bits", "key", "name", "display");
    for (const FieldDescription *const field : fields) {
        text += columnsText(std::to_string(field->id), widthText(*field), keyText(*field), field->name, field->format);
    }
    const auto keys = std::ranges::count_if(fields, [](const FieldDescription *field) { return field->keyIndex != 0; });
    return text + countText(fields.size(), "field") + ", " + countText(static_cast<std::uint64_t>(keys), "key field") +
           " among them\n";
}

std::string detailText(const FieldDescription &field) {
    constexpr std::size_t valueColumn = 12;
    std::string text = std::string(field.name) + " (id " + std::to_string(field.id) + ")\n";
    text += "  bits     " + widthText(field) + '\n';
    if (field.keyIndex != 0) {
        text += "  key      " + std::to_string(field.keyIndex) + '\n';
    }
    text += "  display  " + std::string(field.format) + '\n';
    text += "  place    " + placeText(field.layout) + '\n' + bitPicture(field);
    if (field.values.empty()) {
        return text;
    }
    text += "  values\n";
    for (const NamedValue &row : field.values) {
        std::string values = "    " + valuesText(row);
        values.resize(std::max(values.size() + 1, valueColumn), ' ');
        text += values.append(row.name) + '\n';
    }
    return text;
}

void showFields(const Options &options) {
    const FieldTables tables(PluginLibrary::open(findPlugin(options.plugin)));
    const Fields fields = choose(tables, options.field);
    Output out(false, false);
    switch (options.form) {
    case FieldsForm::json: out << jsonText(fields); break;
    case FieldsForm::markdown: out << referenceText(fields); break;
    case FieldsForm::text:
        if (options.field.empty()) {
            out << listText(fields);
            break;
        }
        for (const FieldDescription *const field : fields) {
            out << (field == fields.front() ? "" : "\n") << detailText(*field);
        }
    }
    out.flush();
}

} // namespace netfloor::cli
