// SPDX-License-Identifier: MIT
// The two views of a field agree: the reports of the MD pass are what a reader of the tables expects.
#include <algorithm>
#include <map>
#include <optional>
#include <set>
#include <string>
#include <string_view>
#include <vector>

#include <gtest/gtest.h>

#include "support/corpus.h"
#include "support/runs.h"

namespace netfloor::test {
namespace {

const FieldTables &tables() {
    static const FieldTables all(PluginLibrary::open(pluginPath()));
    return all;
}

// The pass keeps a display line in a buffer of 256 octets.
constexpr std::size_t longestText = 255;

// Bits first to last, the later octet the more significant one: the numbering of bits, taken literally.
std::uint32_t bits(const Octets &packet, std::uint32_t first, std::uint32_t last) {
    std::uint32_t value = 0;
    for (std::uint32_t bit = last; bit >= first; --bit) {
        value = value << 1 | (packet.at((bit - 1) / 8) >> ((bit - 1) % 8) & 1u);
    }
    return value;
}

// Facts that the grammar has and the tables do not.
const std::set<std::uint32_t> scaledByEight = {294, 619};
const std::set<std::uint32_t> readBackward = {201, 208, 209, 215, 216, 555, 895, 925, 927}; // last octet first
constexpr std::uint32_t reportedByShortName = 243;
constexpr std::uint32_t secondOctetFirst = 0x269; // so the layout lists two octets that are read in network order

std::uint32_t elementAt(const Octets &packet, const ReportedRange &range, const FieldDescription &known) {
    if (known.layout.pieces.front().first <= known.layout.pieces.front().last) {
        return bits(packet, range.firstBit, range.lastBit);
    }
    // Octets whose bits are reversed are read backward, which gives network order.
    return bits(packet, range.firstBit, range.firstBit + 7) << 8 | bits(packet, range.lastBit - 7, range.lastBit);
}

// The elements of a list. A field that is shown by groups reports one range for all of them.
std::vector<std::uint32_t> elementsOf(const Octets &packet, const FieldReport &report, const FieldDescription &known) {
    std::vector<std::uint32_t> elements;
    const bool isInGroups = known.layout.kind == FieldLayout::Kind::none && report.ranges.size() == 1 &&
                            known.format.find("%-[") != std::string_view::npos;
    for (const ReportedRange &range : report.ranges) {
        if (!isInGroups) {
            elements.push_back(range.value);
            continue;
        }
        for (std::uint32_t bit = range.firstBit; bit < range.lastBit; bit += 16) {
            elements.push_back(bits(packet, bit, bit + 3) << 12 | bits(packet, bit + 4, bit + 7) << 8 |
                               bits(packet, bit + 8, bit + 11) << 4 | bits(packet, bit + 12, bit + 15));
        }
    }
    return elements;
}

// Whether the ranges are where the layout has them, in its order or in the reverse one.
enum class Order : std::uint8_t { none, same, reverse };
Order orderOf(const std::vector<ReportedRange> &ranges, const FieldDescription &known) {
    const auto repeats = static_cast<std::uint32_t>(ranges.size() / known.layout.pieces.size());
    const std::uint32_t start = std::ranges::min(known.layOut(1, 1), {}, &BitSpan::first).first;
    const std::uint32_t cursor =
        ranges.empty() ? 1 : std::ranges::min(ranges, {}, &ReportedRange::firstBit).firstBit - start + 1;
    std::vector<BitSpan> spans = known.layOut(cursor, repeats);
    const auto isSame = [](const ReportedRange &range, const BitSpan &span) {
        return range.firstBit == span.first && range.lastBit == span.last;
    };
    if (repeats < known.layout.leastCount || (known.layout.mostCount != 0 && repeats > known.layout.mostCount)) {
        return Order::none;
    }
    if (std::ranges::equal(ranges, spans, isSame)) {
        return Order::same;
    }
    std::ranges::reverse(spans);
    return std::ranges::equal(ranges, spans, isSame) ? Order::reverse : Order::none;
}

// What of a report is not as the tables say; empty where all is.
std::string differenceOf(const Octets &packet, const FieldReport &report, const FieldDescription &known, Order &order) {
    std::string_view name = report.name;
    name.remove_prefix(std::min(name.find_first_not_of(' '), name.size()));
    if (name != (report.id == reportedByShortName ? known.shortName : known.name)) {
        return "named " + std::string(known.name);
    }
    const std::string text = known.display(report.value, elementsOf(packet, report, known)).substr(0, longestText);
    if (report.text != text) {
        return "shown as " + text;
    }
    if (known.layout.kind == FieldLayout::Kind::none) {
        return "";
    }
    order = orderOf(report.ranges, known);
    std::uint32_t value = 0;
    std::uint32_t width = 0;
    for (const ReportedRange &range : report.ranges) {
        const std::uint32_t rangeWidth = range.lastBit - range.firstBit + 1;
        if (range.value != elementAt(packet, range, known)) {
            return "other bits at " + std::to_string(range.firstBit);
        }
        value = (rangeWidth == 32 ? 0 : value << rangeWidth) | range.value;
        width += rangeWidth;
    }
    if (order == Order::none || (known.width && *known.width != width)) {
        return "elsewhere";
    }
    const bool isValue = value * (scaledByEight.contains(report.id) ? 8 : 1) == report.value;
    return isValue ? "" : "value " + std::to_string(value);
}

// Runs packets, and keeps what it has seen of their fields.
class Comparison {
public:
    // All fields of the packet, or those of one id.
    void add(const Octets &packet, std::optional<std::uint32_t> only = {}) {
        for (const FieldReport &report : sharedHost().run(Pass::md, packet).fields) {
            const FieldDescription *const known = tables().find(report.id);
            if (report.id == 0 || only.value_or(report.id) != report.id || testing::Test::HasFailure()) {
                continue;
            }
            ASSERT_NE(known, nullptr) << report.id;
            Order order = Order::same;
            EXPECT_EQ(differenceOf(packet, report, *known, order), "")
                << report.id << " \"" << report.name << "\" \"" << report.text << "\" " << hexText(packet);
            seen.insert(report.id);
            if (order == Order::reverse) {
                reversed.insert(report.id);
            }
        }
    }

