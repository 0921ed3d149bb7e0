// SPDX-License-Identifier: MIT
// The tables as a host gets them from vx_DLLGetPtr and vx_DLLGetTable, word by word.
#include <algorithm>
#include <functional>
#include <map>
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
    [[nodiscard]] const FieldDescriptor &field(std::uint32_t id) const {
        return *std::ranges::find(rows(), id, &FieldDescriptor::fieldId);
    }

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
    const auto pointer = [&](std::int32_t number) {
        const void *out = nullptr;
        library.getPtr()(number, &out);
        return static_cast<const char *>(out);
    };
    EXPECT_STREQ(pointer(1), "RW1.02.01");
    EXPECT_STREQ(table<char>(1), "RW1.02.01");
    EXPECT_EQ(table<char>(2) - pointer(2), 16);
    EXPECT_EQ(table<char>(5) - pointer(5), 16);
}

TEST(Exports, tellWhoThePluginIs) {
    const void *out = nullptr;
    sharedHost().library().getPtr()(NETFLOOR_TABLE_IDENTITY, &out);
    const auto &identity = *static_cast<const ProtocolIdentity *>(out);
    EXPECT_EQ(std::vector(std::begin(identity.head), std::end(identity.head)),
              (std::vector<std::uint32_t>{7, 0, 0, 0}));
    std::string slots;
    for (std::size_t slot = 0; slot < std::size(identity.slots); ++slot) {
        const bool isNumber = (slot >= 16 && slot <= 18) || slot >= 21;
        slots += isNumber ? '#' + std::to_string(identity.slots[slot].number) : identity.slots[slot].text;
        slots += '|';
    }
    EXPECT_EQ(slots, "IETF|IP(Lower)|IPv4&IPv6(Lower)|RFC 791& 2460 |UMTS|IP layers below GTP||NETFLOOR.CSF||"
                     "Release VEXTOOLS_A.02.20|Release VEXTOOLS_A.02.20|2048|Ethernet Type|RFC 791 & RFC 2460|||#0|#3|"
                     "#0|IP|NETFLOOR.CSF|#0|#65535|#65535|#0|");
}

Octets le32(std::initializer_list<std::uint32_t> words) {
    Octets octets;
    for (const std::uint32_t word : words) {
        for (unsigned shift = 0; shift < 32; shift += 8) {
            octets.push_back(static_cast<std::uint8_t>(word >> shift));
        }
    }
    return octets;
}

Octets text(std::string_view characters, const Octets &after) {
    return Octets(characters.begin(), characters.end()) + after;
}

TEST(Exports, giveSamplesOfTheLayoutOfRecords) {
    constexpr std::uint32_t a = 0xa5a5a5a5;
    const std::map<std::int32_t, Octets> samples = {
        {4, le32({4, 124, 92, 60, a, a, a, 1, 0xfffd, 0x106, 0xffff, 0x4b4b4b4b}) + hex("0800 0d00 0100 0300") +
                text("VEX Protocol Prototype dummy field", hex("00 00")) + le32({16, 36, 20, 32, 24, 32, 44, 56})},
        {5, le32({5, 220, 172, 60, a, a, a, a, a, 0, 0, a, 0, 0x10000, 1}) +
                text("test_vex_protocol_DLL.dll", hex("00 3c3c")) + le32({1, 0, 0, 0}) + le32({1}) +
                hex("00 00 3c 3c") + le32({7}) + hex("00 00 3c 3c") + hex("01 3c 01 00") + le32({8}) +
                hex("00 3c 00 00") + le32({0, 3}) + hex("00 00 00 3c") + le32({0, 0, 13}) + le32({0, 0, 0, 0}) +
                le32({16, 88, 20, 104, 24, 120, 28, 156, 32, 164, 44, 112})},
    };
    for (const auto &[number, octets] : samples) {
        const void *out = nullptr;
        sharedHost().library().getPtr()(number, &out);
        const auto *const record = static_cast<const std::uint8_t *>(out);
        EXPECT_EQ(octets.size(), number == 4 ? 124U : 220U);
        EXPECT_EQ(hexText({record, octets.size()}), hexText(octets)) << number;
    }
}

