// SPDX-License-Identifier: MIT
// The declaration of a field. A field is said once, in the file of its protocol; everything else about it,
// here and in the tables, is worked out from the declaration at compile time.
#pragma once

#include <algorithm>
#include <array>
#include <cstdint>
#include <string_view>

#include "frame/display_format.h"
#include "frame/place.h"
#include "frame/value_names.h"

namespace netfloor::plugin {

inline constexpr ValueNames unnamed{};
inline constexpr const ValueNames *noNames = &unnamed;

// The default of a short text: the value part of the line. It only says so, and is no text of a field.
inline constexpr std::string_view asInLine = "=";

// Stands in a line for the field's name, without the blanks before it.
inline constexpr std::string_view nameInLine = "%n";

struct Field {
    std::uint32_t id;
    std::string_view name; // as it is handed to the host, blanks included
    Place place;
    std::string_view line;                 // the display line, with its conversions and %n
    const ValueNames *names = noNames;     // what %-S and %-s take
    std::string_view shortText = asInLine; // the text of the TO pass
    std::string_view title = {};           // the name in the field table, where it is another one

    [[nodiscard]] constexpr bool hasNames() const { return !names->rows.empty(); }

    // The name by which fields are told apart: without the blanks before it.
    [[nodiscard]] constexpr std::string_view tableName() const {
        return name.substr(std::min(name.find_first_not_of(' '), name.size()));
    }

    // The name without the blanks on both sides.
    [[nodiscard]] constexpr std::string_view bareName() const {
        const std::string_view trimmed = tableName();
        return trimmed.substr(0, trimmed.find_last_not_of(' ') + 1);
    }
};

// The display line with the field's name in it, and the zero that ends it.
template <const Field &field>
inline constexpr auto lineText = [] {
    constexpr std::size_t place = field.line.find(nameInLine);
    constexpr bool hasName = place != std::string_view::npos;
    constexpr std::string_view before = field.line.substr(0, place);
    constexpr std::string_view name = hasName ? field.tableName() : std::string_view{};
    constexpr std::string_view after = hasName ? field.line.substr(place + nameInLine.size()) : std::string_view{};
    std::array<char, before.size() + name.size() + after.size() + 1> text{};
    char *end = std::ranges::copy(before, text.data()).out;
    end = std::ranges::copy(name, end).out;
    std::ranges::copy(after, end);
    return text;
}();

// The display line.
template <const Field &field>
inline constexpr std::string_view longText{lineText<field>.data(), lineText<field>.size() - 1};

// The text of the TO pass.
template <const Field &field>
inline constexpr std::string_view shortText = field.shortText == asInLine ? valuePart(longText<field>)
                                                                          : field.shortText;

[[nodiscard]] constexpr bool piecesAscend(const Place &place) {
    for (std::uint32_t i = 0; place.isPieces() && i < place.count; ++i) {
        if (place.pieces[i].low > place.pieces[i].high) {
            return false;
        }
    }
    return true;
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

[[nodiscard]] constexpr bool wantsNames(const Format &format) {
    return format.has(Conversion::name) || format.has(Conversion::briefName);
}

// Fails to compile where a declaration contradicts itself. The field stands in the compiler's message.
template <const Field &field>
struct RequireConsistent {
    static constexpr bool holds = true;
    static constexpr const Place &place = field.place;
    static constexpr Format line = parseFormat(longText<field>);
    static constexpr Format brief = parseFormat(shortText<field>);
    static constexpr bool hasElements = place.isRun() || place.count > 1;

    static_assert(piecesAscend(place), "a piece of this field runs backwards: say its low bit first");
    static_assert(!place.isPieces() || (place.count >= 1 && place.width() <= 32),
                  "the pieces of this field must make 1 to 32 bits");
    static_assert(place.scale == 1 || !place.isRun(), "a run of octets has no scaled value: take away times()");
    static_assert(place.mostUnits == 0 || place.isRun(), "only a run has a greatest length: take away atMost()");
    static_assert(place.shape != Shape::ahead || place.advance == 0,
                  "a field that is read ahead leaves the cursor where it is: take away advancing()");
    static_assert(line.wellFormed, R"(the line holds a conversion that is none of %n %u %x %c %-S %-s %-["%x":"sep"])");
    static_assert(brief.wellFormed, R"(the short text holds a conversion that is none of %u %x %c %-S %-s %-["%x"])");
    static_assert(field.tableName().empty() || field.line.find(field.tableName()) == std::string_view::npos ||
                      field.line.find(nameInLine) != std::string_view::npos,
                  "the line repeats the field's name: write %n");
    static_assert(field.hasNames() || !wantsNames(line), "the line shows a name (%-S): give the field its value names");
    static_assert(field.hasNames() || !wantsNames(brief),
                  "the short text shows a name (%-S, %-s): give the field its value names");
    static_assert(!field.hasNames() || line.has(Conversion::name),
                  "the field has value names and its line does not show them: write %-S, or take the names away");
    static_assert(field.names->hasBriefs || (!line.has(Conversion::briefName) && !brief.has(Conversion::briefName)),
                  "a text shows a short name (%-s): give each of the value names a short form");
    static_assert(namesAscend(*field.names), "the value names must stand in ascending order, each value in one row");
    static_assert(hasElements || (!line.has(Conversion::list) && !brief.has(Conversion::list)),
                  "a text lists elements (%-[...]) of a field that has one: show its value instead");
    static_assert(!line.has(Conversion::list) || line.element != Conversion::none,
                  R"(the list in the line does not say how an element is shown: write %-["%u"] or the like)");
    static_assert(!brief.has(Conversion::list) || brief.element != Conversion::none,
                  R"(the list in the short text does not say how an element is shown: write %-["%u"] or the like)");
};

} // namespace netfloor::plugin