    std::set<std::uint32_t> seen, reversed; // ids; the order of their elements
};

// Writes `value` into the bits of a field, its low bits into the last range.
Octets withValue(Octets packet, const FieldReport &field, std::uint32_t value) {
    for (auto range = field.ranges.rbegin(); range != field.ranges.rend(); ++range) {
        for (std::uint32_t bit = range->firstBit; bit <= range->lastBit; ++bit, value >>= 1) {
            std::uint8_t &octet = packet.at((bit - 1) / 8);
            const std::uint32_t mask = 1u << ((bit - 1) % 8);
            octet = static_cast<std::uint8_t>((octet & ~mask) | ((value & 1) != 0 ? mask : 0));
        }
    }
    return packet;
}

// Every value of a field of up to 8 bits and of one with ports; else those that have names, their neighbours and
// samples.
std::set<std::uint32_t> valuesToTry(const FieldDescription &field) {
    constexpr std::uint32_t mostSamples = 61;
    constexpr std::uint32_t udpSourcePort = 479;
    std::set<std::uint32_t> values;
    const std::uint32_t width = std::min(field.width.value_or(0), 32u);
    const std::uint32_t most = width == 32 ? 0xffffffff : (1u << width) - 1;
    const std::uint32_t step = width <= 8 || field.id == udpSourcePort ? 1 : most / mostSamples;
    for (std::uint64_t value = 0; value <= most; value += step) {
        values.insert(static_cast<std::uint32_t>(value));
    }
    for (const NamedValue &row : field.values) {
        for (const std::uint32_t value : {row.from - 1, row.from, row.to, row.to + 1}) {
            values.insert(std::min(value, most));
        }
    }
    values.insert(most);
    return values;
}

TEST(Views, agreeOnEveryField) {
    Comparison all;
    std::set<std::uint32_t> tried;
    for (const Octets &packet : packetsOfAllFields()) {
        all.add(packet);
        const Report report = sharedHost().run(Pass::md, packet);
        for (const FieldReport &field : report.fields) {
            const FieldDescription *const known = tables().find(field.id);
            if (known == nullptr || known->width.value_or(99) > 32 || !tried.insert(field.id).second) {
                continue;
            }
            for (const std::uint32_t value : valuesToTry(*known)) {
                all.add(withValue(packet, field, value), field.id);
            }
        }
    }
    std::set<std::uint32_t> backward = readBackward;
    for (const FieldDescription &field : tables().fields()) {
        EXPECT_TRUE(all.seen.contains(field.id)) << field.id;
        if (field.layoutOffset == secondOctetFirst) {
            backward.insert(field.id);
        }
    }
    EXPECT_EQ(all.reversed, backward);
    // All ports of one field were tried; the other fields have the same names.
    for (const std::uint32_t id : {384U, 387U, 391U, 393U, 482U, 486U, 488U}) {
        EXPECT_TRUE(std::ranges::equal(tables().find(id)->values, tables().find(479)->values)) << id;
    }
}

// The key-field table has neither width nor kind; the host takes both from the field of the same name.
TEST(Views, giveKeyTypes) {
    const std::map<std::string_view, KeyType> telling = {{"DF", KeyType::number8},
                                                         {"Identification", KeyType::number16},
                                                         {"TSN", KeyType::number32},
                                                         {"Address Mask", KeyType::ipv4Address},
                                                         {"Source Address", KeyType::ipv4Address},
                                                         {"Source IP Address", KeyType::ipv6Address}};
    std::map<std::string, KeyType, std::less<>> found;
    for (const Octets &packet : packetsOfAllFields()) {
        for (const KeyValue &key : sharedHost().run(Pass::xtr, packet).keys) {
            found.emplace(key.name, key.type);
        }
    }
    for (const FieldDescription &field : tables().fields()) {
        EXPECT_TRUE(field.keyIndex == 0 || found.contains(field.name)) << field.name << " is in no packet";
    }
    for (const auto &[name, type] : telling) {
        EXPECT_EQ(found.find(name)->second, type) << name;
    }
}

} // namespace
} // namespace netfloor::test
