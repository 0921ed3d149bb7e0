// SPDX-License-Identifier: MIT
#include "key_record.h"

#include <algorithm>
#include <bit>
#include <cstring>

namespace netfloor {
namespace {

constexpr std::uint32_t valueOctets = 4;
constexpr std::uint32_t addressRoom = 2 * 65536;
constexpr std::uint32_t presenceStart = addressRoom;
constexpr std::uint32_t presenceOctets = KeyRecord::mostRows / bitsPerOctet;
constexpr std::uint32_t valueStart = presenceStart + presenceOctets;
constexpr std::uint32_t recordOctets = valueStart + KeyRecord::mostRows * valueOctets;

template <typename Number>
Number loadNumber(const std::uint8_t *place) {
    Number number = 0;
    std::memcpy(&number, place, sizeof number);
    return number;
}

std::uint32_t loadAs(KeyType type, const std::uint8_t *place) {
    switch (type) {
    case KeyType::number8: return *place;
    case KeyType::number16: return loadNumber<std::uint16_t>(place);
    default: return loadNumber<std::uint32_t>(place);
    }
}

// The octets of an address. None where it did not fit, or where later addresses have overwritten it.
std::span<const std::uint8_t> loadOctets(const std::uint8_t *record, const std::uint8_t *place,
                                         std::uint16_t byteAreaOffset) {
    const std::uint32_t bits = loadNumber<std::uint16_t>(place);
    const std::uint32_t from = loadNumber<std::uint16_t>(place + sizeof(std::uint16_t));
    const std::uint32_t octets = (bits + bitsPerOctet - 1) / bitsPerOctet;
    if (from + octets > byteAreaOffset) {
        return {};
    }
    return {record + from, octets};
}

// The number of an address is where its octets are.
bool isSame(const KeyView &left, const KeyView &right) {
    return left.type == KeyType::ipv6Address ? std::ranges::equal(left.octets, right.octets)
                                             : left.number == right.number;
}

} // namespace

void KeyRecord::layOut(std::span<KeyFieldRow> table) {
    std::uint32_t number = 0;
    for (KeyFieldRow &row : table) {
        row.presenceOffset = presenceStart + number / bitsPerOctet;
        row.presenceMask = 1u << (number % bitsPerOctet);
        row.valueOffset = valueStart + number * valueOctets;
        ++number;
    }
}

KeyRecord::KeyRecord() : octets_(std::make_unique<std::uint8_t[]>(recordOctets)) {}

void KeyRecord::reset() {
    std::memset(octets_.get() + presenceStart, 0, presenceOctets);
}

bool KeyRecord::has(std::size_t row) const {
    return (octets_[presenceStart + row / bitsPerOctet] >> row % bitsPerOctet & 1U) != 0;
}

KeyView KeyRecord::view(std::size_t row, const KeyColumn &column) const {
    const std::uint8_t *const place = octets_.get() + valueStart + row * valueOctets;
    const bool isAddress = column.type == KeyType::ipv6Address;
    return {
        .name = column.name,
        .row = static_cast<std::uint32_t>(row),
        .type = column.type,
        .number = loadAs(column.type, place),
        .octets = isAddress ? loadOctets(octets_.get(), place, end_) : std::span<const std::uint8_t>(),
    };
}

void KeyRecord::report(std::span<const KeyColumn> columns, const KeyRecord *other, Sink &sink) const {
    const std::uint8_t *const record = octets_.get();
    for (std::size_t octet = 0; octet * bitsPerOctet < columns.size(); ++octet) {
        for (std::uint32_t present = record[presenceStart + octet]; present != 0; present &= present - 1) {
            const std::size_t row = octet * bitsPerOctet + static_cast<std::size_t>(std::countr_zero(present));
            const KeyView key = view(row, columns[row]);
            if (other == nullptr || (other->has(row) && isSame(key, other->view(row, columns[row])))) {
                sink.key(key);
            }
        }
    }
}

} // namespace netfloor
