// SPDX-License-Identifier: MIT
// 'netfloor fields': what the plug-in says of its fields in its own tables.
#pragma once

#include <string>
#include <string_view>
#include <vector>

#include "netfloor-host/field_tables.h"
#include "options.h"

namespace netfloor::cli {

// Throws PluginError, UsageError, OutputClosed, OutputError.
void showFields(const Options &options);

// A field, and the part of the grammar in which it stands: "TCP options".
struct ListedField {
    const FieldDescription *field;
    std::string_view section;
};

using Fields = std::vector<ListedField>;

// The forms of the output.
[[nodiscard]] std::string listText(const Fields &fields);
[[nodiscard]] std::string detailsText(Fields fields); // those that differ in nothing but id, section and key as one
[[nodiscard]] std::string jsonText(const Fields &fields);
[[nodiscard]] std::string referenceText(const Fields &fields);
[[nodiscard]] std::string tablesText(); // not the fields, but the columns of all tables

// "4", "variable".
[[nodiscard]] std::string widthText(const FieldDescription &field);

// "6", "5-127", "other".
[[nodiscard]] std::string valuesText(const NamedValue &row);

} // namespace netfloor::cli
