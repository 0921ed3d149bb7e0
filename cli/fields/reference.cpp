// SPDX-License-Identifier: MIT
// The fields as a page of reference in Markdown (CommonMark with tables).
#include <algorithm>
#include <array>
#include <cstdint>
#include <string_view>

#include "fields/bit_picture.h"
#include "fields/fields.h"

namespace netfloor::cli {

namespace {

struct Section {
    std::uint32_t firstId;
    std::string_view title;
};

// The tables name no protocols. But they stand in the order of the grammar, so that the fields of one lie together,
// and a section starts with the id of its first field. A plug-in without that id goes on in the section before.
constexpr std::array sections = {
    Section{150, "IPv4 header"},
    Section{318, "IPv4 options"},
    Section{285, "Payload of unknown protocols"},
    Section{531, "ICMP"},
    Section{384, "TCP"},
    Section{441, "TCP options"},
    Section{479, "UDP"},
    Section{629, "IP in IP"},
    Section{640, "Minimal encapsulation"},
    Section{692, "GRE"},
    Section{246, "ICMPv6"},
    Section{795, "SCTP"},
    Section{823, "SCTP INIT and INIT ACK"},
    Section{873, "SCTP SACK and HEARTBEAT"},
    Section{944, "SCTP ABORT and error causes"},
    Section{884, "SCTP, other chunks"},
    Section{166, "IPv6 header"},
    Section{222, "IPv6 extension headers and options"},
};

constexpr std::string_view introduction =
    R"(# Fields

All fields that the plug-in reports, as its own tables describe them. This page is written by the command, and a test
compares the two; after a change of the fields, write it anew:

    netfloor fields --markdown > docs/fields.md

- **id**: under which the field is reported, and by which `netfloor fields ID` shows it with a picture of its bits.
- **bits**: its width.
- **place**: its bits, counted from 1 at the place where the field starts, and within an octet from the least
  significant bit up: 5-8 is the high nibble of the first octet. "Not told" are fields that are shown ahead of their
  turn, and addresses that are read a second time for a key.
- **display**: `%u` is the value in decimal, `%x` in hexadecimal, `%c` as a character, `%-S` its name, and `%-["%u":"."]`
  a list of the field's elements with what stands between them.
- **key**: its number among the key fields.

A protocol stands where the grammar first meets it, and a field that several protocols share with the first of them.
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
            const std::string number = std::to_string(numberOf(field));
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
        for (std::size_t list = 0; list < lists_.size(); ++list) {
            text += "\n### List " + std::to_string(list + 1) + "\n\n| value | name |\n|---|---|\n";
            for (const NamedValue &row : lists_[list]->values) {
                text += "| " + valuesText(row) + " | " + code(row.name) + " |\n";
            }
        }
        return text;
    }

private:
    std::size_t numberOf(const FieldDescription &field) {
        const auto found = std::ranges::find(lists_, field.values, &FieldDescription::values);
        const auto number = static_cast<std::size_t>(found - lists_.begin()) + 1;
        if (found == lists_.end()) {
            lists_.push_back(&field);
        }
        return number;
    }

    Fields lists_;
};

} // namespace

std::string referenceText(const Fields &fields) {
    std::string text(introduction);
    ValueLists lists;
    for (const FieldDescription *const field : fields) {
        const auto *const section = std::ranges::find(sections, field->id, &Section::firstId);
        if (section != sections.end()) {
            text.append("\n## ")
                .append(section->title)
                .append("\n\n| id | name | bits | place | display | values | key |\n");
            text += "|---|---|---|---|---|---|---|\n";
        }
        text += "| " + std::to_string(field->id) + " | " + code(field->name) + " | " + widthText(*field) + " | " +
                placeText(field->layout) + " | " + code(field->format) + " | " + lists.textFor(*field) + " | " +
                (field->keyIndex == 0 ? "" : std::to_string(field->keyIndex)) + " |\n";
    }
    return text + lists.text();
}

} // namespace netfloor::cli
