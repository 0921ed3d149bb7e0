// SPDX-License-Identifier: MIT
// The readers of bits, by exhaustion, against a reader of one line a bit: every cursor, every width, every place that a
// field of the catalogue has. The octets lie between inaccessible pages, at the start of theirs and at its end.
#include <algorithm>
#include <array>
#include <cstdint>
#include <new>
#include <span>
#include <utility>
#include <vector>

#include <gtest/gtest.h>
#include <sys/mman.h>
#include <unistd.h>

#include "frame/bits.h"
#include "frame/field_record.h"
#include "tables/catalogue.h"

namespace netfloor::test {
namespace {

using plugin::Place;
using plugin::Shape;

constexpr std::uint32_t octetCount = 24;
constexpr std::uint32_t bitCount = octetCount * 8;

class BetweenPages {
public:
    enum class At : bool { start, end };

    explicit BetweenPages(At at) : page_(static_cast<std::size_t>(sysconf(_SC_PAGESIZE))) {
        mapping_ = mmap(nullptr, 3 * page_, PROT_NONE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0);
        auto *const middle = static_cast<std::uint8_t *>(mapping_) + page_;
        if (mapping_ == MAP_FAILED || mprotect(middle, page_, PROT_READ | PROT_WRITE) != 0) {
            throw std::bad_alloc();
        }
        octets_ = {at == At::start ? middle : middle + page_ - octetCount, octetCount};
        fill();
    }
    ~BetweenPages() { munmap(mapping_, 3 * page_); }
    BetweenPages(const BetweenPages &) = delete;
    BetweenPages &operator=(const BetweenPages &) = delete;