TEST(FieldTable, hasItsRowsInEveryWord) {
    EXPECT_STREQ(tables().fields[0].name, "Version");
    const struct {
        std::uint32_t id;
        const char *name;
        std::uint32_t flags, keyIndex;
        std::int32_t valueCount, valueStart;
        std::uint32_t width, displayIndex;
        const char *format;
        std::uint32_t layout;
    } telling[] = {
        {150, "Version", 0x5010001, 1, 0, -1, 0xffff0004, 0, "Version=%u", 0},
        {295, "Protocol", 0x5010001, 8, 139, 18, 0xffff0008, 31, "Protocol=%-S", 0x167},
        {159, "Source Address", 0x5010303, 9, 0, -1, 0xffff0020, 172, R"(Source Address= %-["%u":"."])", 0x187},
        {384, "TCP Source Port", 0x5010002, 41, 292, 1647, 0xffff0010, 295, "  TCP Source Port=%-S (%u)", 0x269},
        {478, "MD5 digest", 0x5000004, 0, 0, -1, 0xffffffff, 603, R"(    MD5 digest=%-["%x"])", 0x3b3},
        {956, "Source IP Address", 0x5000004, 0, 0, -1, 0xffffffff, 792, R"(Source IP Address=%-["%x":"."])", 0x207},
        {958, "Source IP Address", 0x5010004, 90, 0, -1, 0xffffffff, 209, "", 0x20c},
    };
    for (const auto &row : telling) {
        SCOPED_TRACE(row.id);
        const FieldDescriptor &field = tables().field(row.id);
        EXPECT_STREQ(field.name, row.name);
        EXPECT_STREQ(field.shortName, row.name);
        EXPECT_STREQ(tables().texts[field.displayIndex], row.format);
        EXPECT_EQ((std::vector<std::int64_t>{field.flags, static_cast<std::int64_t>(field.keyIndex), field.valueCount,
                                             field.valueStart, field.width, field.displayIndex, field.templateOffset}),
                  (std::vector<std::int64_t>{row.flags, row.keyIndex, row.valueCount, row.valueStart, row.width,
                                             row.displayIndex, row.layout}));
    }
    const auto &end = reinterpret_cast<const FieldTableEnd &>(tables().fields[tables().fieldCount]);
    EXPECT_EQ(end.flags, 0xffffffffU);
    EXPECT_EQ(end.fieldId, 0xffffU);
    EXPECT_STREQ(end.marker, "$_$LAST_FIELD$_$");
    EXPECT_EQ((std::vector<std::uintptr_t>{end.words[0], end.words[1], end.counts[0], end.counts[1], end.width}),
              (std::vector<std::uintptr_t>{0, 0xffff, 0xffff, 0xffff, 0xffffffff}));
    EXPECT_TRUE(std::ranges::all_of(end.zero, [](std::uint32_t word) { return word == 0; }));
}

// Facts that hold in each row.
TEST(FieldTable, holdsTogether) {
    std::set<std::uint32_t> ids;
    std::set<std::uint32_t> ofTopOctet6;
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
        if (field.flags >> 24 != 5) {
            EXPECT_EQ(field.flags >> 24, 6U);
            ofTopOctet6.insert(field.fieldId);
        }
        EXPECT_EQ(field.valueStart, field.valueCount == 0 ? -1 : static_cast<std::int32_t>(nextValue));
        nextValue += static_cast<std::size_t>(field.valueCount);
        EXPECT_TRUE(std::ranges::all_of(field.unused1, [](std::int32_t word) { return word == -1; }));
        EXPECT_TRUE(std::ranges::all_of(field.unused2, [](std::int32_t word) { return word == -1; }));
        EXPECT_FALSE(std::string_view(field.name).starts_with(' '));
    }
    EXPECT_EQ(nextValue, tables().valueCount);
    EXPECT_EQ(ofTopOctet6, (std::set<std::uint32_t>{396, 398, 399, 400, 401, 402, 403, 404, 405, 406, 407, 408, 489,
                                                    490, 848, 852}));
}

std::set<std::uint32_t> usedOfPool() {
    std::set<std::uint32_t> used;
    for (const ValueMapRow &row : std::span(tables().values, tables().valueCount)) {
        used.insert(row.poolIndex);
        if (row.kind == 65536) {
            used.insert(row.poolIndex + 1);
        }
    }
    return used;
}

