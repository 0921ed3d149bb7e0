// SPDX-License-Identifier: MIT
#include "arrow_reader.h"

#include <cerrno>
#include <cstdint>
#include <cstring>
#include <map>
#include <span>
#include <string_view>

#include <gtest/gtest.h>

#include "netfloor-analysis/utf8.h"
#include "support/packets.h"

namespace netfloor::test {
namespace {

// Octets of a number of such a format; 0 for the other formats.
std::size_t width(std::string_view format) {
    static const std::map<std::string_view, std::size_t> widths = {{"C", 1}, {"S", 2}, {"I", 4},
                                                                   {"i", 4}, {"L", 8}, {"tsn:UTC", 8}};
    const auto found = widths.find(format);
    return found == widths.end() ? 0 : found->second;
}

bool bit(const void *bitmap, std::int64_t place) {
    return (static_cast<const std::uint8_t *>(bitmap)[place / 8] >> (place % 8) & 1) != 0;
}

void checkAligned(const void *buffer, std::size_t octets) {
    ASSERT_NE(buffer, nullptr);
    ASSERT_EQ(reinterpret_cast<std::uintptr_t>(buffer) % octets, 0U);
}

std::int64_t number(const void *buffer, std::int64_t place, std::size_t octets, bool isSigned) {
    std::uint64_t value = 0;
    std::memcpy(&value, static_cast<const std::uint8_t *>(buffer) + static_cast<std::size_t>(place) * octets, octets);
    return isSigned && octets == 4 ? static_cast<std::int32_t>(value) : static_cast<std::int64_t>(value);
}

bool isText(std::string_view text) {
    while (!text.empty()) {
        const std::size_t octets = utf8Octets(text);
        if (octets == 0) {
            return false;
        }
        text.remove_prefix(octets);
    }
    return true;
}

// Whether each value is there, as the bitmap and the number of nulls say alike.
std::vector<bool> readValidity(const ArrowSchema &schema, const ArrowArray &array) {
    std::vector<bool> present(static_cast<std::size_t>(array.length), true);
    std::int64_t nulls = 0;
    for (std::int64_t i = 0; array.buffers[0] != nullptr && i < array.length; ++i) {
        present[static_cast<std::size_t>(i)] = bit(array.buffers[0], i);
        nulls += present[static_cast<std::size_t>(i)] ? 0 : 1;
    }
    EXPECT_EQ(array.null_count, nulls) << schema.name;
    EXPECT_TRUE(nulls == 0 || (schema.flags & ARROW_FLAG_NULLABLE) != 0) << schema.name;
    return present;
}

TextRow readOctets(std::string_view format, const ArrowArray &array) {
    TextRow values;
    EXPECT_EQ(array.n_buffers, 3);
    checkAligned(array.buffers[1], 4);
    EXPECT_EQ(number(array.buffers[1], 0, 4, true), 0);
    for (std::int64_t i = 0; i < array.length; ++i) {
        const std::int64_t from = number(array.buffers[1], i, 4, true);
        const std::int64_t to = number(array.buffers[1], i + 1, 4, true);
        EXPECT_LE(from, to);
        const std::string_view value(static_cast<const char *>(array.buffers[2]) + from,
                                     static_cast<std::size_t>(to - from));
        EXPECT_TRUE(format != "u" || isText(value)) << value;
        values.push_back(format == "u" ? std::string(value)
                                       : hexText({reinterpret_cast<const std::uint8_t *>(value.data()), value.size()}));
    }
    return values;
}

TextRow readNumbers(std::string_view format, const ArrowArray &array) {
    TextRow values;
    EXPECT_EQ(array.n_buffers, 2);
    checkAligned(array.buffers[1], format == "b" ? 1 : width(format));
    for (std::int64_t i = 0; i < array.length; ++i) {
        values.push_back(format == "b" ? std::string(bit(array.buffers[1], i) ? "1" : "0")
                                       : std::to_string(number(array.buffers[1], i, width(format), format == "i")));
    }
    return values;
}

void checkSchema(const ArrowSchema &schema) {
    ASSERT_NE(schema.release, nullptr);
    ASSERT_NE(schema.format, nullptr);
    ASSERT_NE(schema.name, nullptr);
    EXPECT_TRUE(schema.n_children == 0 || std::string_view(schema.format) == "+s");
    for (std::int64_t i = 0; i < schema.n_children; ++i) {
        checkSchema(*schema.children[i]);
    }
    if (schema.dictionary != nullptr) {
        EXPECT_STREQ(schema.format, "i");
        checkSchema(*schema.dictionary);
    }
}

template <typename Record>
void release(Record &record) {
    ASSERT_NE(record.release, nullptr);
    record.release(&record);
    EXPECT_EQ(record.release, nullptr);
}

void readBatch(const ArrowSchema &schema, const ArrowArray &batch, TextTable &table) {
    ASSERT_EQ(batch.n_children, schema.n_children);
    ASSERT_EQ(batch.n_buffers, 1);
    EXPECT_EQ(batch.buffers[0], nullptr); // a row is never null as a whole
    EXPECT_EQ(batch.null_count, 0);
    EXPECT_EQ(batch.dictionary, nullptr);
    EXPECT_GT(batch.length, 0);
    const std::size_t first = table.rows.size();
    table.rows.resize(first + static_cast<std::size_t>(batch.length));
    table.batches.push_back(static_cast<std::size_t>(batch.length));
    for (std::int64_t column = 0; column < batch.n_children; ++column) {
        ASSERT_EQ(batch.children[column]->length, batch.length);
        const TextRow values = readColumn(*schema.children[column], *batch.children[column]);
        for (std::size_t row = 0; row < values.size(); ++row) {
            table.rows[first + row].push_back(values[row]);
        }
    }
}

} // namespace

TextRow readColumn(const ArrowSchema &schema, const ArrowArray &array) {
    const std::string_view format = schema.format;
    EXPECT_NE(array.release, nullptr);
    EXPECT_EQ(array.offset, 0);
    EXPECT_EQ(array.n_children, 0);
    EXPECT_EQ(array.dictionary != nullptr, schema.dictionary != nullptr);
    const std::vector<bool> present = readValidity(schema, array);
    TextRow values = format == "u" || format == "z" ? readOctets(format, array) : readNumbers(format, array);
    if (array.dictionary != nullptr) {
        const TextRow words = readColumn(*schema.dictionary, *array.dictionary);
        for (std::size_t i = 0; i < values.size(); ++i) {
            values[i] = present[i] ? words.at(std::stoul(values[i])) : "";
        }
    }
    for (std::size_t i = 0; i < values.size(); ++i) {
        values[i] = present[i] ? values[i] : "-";
    }
    return values;
}

TextTable readTable(ArrowArrayStream &stream) {
    TextTable table;
    ArrowSchema schema = {};
    EXPECT_EQ(stream.get_schema(&stream, &schema), 0);
    checkSchema(schema);
    EXPECT_STREQ(schema.format, "+s");
    for (std::int64_t i = 0; i < schema.n_children; ++i) {
        table.names.emplace_back(schema.children[i]->name);
        table.formats.emplace_back(schema.children[i]->format);
    }
    while (true) {
        ArrowArray batch = {};
        const int result = stream.get_next(&stream, &batch);
        if (result != 0) {
            EXPECT_EQ(result, EIO);
            EXPECT_EQ(batch.release, nullptr);
            const char *const error = stream.get_last_error(&stream);
            table.error = error == nullptr ? "no error" : error;
            break;
        }
        EXPECT_EQ(stream.get_last_error(&stream), nullptr);
        if (batch.release == nullptr) {
            break;
        }
        readBatch(schema, batch, table);
        release(batch);
    }
    // The end stays the end.
    ArrowArray after = {};
    EXPECT_EQ(stream.get_next(&stream, &after) == 0, table.error.empty());
    EXPECT_EQ(after.release, nullptr);
    release(schema);
    release(stream);
    return table;
}

} // namespace netfloor::test
