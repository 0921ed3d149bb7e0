// SPDX-License-Identifier: MIT
// The declaration of a field. A field is said once, in the file of its protocol; everything else about it,
// here and in the tables, is worked out from the declaration at compile time.
#pragma once

#include <algorithm>
#include <cstdint>
#include <string_view>

#include "frame/display_format.h"
#include "frame/place.h"
#include "frame/value_names.h"

namespace netfloor::plugin {

inline constexpr ValueNames unnamed{};
inline constexpr const ValueNames *noNames = &unnamed;

// The default of a short text: the value part of the line. A mark that is no text of a field.
inline constexpr std::string_view asInLine = "=";

struct Field {
    std::uint32_t id;
    std::string_view name; // as it is handed to the host, blanks included
    Place place;
    std::string_view line;                 // the display line, with its conversions
    const ValueNames *names = noNames;     // what %-S and %-s take
    std::string_view shortText = asInLine; // the text of the TO pass
    std::string_view title = {};           // the name in the field table, where it is another one

    // The text of the TO pass.
    [[nodiscard]] constexpr std::string_view display() const {
        return shortText == asInLine ? valuePart(line) : shortText;
    }

    [[nodiscard]] constexpr bool hasNames() const { return !names->rows.empty(); }

    // The name by which fields are told apart: without its leading blanks.
    [[nodiscard]] constexpr std::string_view tableName() const {
        return name.substr(std::min(name.find_first_not_of(' '), name.size()));
    }

    // The name without the blanks on both sides.
    [[nodiscard]] constexpr std::string_view bareName() const {
        const std::string_view trimmed = tableName();
        return trimmed.substr(0, trimmed.find_last_not_of(' ') + 1);
    }
};

// True where the format can be filled from the field.
[[nodiscard]] constexpr bool formatFits(const Field &field, const Format &format) {
    const bool named = format.has(Conversion::name) || format.has(Conversion::briefName);
    const bool manyElements = field.place.isRun() || field.place.count > 1;
    return format.wellFormed && (!named || field.hasNames()) &&
           (!format.has(Conversion::briefName) || field.names->hasBriefs) &&
           (!format.has(Conversion::list) || (manyElements && format.element != Conversion::none));
}

// True where the names stand in ascending order, so that a value has one name at most.
[[nodiscard]] constexpr bool namesAscend(const ValueNames &names) {
    for (std::size_t row = 0; row < names.rows.size(); ++row) {
        if (names.rows[row].from > names.rows[row].to || (row > 0 && names.rows[row - 1].to >= names.rows[row].from)) {
            return false;
        }
    }
    return true;
}

// True where a declaration does not contradict itself: each read of a field asserts it.
[[nodiscard]] constexpr bool consistent(const Field &field) {
    const Place &place = field.place;
    if (place.isPieces()) {
        for (std::uint32_t i = 0; i < place.count; ++i) {
            if (place.pieces[i].low > place.pieces[i].high) {
                return false;
            }
        }
        if (place.count < 1 || place.width() > 32) {
            return false;
        }
    }
    const Format line = parseFormat(field.line);
    const bool wantsNames = line.has(Conversion::name);
    return formatFits(field, line) && formatFits(field, parseFormat(field.display())) &&
           wantsNames == field.hasNames() && namesAscend(*field.names) && (place.scale == 1 || !place.isRun()) &&
           (place.mostUnits == 0 || place.isRun()) && (place.shape != Shape::ahead || place.advance == 0);
}

} // namespace netfloor::plugin
