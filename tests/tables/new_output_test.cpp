// SPDX-License-Identifier: MIT
// How to write a new output over the fields: one file that walks the catalogue. No protocol changes for it, and no
// other file refers to it. This one lists id, name and display line, and the test compares it with the loaded plug-in.
#include <string>

#include <gtest/gtest.h>

#include "netfloor-host/field_tables.h"
#include "support/runs.h"
#include "tables/catalogue.h"

namespace netfloor::test {
namespace {

std::string line(std::uint32_t id, std::string_view name, std::string_view display) {
    return std::to_string(id) + '\t' + std::string(name) + '\t' + std::string(display) + '\n';
}

// The output.
std::string listOfFields() {
    std::string list;
    plugin::CatalogueFields::forEachField(
        [&]<const plugin::Field & field> { list += line(field.id, field.bareName(), plugin::longText<field>); });
    return list;
}

TEST(NewOutput, isOneFileOverTheCatalogue) {
    const FieldTables published(PluginLibrary::open(pluginPath()));
    std::string expected;
    for (const FieldDescription &field : published.fields()) {
        expected += line(field.id, field.shortName, field.format);
    }
    EXPECT_EQ(listOfFields(), expected);
}

} // namespace
} // namespace netfloor::test
