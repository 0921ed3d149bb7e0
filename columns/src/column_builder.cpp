// SPDX-License-Identifier: MIT
#include "column_builder.h"

#include <algorithm>
#include <array>
#include <cstring>
#include <string>
#include <unordered_map>
#include <utility>

#include "netfloor-host/value_text.h"

namespace netfloor {
namespace {

std::size_t bitmapOctets(std::size_t bits) {
    return (bits + 7) / 8;
}

class BooleanBuilder final : public ColumnBuilder {
    void set(std::size_t row, const Value &value) override {
        markPresent(row);
        if (value.number != 0) {
            bits_.setBit(row);
        }
    }
    void finishValues(std::size_t rows, ArrayParts &parts) override {
        parts.buffers.push_back(bits_.take(bitmapOctets(rows)));
    }

    GrowingBuffer bits_;
};

template <typename Number>
class NumberBuilder final : public ColumnBuilder {
    void set(std::size_t row, const Value &value) override {
        markPresent(row);
        numbers_.setNumber(row, static_cast<Number>(value.number));
    }
    void finishValues(std::size_t rows, ArrayParts &parts) override {
        parts.buffers.push_back(numbers_.take(rows * sizeof(Number)));
    }

    GrowingBuffer numbers_;
};

// Values of any length, one after the other, and where each begins.
class OctetRun {
public:
    void add(std::size_t row, std::span<const std::uint8_t> octets) {
        fillTo(row);
        octets_.insert(octets_.end(), octets.begin(), octets.end());
        fillTo(row + 1);
    }

    void finish(std::size_t rows, ArrayParts &parts) {
        fillTo(rows);
        parts.buffers.push_back(offsets_.take((rows + 1) * sizeof(std::int32_t)));
        parts.buffers.push_back(std::exchange(octets_, {}));
        filled_ = 1;
    }

private:
    // Rows up to this one end here, those that have no value included. The first offset is 0.
    void fillTo(std::size_t row) {
        for (; filled_ <= row; ++filled_) {
            offsets_.setNumber(filled_, static_cast<std::int32_t>(octets_.size()));
        }
    }

    GrowingBuffer offsets_;
    Buffer octets_;
    std::size_t filled_ = 1;
};

std::span<const std::uint8_t> octetsOf(std::string_view text) {
    return {reinterpret_cast<const std::uint8_t *>(text.data()), text.size()};
}

class TextBuilder final : public ColumnBuilder {
    void set(std::size_t row, const Value &value) override {
        markPresent(row);
        run_.add(row, octetsOf(value.text));
    }
    void finishValues(std::size_t rows, ArrayParts &parts) override { run_.finish(rows, parts); }

    OctetRun run_;
};

class OctetsBuilder final : public ColumnBuilder {
    void set(std::size_t row, const Value &value) override {
        markPresent(row);
        run_.add(row, value.octets);
    }
    void finishValues(std::size_t rows, ArrayParts &parts) override { run_.finish(rows, parts); }

    OctetRun run_;
};

struct Address {
    std::array<std::uint64_t, 2> words = {};
    std::size_t octets = 0;

    explicit Address(std::span<const std::uint8_t> from) : octets(from.size()) {
        std::memcpy(words.data(), from.data(), std::min(sizeof words, octets));
    }
    friend bool operator==(const Address &, const Address &) = default;
};

struct AddressHash {
    std::size_t operator()(const Address &address) const {
        constexpr std::uint64_t odd =
            0x9e3779b97f4a7c15; // 2^64 by the golden ratio: spreads what differs in a few bits
        return ((address.words[0] * odd) ^ address.words[1]) * odd >> 16U ^ address.octets;
    }
};

std::string_view addressText(std::span<const std::uint8_t> octets, TextRoom &room) {
    if (octets.size() == sizeof(std::uint32_t)) {
        const std::uint32_t number = static_cast<std::uint32_t>(octets[0]) << 24U |
                                     static_cast<std::uint32_t>(octets[1]) << 16U |
                                     static_cast<std::uint32_t>(octets[2]) << 8U | octets[3];
        return ipv4Text(number, room);
    }
    Ipv6Octets address = {};
    std::copy_n(octets.begin(), std::min(octets.size(), address.size()), address.begin());
    return ipv6Text(address, room);
}

// Numbers of addresses; their texts are made once a batch.
class AddressBuilder final : public ColumnBuilder {
    void set(std::size_t row, const Value &value) override {
        markPresent(row);
        const auto [found, isNew] = numbers_.try_emplace(Address(value.octets), numbers_.size());
        if (isNew) {
            TextRoom room;
            texts_.add(found->second, octetsOf(addressText(value.octets, room)));
        }
        indices_.setNumber(row, static_cast<std::int32_t>(found->second));
    }
    void finishValues(std::size_t rows, ArrayParts &parts) override {
        parts.buffers.push_back(indices_.take(rows * sizeof(std::int32_t)));
        ArrayParts dictionary;
        dictionary.length = static_cast<std::int64_t>(numbers_.size());
        texts_.finish(numbers_.size(), dictionary);
        parts.dictionary = makeArray(std::move(dictionary));
        numbers_.clear();
    }

    std::unordered_map<Address, std::size_t, AddressHash> numbers_;
    OctetRun texts_;
    GrowingBuffer indices_;
};

std::string formatOf(ColumnType type, bool binaryAddresses) {
    switch (type) {
    case ColumnType::boolean: return "b";
    case ColumnType::u8: return "C";
    case ColumnType::u16: return "S";
    case ColumnType::u32: return "I";
    case ColumnType::u64: return "L";
    case ColumnType::time: return "tsn:UTC";
    case ColumnType::address: return binaryAddresses ? "z" : "i";
    case ColumnType::text: return "u";
    case ColumnType::octets: break;
    }
    return "z";
}

} // namespace

OwnedArray ColumnBuilder::finish(std::size_t rows) {
    ArrayParts parts;
    parts.length = static_cast<std::int64_t>(rows);
    parts.nulls = static_cast<std::int64_t>(rows - std::exchange(values_, 0));
    parts.validity = present_.take(parts.nulls == 0 ? 0 : bitmapOctets(rows));
    finishValues(rows, parts);
    return makeArray(std::move(parts));
}

std::unique_ptr<ColumnBuilder> makeBuilder(ColumnType type, bool binaryAddresses) {
    switch (type) {
    case ColumnType::boolean: return std::make_unique<BooleanBuilder>();
    case ColumnType::u8: return std::make_unique<NumberBuilder<std::uint8_t>>();
    case ColumnType::u16: return std::make_unique<NumberBuilder<std::uint16_t>>();
    case ColumnType::u32: return std::make_unique<NumberBuilder<std::uint32_t>>();
    case ColumnType::u64:
    case ColumnType::time: return std::make_unique<NumberBuilder<std::uint64_t>>();
    case ColumnType::text: return std::make_unique<TextBuilder>();
    case ColumnType::address:
        if (!binaryAddresses) {
            return std::make_unique<AddressBuilder>();
        }
        break;
    case ColumnType::octets: break;
    }
    return std::make_unique<OctetsBuilder>();
}

OwnedSchema makeColumnSchema(const Column &column, bool binaryAddresses) {
    SchemaParts parts = {
        .format = formatOf(column.type, binaryAddresses), .name = plainName(column), .isNullable = !column.isRequired};
    if (column.type == ColumnType::address && !binaryAddresses) {
        parts.dictionary = makeSchema({.format = "u"});
    }
    return makeSchema(std::move(parts));
}

} // namespace netfloor