    void fill() const {
        for (std::uint32_t i = 0; i < octetCount; ++i) {
            octets_[i] = static_cast<std::uint8_t>((i + 1) * 0x9d ^ i >> 1);
        }
    }
    [[nodiscard]] std::span<std::uint8_t> octets() const { return octets_; }

private:
    std::size_t page_;
    void *mapping_ = nullptr;
    std::span<std::uint8_t> octets_;
};

std::uint32_t bitAt(std::span<const std::uint8_t> octets, std::uint32_t bit) {
    return octets[(bit - 1) / 8] >> (bit - 1) % 8 & 1;
}

std::uint32_t readBits(std::span<const std::uint8_t> octets, std::uint32_t first, std::uint32_t width) {
    std::uint32_t value = 0;
    for (std::uint32_t bit = width; bit-- > 0;) {
        value = value << 1 | bitAt(octets, first + bit);
    }
    return value;
}

struct Element {
    std::uint32_t first, width;
};

// The elements of a place in the order in which they make the value, from what place.h says of each shape.
std::vector<Element> elementsOf(const Place &place, std::uint32_t cursor, std::uint32_t units) {
    std::vector<Element> elements;
    const auto add = [&](std::uint32_t width, std::uint32_t count) {
        for (std::uint32_t i = 0; i < count; ++i) {
            elements.push_back({cursor + i * width, width});
        }
    };
    switch (place.shape) {
    case Shape::pieces:
    case Shape::ahead:
        for (std::uint32_t i = 0; i < place.count; ++i) {
            elements.push_back({cursor + place.pieces[i].low, place.pieces[i].high - place.pieces[i].low + 1});
        }
        break;
    case Shape::octets: add(8, units); break;
    case Shape::octetsBackward:
        add(8, units);
        std::reverse(elements.begin(), elements.end());
        break;
    case Shape::nibbles: add(4, units); break;
    case Shape::addressNibbles: add(4, 32); break;
    case Shape::groups:
    case Shape::reversedGroups: add(16, 8); break;
    }
    return elements;
}

// A group as it is shown: with its nibbles in another order.
std::uint32_t elementValue(Shape shape, std::span<const std::uint8_t> octets, const Element &element) {
    const auto nibble = [&](std::uint32_t place) { return readBits(octets, element.first + 4 * place, 4); };
    switch (shape) {
    case Shape::groups: return nibble(0) << 12 | nibble(1) << 8 | nibble(2) << 4 | nibble(3);
    case Shape::reversedGroups: return nibble(1) << 12 | nibble(0) << 8 | nibble(3) << 4 | nibble(2);
    default: return readBits(octets, element.first, element.width);
    }
}

template <Place place>
void checkPlaceAt(std::span<std::uint8_t> octets, std::uint32_t cursor, std::uint32_t units) {
    std::array<BitRange, 64> ranges{};
    FieldRecord record{};
    record.ranges = ranges.data();
    plugin::writeElements<place>(record, octets.data(), cursor, units);
    const std::vector<Element> elements = elementsOf(place, cursor, units);
    std::uint32_t value = 0;
    for (std::size_t i = 0; i < elements.size(); ++i) {
        const std::uint32_t expected = elementValue(place.shape, octets, elements[i]);
        value = elements[i].width == 32 ? expected : value << elements[i].width | expected;
        if (place.shape != Shape::ahead) {
            ASSERT_EQ(ranges[i].value, expected) << "element " << i << " at bit " << cursor;
        }
        if (place.shape != Shape::ahead && place.shape != Shape::groups) {
            ASSERT_EQ(ranges[i].firstBit, elements[i].first);
            ASSERT_EQ(ranges[i].lastBit, elements[i].first + elements[i].width - 1);
        }
    }
    value = place.shape == Shape::groups ? 0 : value * place.scale; // an address in groups has no number
    ASSERT_EQ(record.value, value) << "at bit " << cursor;
    if constexpr (plugin::hasStoredValue(place)) {
        ASSERT_EQ(plugin::valueAt<place>(octets.data(), cursor, units) * place.scale, value) << "at bit " << cursor;
    }
}

template <Place place>
void checkPlace() {
    static bool done = false; // several fields share a place
    if (std::exchange(done, true)) {
        return;
    }
    for (const auto at : {BetweenPages::At::start, BetweenPages::At::end}) {
        const BetweenPages memory(at);
        const std::uint32_t mostUnits = place.isRun() ? 9 : place.count;
        for (std::uint32_t units = place.isRun() ? 0 : place.count; units <= mostUnits; ++units) {
            for (std::uint32_t cursor = 1; cursor + place.needs(units) <= bitCount + 1; ++cursor) {
                checkPlaceAt<place>(memory.octets(), cursor, units);
            }
        }
    }
}

TEST(Bits, eachPlaceOfTheCatalogueAtEachCursor) {
    plugin::CatalogueFields::forEachField([&]<const plugin::Field & field> {
        SCOPED_TRACE(field.name);
        checkPlace<field.place>();
    });
}

TEST(Bits, eachWidthAtEachCursor) {
    for (const auto at : {BetweenPages::At::start, BetweenPages::At::end}) {
        const BetweenPages memory(at);
        const std::uint8_t *const data = memory.octets().data();
        for (std::uint32_t first = 1; first <= bitCount; ++first) {
            for (std::uint32_t width = 1; width <= 32 && first + width <= bitCount + 1; ++width) {
                const std::uint32_t expected = readBits(memory.octets(), first, width);
                ASSERT_EQ(plugin::bits(data, first, first + width - 1), expected);
                ASSERT_EQ(plugin::bitsAcross(data, first, first + width - 1), expected);
                ASSERT_TRUE(width != 4 || plugin::nibbleAt(data, first) == expected);
                ASSERT_TRUE(width != 8 || plugin::octetAt(data, first) == expected);
            }
            for (std::uint32_t count = 0; count <= 9 && first + count * 8 <= bitCount + 1; ++count) {
                std::uint32_t expected = 0;
                for (std::uint32_t i = 0; i < count; ++i) {
                    expected = expected << 8 | readBits(memory.octets(), first + i * 8, 8);
                }
                ASSERT_EQ(plugin::octetsAt(data, first, count), expected);
            }
            if (first + 128 <= bitCount + 1) {
                const auto address = plugin::octetArrayAt<16>(data, first);
                for (std::uint32_t i = 0; i < address.size(); ++i) {
                    ASSERT_EQ(address[i], readBits(memory.octets(), first + i * 8, 8));
                }
            }
        }
    }
}

// Each octet from a cursor on, up to the last whole octet of the packet, counted from the cursor.
TEST(Bits, eachReversalOfOctets) {
    for (const auto at : {BetweenPages::At::start, BetweenPages::At::end}) {
        const BetweenPages memory(at);
        const std::vector<std::uint8_t> before(memory.octets().begin(), memory.octets().end());
        for (std::uint32_t total = 0; total <= bitCount; ++total) {
            for (std::uint32_t from = 1; from <= total + 1; ++from) {
                memory.fill();
                plugin::reverseOctets(memory.octets().data(), from, total);
                const std::uint32_t end = total / 8 * 8;
                for (std::uint32_t bit = 1; bit <= bitCount; ++bit) {
                    const std::uint32_t octet = from + (bit - from) / 8 * 8;
                    const bool isReversed = bit >= from && octet + 7 <= end;
                    ASSERT_EQ(bitAt(memory.octets(), bit), bitAt(before, isReversed ? 2 * octet + 7 - bit : bit))
                        << "bit " << bit << " from " << from << " of " << total;
                }
            }
        }
    }
}

} // namespace
} // namespace netfloor::test
