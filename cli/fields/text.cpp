// SPDX-License-Identifier: MIT
// The fields as text: a list of them, or some in detail.
#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <iomanip>
#include <span>
#include <sstream>

#include "fields/bit_picture.h"
#include "fields/fields.h"
#include "text.h"

namespace netfloor::cli {

namespace {

std::string keyText(const FieldDescription &field) {
    return field.keyIndex == 0 ? "" : std::to_string(field.keyIndex);
}

std::string columnsText(std::string_view id, std::string_view width, std::string_view key, std::string_view section,
                        std::string_view name, std::string_view format) {
    std::ostringstream columns;
    columns << std::setw(4) << id << std::setw(10) << width << std::setw(6) << key << "  " << std::left << std::setw(21)
            << section << "  " << std::setw(43) << name << "  " << withoutLeadingBlanks(format);
    std::string line = columns.str();
    line.resize(line.find_last_not_of(' ') + 1);
    return line + '\n';
}

bool isAlike(const FieldDescription &left, const FieldDescription &right) {
    return left.name == right.name && left.shortName == right.shortName && left.width == right.width &&
           withoutLeadingBlanks(left.format) == withoutLeadingBlanks(right.format) &&
           left.layoutOffset == right.layoutOffset && left.values == right.values;
}

// Fields that differ in id, section and key alone.
std::string detailText(std::span<const ListedField> alike) {
    constexpr std::size_t valueColumn = 12;
    const FieldDescription &field = *alike.front().field;
    std::string text = field.name.empty() ? "(no name)" : std::string(field.name);
    for (const auto &[same, section] : alike) {
        text += "\n  id       " + std::to_string(same->id) + ", " + std::string(section);
        text += same->keyIndex == 0 ? "" : ", key field " + keyText(*same);
    }
    if (field.shortName != field.name) {
        text.append("\n  names    \"").append(field.name).append("\", short \"").append(field.shortName).append("\"");
    }
    text += "\n  bits     " + widthText(field);
    text += "\n  display  ";
    text += field.format.empty() ? "nothing" : withoutLeadingBlanks(field.format);
    text += "\n  place    " + placeText(field.layout) + '\n' + bitPicture(field);
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
    std::string text = columnsText("id", "bits", "key", "protocol", "name", "display");
    std::uint64_t keys = 0;
    for (const auto &[field, section] : fields) {
        text += columnsText(std::to_string(field->id), widthText(*field), keyText(*field), section, field->name,
                            field->format);
        keys += field->keyIndex == 0 ? 0 : 1;
    }
    return text + countText(fields.size(), "field") + ", " + countText(keys, "key field") + " among them\n";
}

std::string detailsText(Fields fields) {
    std::string text;
    for (auto first = fields.begin(); first != fields.end();) {
        const auto end = std::stable_partition(first, fields.end(), [&kind = *first->field](const ListedField &listed) {
            return isAlike(*listed.field, kind);
        });
        text += text.empty() ? "" : "\n";
        text += detailText({first, end});
        first = end;
    }
    return text;
}

} // namespace netfloor::cli