TEST(ValueTables, haveTheirNumbers) {
    const Tables &all = tables();
    EXPECT_EQ(all.values[all.valueCount].poolIndex, 0U);
    EXPECT_EQ(all.values[all.valueCount].displayIndex, 0U);

    // What each part of the pool holds.
    for (std::int32_t number = 0; number <= 137; ++number) {
        EXPECT_EQ(all.pool[number], number);
    }
    const auto part = [&](std::size_t from, std::size_t to) { return std::vector(all.pool + from, all.pool + to + 1); };
    using Numbers = std::vector<std::int32_t>;
    EXPECT_EQ(part(138, 139), (Numbers{138, 252}));
    EXPECT_EQ(part(140, 154), (Numbers{5039, 9822, 13809, 19900, 24083, 27618, 30797, 35031, 39544, 44937, 48420, 50539,
                                       54980, 57909, 61850}));
    EXPECT_EQ(part(155, 156), (Numbers{50, 0}));
    const Numbers ports = part(157, 335);
    const Numbers carried = part(336, 357);
    EXPECT_EQ((Numbers{ports.front(), ports.back(), carried.front(), carried.back()}),
              (Numbers{139, 8002, 254, 65535}));
    EXPECT_EQ(std::ranges::adjacent_find(ports, std::greater_equal<>()), ports.end());
    EXPECT_EQ(std::ranges::adjacent_find(carried, std::greater_equal<>()), carried.end());
    EXPECT_EQ(part(358, 369), (Numbers{5, 127, 15, 62, 64, 126, 128, 190, 192, 254, 255, 32768}));

    // A list is in the order of its values, after its default.
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
    // All numbers are used, except the 0 that ends the pool.
    const std::set<std::uint32_t> used = usedOfPool();
    EXPECT_EQ(used.size(), *used.rbegin() + 1);
    EXPECT_EQ(all.pool[used.size()], 0);
}

