// SPDX-License-Identifier: MIT
// The fields as a page of reference in Markdown (CommonMark with tables).
#include <algorithm>
#include <cstddef>
#include <string_view>
#include <vector>

#include "fields/bit_picture.h"
#include "fields/fields.h"

namespace netfloor::cli {

namespace {

constexpr std::string_view referenceIntroduction =
    R"(# Fields

All fields that the plug-in reports, as its own tables describe them. This page is written by the command, and a test
compares the two; after a change of the fields, write it anew:

    netfloor fields --markdown > docs/fields.md

- **id**: under which the field is reported, and by which `netfloor fields ID` shows it with a picture of its bits.
- **bits**: its width.
- **place**: its bits, counted from 1 at the place where the field starts, and within an octet from the least
  significant bit up: 5-8 is the high nibble of the first octet. In a value the first octet counts most, also where 9-16
  stands in front of 1-8; the few fields in which the last one does are named in [Reading](reading.md). The place is not
  told of fields that are shown ahead of their turn, and of addresses that are shown in groups.
- **display**: `%u` is the value in decimal, `%x` in hexadecimal, `%c` as a character, `%-S` its name, and `%-["%u":"."]`
  a list of the field's elements with what stands between them.
- **key**: its number among the key fields.

A protocol stands where the grammar first meets it, and a field that several protocols share with the first of them.

`netfloor fields --json` says the same. Its `layout` has the `pieces`, each from bit to bit, how often they repeat (`count`,
or from least to most where the packet tells) and the bits from one repeat to the next (`step`).
)";

// Lists of up to this many values stand with the field.
constexpr std::size_t mostInline = 8;

std::string escaped(std::string_view text) {
    std::string result;
    for (const char character : text) {
        result += character == '|' ? "\\|" : std::string(1, character);
    }
    return result;
}

std::string code(std::string_view text) {
    return text.empty() ? "" : "`" + escaped(text) + "`";
}

// The longer lists of values, each once, in the order in which they are needed.
class ValueLists {
public:
    std::string textFor(const FieldDescription &field) {
        if (field.values.size() > mostInline) {
            const std::string number = std::to_string(add(field));
            return "[list " + number + "](#list-" + number + ")";
        }
        std::string text;
        for (const NamedValue &row : field.values) {
            text += (text.empty() ? "" : ", ") + valuesText(row) + " " + code(row.name);
        }
        return text;
    }

    [[nodiscard]] std::string text() const {
        std::string text = "\n## Lists of values\n";
        for (std::size_t number = 1; number <= lists_.size(); ++number) {
            const List &list = lists_[number - 1];
            text +=
                "\n### List " + std::to_string(number) + "\n\nOf " + list.ids + ".\n\n| value | name |\n|---|---|\n";
            for (const NamedValue &row : *list.values) {
                text += "| " + valuesText(row) + " | " + code(row.name) + " |\n";
            }
        }
        return text;
    }

private:
    struct List {
        const std::vector<NamedValue> *values;
        std::string ids; // of the fields that have it
    };

    // The number of the field's list.
    std::size_t add(const FieldDescription &field) {
        const auto found =
            std::ranges::find_if(lists_, [&field](const List &list) { return *list.values == field.values; });
        const auto number = static_cast<std::size_t>(found - lists_.begin()) + 1;
        if (found == lists_.end()) {
            lists_.push_back({&field.values, std::to_string(field.id)});
        } else {
            found->ids += ", " + std::to_string(field.id);
        }
        return number;
    }

    std::vector<List> lists_;
};

} // namespace

std::string referenceText(const Fields &fields) {
    std::string text(referenceIntroduction);
    ValueLists lists;
    std::string_view open;
    for (const auto &[field, section] : fields) {
        if (section != open) {
            text.append("\n## ").append(section);
            text += "\n\n| id | name | bits | place | display | values | key |\n|---|---|---|---|---|---|---|\n";
            open = section;
        }
        text += "| " + std::to_string(field->id) + " | " + code(field->name) + " | " + widthText(*field) + " | " +
                placeText(field->layout) + " | " + code(field->format) + " | " + lists.textFor(*field) + " | " +
                (field->keyIndex == 0 ? "" : std::to_string(field->keyIndex)) + " |\n";
    }
    return text + lists.text();
}

} // namespace netfloor::cli
