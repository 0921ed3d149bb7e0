// SPDX-License-Identifier: MIT
// The tables as a host gets them from vx_DLLGetPtr and vx_DLLGetTable: what holds of any row. The known answers hold
// their words.
#include <algorithm>
#include <set>
#include <span>
#include <string>
#include <string_view>
#include <vector>

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

// Walks end where the tables say, and a bound keeps a table without an end from being walked for ever.
constexpr std::size_t bound = 10000;

struct Tables {
    const FieldDescriptor *fields = table<FieldDescriptor>(NETFLOOR_TABLE_FIELDS);
    const ValueMapRow *values = table<ValueMapRow>(NETFLOOR_TABLE_VALUES);
    const std::int32_t *pool = table<std::int32_t>(NETFLOOR_TABLE_POOL);
    const char *const *texts = table<const char *>(NETFLOOR_TABLE_TEXTS);
    const std::uint8_t *layouts = table<std::uint8_t>(NETFLOOR_TABLE_LAYOUTS);
    std::size_t fieldCount = walk([&](std::size_t i) { return fields[i].flags == NETFLOOR_NO_FIELD; });
    std::size_t valueCount = walk([&](std::size_t i) { return values[i].kind == 0; });
    std::size_t textCount = walk([&](std::size_t i) { return texts[i] == std::string_view(NETFLOOR_LAST_TEXT); });

    [[nodiscard]] std::span<const FieldDescriptor> rows() const { return {fields, fieldCount}; }

private:
    template <typename Ends>
    static std::size_t walk(Ends ends) {
        std::size_t count = 0;
        while (count < bound && !ends(count)) {
            ++count;
        }
        return count;
    }
};

const Tables &tables() {
    static const Tables all;
    return all;
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
    std::set<std::uint32_t> ids;
    std::uint32_t keys = 0;
    std::size_t nextValue = 0;
    for (const FieldDescriptor &field : tables().rows()) {
        SCOPED_TRACE(field.fieldId);
        EXPECT_TRUE(ids.insert(field.fieldId).second);
        const bool variable = field.width == 0xffffffff;
        const std::uint32_t width = field.width & 0xffff;
        EXPECT_TRUE(variable || (field.width >> 16 == 0xffff && width >= 1));
        EXPECT_EQ(field.flags & 0xff, variable || width > 32 ? 4U : width > 16 ? 3U : width > 8 ? 2U : 1U);
        const std::string_view format = tables().texts[field.displayIndex];
        // Every list of 32 or 128 bits is an address; the other fixed lists have nothing between their elements.
        EXPECT_EQ(field.flags >> 8 & 0xff, !variable && format.find("\":\"") != format.npos ? 3U : 0U);
        EXPECT_EQ(field.flags >> 16 & 0xff, field.keyIndex != 0 ? 1U : 0U);
        EXPECT_TRUE(field.keyIndex == 0 || field.keyIndex == ++keys);
        EXPECT_EQ(field.valueStart, field.valueCount == 0 ? -1 : static_cast<std::int32_t>(nextValue));
        nextValue += static_cast<std::size_t>(field.valueCount);
        EXPECT_TRUE(std::ranges::all_of(field.unused1, [](std::int32_t word) { return word == -1; }));
        EXPECT_TRUE(std::ranges::all_of(field.unused2, [](std::int32_t word) { return word == -1; }));
        EXPECT_FALSE(std::string_view(field.name).starts_with(' '));
    }
    EXPECT_EQ(nextValue, tables().valueCount);
}

// A list is in the order of its values, after its default.
TEST(ValueTables, areInOrder) {
    const Tables &all = tables();
    for (const FieldDescriptor &field : all.rows()) {
        std::int32_t above = -1;
        for (std::int32_t i = 0; i < field.valueCount; ++i) {
            const ValueMapRow &row = all.values[field.valueStart + i];
            ASSERT_TRUE(row.kind == 1 || row.kind == 65536) << field.fieldId;
            ASSERT_LT(row.poolIndex, bound);
            ASSERT_LT(row.displayIndex, all.textCount);
            if (row.kind == 65536 && row.poolIndex == 155) {
                EXPECT_EQ(i, 0) << field.fieldId;
                continue;
            }
            EXPECT_GT(all.pool[row.poolIndex], above) << field.fieldId;
            above = all.pool[row.poolIndex + (row.kind == 65536 ? 1 : 0)];
        }
    }
}

TEST(TextTable, holdsEachTextOnceInFirstUse) {
    const Tables &all = tables();
    const std::set<std::string> distinct(all.texts, all.texts + all.textCount);
    EXPECT_EQ(distinct.size(), all.textCount);
    std::uint32_t next = 0;
    const auto use = [&next](std::uint32_t row) {
        EXPECT_LE(row, next);
        next += row == next ? 1 : 0;
    };
    for (const FieldDescriptor &field : all.rows()) {
        use(field.displayIndex);
        for (std::int32_t i = 0; i < field.valueCount; ++i) {
            use(all.values[field.valueStart + i].displayIndex);
        }
    }
    EXPECT_EQ(next, all.textCount);
}

TEST(LayoutTable, holdsEachLayoutInFirstUse) {
    const Tables &all = tables();
    std::set<std::uint32_t> layouts;
    for (std::uint32_t at = 0; at < bound && (all.layouts[at] != 0 || all.layouts[at + 1] != 0);
         at += 2U + all.layouts[at]) {
        EXPECT_EQ(all.layouts[at + 1], 0);
        layouts.insert(at);
    }
    auto next = layouts.begin();
    for (const FieldDescriptor &field : all.rows()) {
        ASSERT_TRUE(layouts.contains(field.templateOffset)) << field.fieldId;
        if (next != layouts.end() && field.templateOffset == *next) {
            ++next;
        }
        EXPECT_TRUE(next == layouts.end() || field.templateOffset < *next) << field.fieldId;
    }
    EXPECT_EQ(next, layouts.end());
}

} // namespace
} // namespace netfloor::test