TEST(TextTable, holdsEachTextOnceInFirstUse) {
    const Tables &all = tables();
    const std::set<std::string> distinct(all.texts, all.texts + all.textCount);
    EXPECT_EQ(distinct.size(), all.textCount);
    const std::map<std::size_t, const char *> rows = {
        {2, "Precedence=%-S"}, {3, "Routine"}, {10, "Network Control"}, {112, "ISO-IP"}, {209, ""}};
    for (const auto &[row, words] : rows) {
        EXPECT_STREQ(all.texts[row], words);
    }
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

// A record as a test writes it: pieces "5-8", count "1", "?" (told by the packet) or "1-16", step.
Octets layoutRecord(const std::vector<std::pair<int, int>> &pieces, std::pair<int, int> count, int step, int end) {
    const auto constant = [](int number) { return Octets{0x10, 0, 0, 0, static_cast<std::uint8_t>(number)}; };
    const auto span = [&](std::pair<int, int> ends) {
        return ends.first == ends.second ? constant(ends.first)
                                         : Octets{5} + constant(ends.first) + constant(ends.second);
    };
    Octets octets = hex("ff 02 55 01 04") + Octets{static_cast<std::uint8_t>(pieces.size())};
    for (const auto &piece : pieces) {
        octets = octets + span(piece);
    }
    octets = octets + (count.second == 0 ? hex("08 00 00") : span(count)) + constant(step) +
             Octets{8, static_cast<std::uint8_t>(end), 0};
    return Octets{static_cast<std::uint8_t>(octets.size()), 0} + octets;
}

// How many fields have each layout, by its offset.
std::map<std::uint32_t, int> usersOfLayouts() {
    const Tables &all = tables();
    std::map<std::uint32_t, int> users;
    for (std::uint32_t at = 0; at < bound && (all.layouts[at] != 0 || all.layouts[at + 1] != 0);
         at += 2U + all.layouts[at]) {
        EXPECT_EQ(all.layouts[at + 1], 0);
        users[at] = 0;
    }
    for (const FieldDescriptor &field : all.rows()) {
        EXPECT_TRUE(users.contains(field.templateOffset)) << field.fieldId;
        ++users[field.templateOffset];
    }
    return users;
}

TEST(LayoutTable, hasItsRecordsAndTheirUsers) {
    const Tables &all = tables();
    const std::vector<std::pair<int, int>> octet = {{1, 8}};
    const struct {
        std::size_t offset, length;
        Octets octets;
        std::uint32_t user; // a field of this layout
    } telling[] = {
        {0, 30, layoutRecord({{5, 8}}, {1, 1}, 0, 0), 150},
        {0x20, 30, layoutRecord({{1, 4}}, {1, 1}, 8, 0), 152},
        {0x60, 24, layoutRecord({{5, 5}}, {1, 1}, 0, 0), 287},
        {0xce, 30, layoutRecord(octet, {2, 2}, 8, 0), 153},
        {0x167, 30, layoutRecord(octet, {1, 1}, 8, 0), 295},
        {0x187, 30, layoutRecord(octet, {4, 4}, 8, 0), 159},
        {0x13c, 41, layoutRecord({{1, 5}, {9, 16}}, {1, 1}, 16, 0), 294},
        {0x269, 41, layoutRecord({{9, 16}, {1, 8}}, {1, 1}, 16, 0), 384},
        {0x393, 30, layoutRecord({{1, 32}}, {1, 1}, 32, 0), 472},
        {0x1e7, 30, layoutRecord({{16, 1}}, {8, 8}, 16, 0), 856},
        {0x4f4, 52, layoutRecord({{9, 12}, {17, 24}, {25, 32}}, {1, 1}, 32, 0), 167},
        {0x20c, 61, layoutRecord({{1, 4}, {5, 8}, {9, 12}, {13, 16}}, {0, 0}, 16, 1), 958},
        {0x24b, 28, layoutRecord(octet, {0, 0}, 8, 1), 306},
        {0x52a, 28, layoutRecord({{1, 4}}, {0, 0}, 4, 1), 229},
        {0x3b3, 36, layoutRecord(octet, {1, 16}, 8, 0), 478},
        {0x207, 3, hex("03 00 ff 00 00"), 956},
    };
    for (const auto &[offset, length, octets, user] : telling) {
        EXPECT_EQ(octets.size(), length + 2) << offset;
        EXPECT_EQ(hexText({all.layouts + offset, octets.size()}), hexText(octets)) << offset;
        EXPECT_EQ(all.field(user).templateOffset, offset) << user;
    }

    const std::map<std::uint32_t, int> users = usersOfLayouts();
    std::uint32_t newest = 0;
    for (const FieldDescriptor &field : all.rows()) {
        ASSERT_TRUE(users.contains(field.templateOffset)) << field.fieldId;
        EXPECT_TRUE(field.templateOffset <= newest || field.templateOffset == users.upper_bound(newest)->first)
            << field.fieldId;
        newest = std::max(newest, field.templateOffset);
    }
    EXPECT_EQ(newest, users.rbegin()->first);
}

// How often each thing occurs in the tables.
std::map<std::string, std::size_t> totals() {
    const Tables &all = tables();
    const std::map<std::uint32_t, int> users = usersOfLayouts();
    EXPECT_EQ(sharedHost().run(Pass::xtr, {}).ending, Ending::complete); // hands over the key rows
    const std::uint32_t lastLayout = users.rbegin()->first;
    std::map<std::string, std::size_t> found = {
        {"fields", all.fieldCount},
        {"key rows", sharedHost().library().keyFieldNames().size()},
        {"value rows", all.valueCount},
        {"numbers of the pool", usedOfPool().size() + 1},
        {"texts", all.textCount},
        {"layouts", users.size()},
        {"octets of layouts", lastLayout + 2U + all.layouts[lastLayout]},
        {"fields of one octet", users.at(0x167)},
        {"fields of two octets", users.at(0x269)},
    };
    for (const FieldDescriptor &field : all.rows()) {
        found["key fields"] += field.keyIndex != 0 ? 1 : 0;
        found["names with a blank at the end"] += std::string_view(field.name).ends_with(' ') ? 1 : 0;
        found["fields with names of ports"] += field.valueCount == 292 ? 1 : 0;
        found["fields with names of protocols"] += field.valueCount == 139 ? 1 : 0;
    }
    for (const ValueMapRow &row : std::span(all.values, all.valueCount)) {
        found["ranges of values"] += row.kind == 65536 ? 1 : 0;
    }
    return found;
}

// A change of any field changes these. No other test knows them.
TEST(Golden, totals) {
    const std::map<std::string, std::size_t> golden = {
        {"fields", 381},
        {"key fields", 102},
        {"key rows", 113},
        {"value rows", 4539},
        {"ranges of values", 40},
        {"numbers of the pool", 371},
        {"texts", 824},
        {"layouts", 44},
        {"octets of layouts", 1453},
        {"fields of one octet", 123},
        {"fields of two octets", 55},
        {"fields with names of ports", 8},
        {"fields with names of protocols", 14},
        {"names with a blank at the end", 24},
    };
    const std::map<std::string, std::size_t> found = totals();
    for (const auto &[what, count] : golden) {
        EXPECT_EQ(found.at(what), count) << what;
    }
}

} // namespace
} // namespace netfloor::test
