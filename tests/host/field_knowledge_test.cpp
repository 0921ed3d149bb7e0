// SPDX-License-Identifier: MIT
// What the host knows of particular fields agrees with the plug-in's own tables.
#include <algorithm>
#include <functional>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "netfloor-host/field_knowledge.h"

namespace netfloor::test {
namespace {

using Fields = std::vector<FieldDescription>;

const FieldTables &tables() {
    static const FieldTables tables(PluginLibrary::open(NETFLOOR_PLUGIN));
    return tables;
}

Fields::iterator place(Fields &fields, std::uint32_t id) {
    return std::ranges::find(fields, id, &FieldDescription::id);
}

FieldDescription fieldNamed(std::string_view name) {
    FieldDescription field;
    field.id = 9999;
    field.name = name;
    return field;
}

TEST(FieldKnowledge, holdsForEveryFieldOfThePlugin) {
    const FieldKnowledge knowledge(tables().fields());
    for (const std::string &mismatch : knowledge.mismatches()) {
        ADD_FAILURE() << mismatch;
    }
    for (const FieldDescription &field : tables().fields()) {
        EXPECT_NE(knowledge.section(field.id), "") << field.id << ' ' << field.name;
    }
}

// A plug-in with fields that are new, missing, renamed or moved does not fit the rows, and each is named.
TEST(FieldKnowledge, namesWhatDoesNotFit) {
    const FieldDescription stranger = fieldNamed("Stranger");
    const FieldDescription namesake = fieldNamed("Urgent Pointer");
    const struct {
        const char *what;
        std::function<void(Fields &)> change;
        const char *mismatch;
    } cases[] = {
        {"a protocol at the end", [&](Fields &all) { all.push_back(stranger); },
         "'Stranger' (9999) is in no section: add a row, or move an end, in 'sections'"},
        {"the first of a section", [](Fields &all) { place(all, 479)->name = "Source"; },
         "UDP: 'UDP Source Port' is no field of the plug-in there"},
        {"an end that is no longer the only one", [&](Fields &all) { all.insert(place(all, 408), namesake); },
         "TCP: 'Urgent Pointer' is the name of several fields: add the id"},
        {"ends that changed places", [](Fields &all) { std::swap(*place(all, 795), *place(all, 820)); },
         "SCTP: 'Payload Protocol Identifier' is the last field of the row, but comes before its first"},
        {"a field in two sections", [](Fields &all) { std::swap(*place(all, 407), *place(all, 479)); },
         "UDP: 'Urgent Pointer' (408) is in two sections"},
        {"a length", [](Fields &all) { place(all, 946)->name = "Length"; },
         "SCTP ABORT, causes: 'Chunk Length' is a length, but no field"},
        {"a mask", [](Fields &all) { place(all, 604)->keyIndex = 0; },
         "ICMP: 'Address Mask' has a key type, but is no key field"},
    };
    for (const auto &[what, change, mismatch] : cases) {
        Fields fields = tables().fields();
        change(fields);
        const FieldKnowledge knowledge(fields);
        const std::vector<std::string> &found = knowledge.mismatches();
        EXPECT_NE(std::ranges::find(found, mismatch), found.end())
            << what << ": " << (found.empty() ? "nothing" : found.front());
    }
}

} // namespace
} // namespace netfloor::test
