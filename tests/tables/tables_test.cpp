// SPDX-License-Identifier: MIT
// The tables as a host gets them from vx_DLLGetPtr and vx_DLLGetTable: what holds of any row. The known answers hold
// their words, and the reports of MD are compared with what they say.
#include <algorithm>
#include <set>
#include <string_view>
#include <utility>

#include <gtest/gtest.h>
#include <netfloor/descriptors.h>

#include "support/runs.h"

namespace netfloor::test {
namespace {

template <typename Row>
const Row *table(std::int32_t number) {
    const void *rows = nullptr;
    EXPECT_EQ(sharedHost().library().getTable()(number, &rows), NETFLOOR_TABLE_FOUND) << number;
    return static_cast<const Row *>(rows);
}

TEST(Exports, giveATableOrSayThatThereIsNone) {
    const PluginLibrary &library = sharedHost().library();
    const std::set<std::int32_t> pointers = {1, 2, 4, 5};
    const std::set<std::int32_t> tableNumbers = {1, 2, 4, 5, 6, 7, 8, 9};
    for (const std::int32_t number : {-2147483647 - 1, -1, 0, 1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 256, 2147483647}) {
        for (const auto &[get, known] : {std::pair(library.getPtr(), &pointers), {library.getTable(), &tableNumbers}}) {
            const void *out = &library;
            EXPECT_EQ(get(number, &out), known->contains(number) ? 0U : 0xd0410001U) << number;
            EXPECT_EQ(out != nullptr, known->contains(number)) << number;
        }
    }
}

// Facts that hold in each row.
TEST(FieldTable, holdsTogether) {
    const auto *const texts = table<const char *>(NETFLOOR_TABLE_TEXTS);
    std::set<std::uint32_t> ids;
    std::uint32_t keys = 0;
    std::int32_t nextValue = 0;
    for (const auto *field = table<FieldDescriptor>(NETFLOOR_TABLE_FIELDS); field->flags != NETFLOOR_NO_FIELD;
         ++field) {
        SCOPED_TRACE(field->fieldId);
        ASSERT_TRUE(ids.insert(field->fieldId).second);
        const bool variable = field->width == 0xffffffff;
        const std::uint32_t width = field->width & 0xffff;
        EXPECT_TRUE(variable || (field->width >> 16 == 0xffff && width >= 1));
        EXPECT_EQ(field->flags & 0xff, variable || width > 32 ? 4U : width > 16 ? 3U : width > 8 ? 2U : 1U);
        const std::string_view format = texts[field->displayIndex];
        // Every list of 32 or 128 bits is an address; the other fixed lists have nothing between their elements.
        EXPECT_EQ(field->flags >> 8 & 0xff, !variable && format.find("\":\"") != format.npos ? 3U : 0U);
        EXPECT_EQ(field->flags >> 16 & 0xff, field->keyIndex != 0 ? 1U : 0U);
        EXPECT_TRUE(field->keyIndex == 0 || field->keyIndex == ++keys);
        EXPECT_EQ(field->valueStart, field->valueCount == 0 ? -1 : nextValue);
        nextValue += field->valueCount;
        EXPECT_TRUE(std::ranges::all_of(field->unused1, [](std::int32_t word) { return word == -1; }));
        EXPECT_TRUE(std::ranges::all_of(field->unused2, [](std::int32_t word) { return word == -1; }));
        EXPECT_FALSE(std::string_view(field->name).starts_with(' '));
    }
    EXPECT_EQ(table<ValueMapRow>(NETFLOOR_TABLE_VALUES)[nextValue].kind, 0U); // the row that ends them
}

} // namespace
} // namespace netfloor::test
