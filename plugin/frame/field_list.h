// SPDX-License-Identifier: MIT
// Lists of fields. Each protocol's file ends with its rows in the published tables, and the catalogue joins them.
#pragma once

#include <algorithm>
#include <array>
#include <cstddef>
#include <cstdint>
#include <type_traits>

#include "frame/field.h"

namespace netfloor::plugin {

template <const Field &...fields>
struct FieldList {
    static constexpr std::size_t size = sizeof...(fields);
    static constexpr std::array<const Field *, size> pointers = {&fields...};

    // Calls `visit` with each field as a constant.
    template <class Visit>
    static constexpr void forEachField(Visit visit) {
        (visit.template operator()<fields>(), ...);
    }
};

// One list after the other.
template <class... Lists>
struct Join;

template <const Field &...fields>
struct Join<FieldList<fields...>> {
    using List = FieldList<fields...>;
};

template <const Field &...first, const Field &...second, class... Rest>
struct Join<FieldList<first...>, FieldList<second...>, Rest...> : Join<FieldList<first..., second...>, Rest...> {};

template <class... Lists>
using Joined = typename Join<Lists...>::List;

// The rows of a protocol: all its fields in the order in which they are read, and its key fields in the order in which
// the grammar comes to them. A field of another protocol may stand among them, at the place where it is first read;
// a key field that is read in several places has a row for each.
template <class FieldsInReadingOrder, class KeyFields = FieldList<>>
struct Rows {
    using Fields = FieldsInReadingOrder;
    using Keys = KeyFields;
};

template <class... Protocols>
struct JoinedRows {
    using Fields = Joined<typename Protocols::Fields...>;
    using Keys = Joined<typename Protocols::Keys...>;
};

// Whether a list holds a field. It is asked wherever a field is read, so that a search through the list would cost the
// compiler seconds: a set has its fields as base classes instead.
template <const Field &field>
struct SetMember {};

template <class List>
struct FieldSet;

template <const Field &...fields>
struct FieldSet<FieldList<fields...>> : SetMember<fields>... {};

template <class List, const Field &field>
inline constexpr bool isListed = std::is_base_of_v<SetMember<field>, FieldSet<List>>;

// The bits from the start of `first` to the end of `last`, which stand in one list of fields in reading order. Fields
// of one name in a row are forms of one field, of which one is read, and count once.
template <class List>
[[nodiscard]] consteval std::uint32_t bitsFromTo(const Field &first, const Field &last) {
    std::uint32_t start = 0; // of the field that is looked at
    std::uint32_t end = 0;
    const Field *before = nullptr;
    bool counts = false;
    for (const Field *const field : List::pointers) {
        counts = counts || field == &first;
        if (counts && (before == nullptr || before->tableName() != field->tableName())) {
            end = start + field->place.needs(field->place.count);
            start += field->place.advance;
            before = field;
        }
        if (field == &last) {
            return end;
        }
    }
    return 0;
}

// How many elements' flag words the fields from `first` to `last`, all of fixed size, clear.
template <class List>
[[nodiscard]] consteval std::uint32_t clearedFromTo(const Field &first, const Field &last) {
    std::uint32_t most = 0;
    bool counts = false;
    for (const Field *const field : List::pointers) {
        counts = counts || field == &first;
        if (counts && field->place.clearsFlagWords()) {
            most = std::max(most, field->place.elements(field->place.count));
        }
        if (field == &last) {
            break;
        }
    }
    return most;
}

// Fails to compile where two fields share an id. The two stand in the compiler's message.
template <const Field &first, const Field &second>
struct RequireDistinctIds {
    static constexpr bool holds = true;
    static_assert(first.id != second.id || &first == &second,
                  "two fields share an id, or one field is listed twice: give one of them an id of its own");
};

// Fails to compile where a key field is no field of the catalogue. The field stands in the compiler's message.
template <const Field &field, class Catalogue>
struct RequireFieldOfKey {
    static constexpr bool holds = true;
    static_assert(isListed<Catalogue, field>,
                  "a key row has no field: add the field to the Fields of its protocol, or take the row away");
};

// The places of the first two fields of one id; both the first place where there are none.
struct SharedId {
    std::size_t first = 0;
    std::size_t second = 0;
};

template <const Field &...fields>
[[nodiscard]] consteval SharedId findSharedId(FieldList<fields...>) {
    const std::uint32_t ids[] = {fields.id...}; // evaluated much faster than a std::array of pointers
    for (std::size_t second = 1; second < sizeof...(fields); ++second) {
        for (std::size_t first = 0; first < second; ++first) {
            if (ids[first] == ids[second]) {
                return {first, second};
            }
        }
    }
    return {};
}

// What must hold of a catalogue: consistent declarations, each id once, and a field for each key row.
template <class Fields, class Keys>
struct CheckedCatalogue {
    static constexpr bool holds = true;
    static constexpr SharedId shared = findSharedId(Fields{});
    static_assert(shared.second == 0 ||
                  RequireDistinctIds<*Fields::pointers[shared.first], *Fields::pointers[shared.second]>::holds);

    template <const Field &...fields>
    static consteval bool areConsistent(FieldList<fields...>) {
        return (RequireConsistent<fields>::holds && ...);
    }
    static_assert(areConsistent(Fields{}));

    template <const Field &...keys>
    static consteval bool keysHaveFields(FieldList<keys...>) {
        return (RequireFieldOfKey<keys, Fields>::holds && ...);
    }
    static_assert(keysHaveFields(Keys{}));
};

} // namespace netfloor::plugin
