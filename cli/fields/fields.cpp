// SPDX-License-Identifier: MIT
#include "fields/fields.h"

#include <algorithm>
#include <charconv>
#include <cstdint>
#include <optional>

#include "exit_code.h"
#include "netfloor-host/field_knowledge.h"
#include "netfloor-host/layer_fields.h"
#include "output.h"
#include "plugin_path.h"

namespace netfloor::cli {

namespace {

std::optional<std::uint32_t> idOf(std::string_view text) {
    std::uint32_t id = 0;
    const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), id);
    return error == std::errc() && end == text.data() + text.size() ? std::optional(id) : std::nullopt;
}

std::string lower(std::string_view text) {
    std::string lowered(text);
    std::ranges::transform(lowered, lowered.begin(), [](char character) {
        return character >= 'A' && character <= 'Z' ? static_cast<char>(character - 'A' + 'a') : character;
    });
    return lowered;
}

// How well a field fits what was asked for. Who types a name knows it more or less.
enum class Fit : std::uint8_t { none, part, otherCase, whole };

// Whether --where and --column have the field under this name.
bool isAskedForAs(const FieldDescription &field, std::string_view name) {
    return std::ranges::any_of(layerFieldSources(),
                               [&](const auto &row) { return row.name == name && row.field.fits(field); });
}

Fit fitOf(const ListedField &listed, const std::string &wanted) {
    const auto &[field, section] = listed;
    if (field->id == idOf(wanted) || field->name == wanted || field->shortName == wanted ||
        isAskedForAs(*field, wanted)) {
        return Fit::whole;
    }
    const std::string word = lower(wanted);
    const std::string name = lower(field->name);
    if (name == word || lower(field->shortName) == word) {
        return Fit::otherCase;
    }
    const bool isPart = name.find(word) != std::string::npos || lower(section).find(word) != std::string::npos;
    return isPart ? Fit::part : Fit::none;
}

struct Choice {
    Fields fields;
    bool isList = false; // to choose from
};

// Those that fit best.
Choice choose(const Fields &all, const std::string &wanted) {
    if (wanted.empty()) {
        return {all, true};
    }
    Fit best = Fit::part;
    Fields fields;
    for (const ListedField &listed : all) {
        const Fit fit = fitOf(listed, wanted);
        if (fit > best) {
            best = fit;
            fields.clear();
        }
        if (fit == best) {
            fields.push_back(listed);
        }
    }
    if (fields.empty()) {
        throw UsageError("'" + wanted +
                         "': the plug-in has no field of that name or id, nor one with it in its name or protocol. "
                         "'netfloor fields' lists them.");
    }
    return {fields, best == Fit::part && fields.size() > 1};
}

Fields listFields(const FieldTables &tables) {
    const FieldKnowledge knowledge(tables.fields());
    Fields fields;
    for (const FieldDescription &field : tables.fields()) {
        const std::string_view section = knowledge.section(field.id);
        fields.push_back({&field, section.empty() ? "Other fields" : section});
    }
    return fields;
}

} // namespace

void showFields(const Options &options) {
    Output out(false, false);
    if (options.form == FieldsForm::tables) {
        out << tablesText();
        out.flush();
        return;
    }
    const FieldTables tables(PluginLibrary::open(findPlugin(options.plugin)));
    const auto [fields, isList] = choose(listFields(tables), options.field);
    if (options.form == FieldsForm::json) {
        out << jsonText(fields);
    } else if (options.form == FieldsForm::markdown) {
        out << referenceText(fields);
    } else {
        out << (isList ? listText(fields) : detailsText(fields));
    }
    out.flush();
}

} // namespace netfloor::cli
