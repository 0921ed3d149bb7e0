// SPDX-License-Identifier: MIT
#include "key_record.h"

#include <algorithm>
#include <cstring>

namespace netfloor {
namespace {

constexpr std::uint32_t bitsPerOctet = 8;
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

// The octets of an address. None where it did not fit, or where later addresses have come over it: what was
// stored whole ends in front of the offset at which the pass left off.
std::vector<std::uint8_t> loadOctets(const std::uint8_t *record, const std::uint8_t *place,
                                     std::uint16_t byteAreaOffset) {
    const std::uint32_t bits = loadNumber<std::uint16_t>(place);
    const std::uint32_t from = loadNumber<std::uint16_t>(place + sizeof(std::uint16_t));
    const std::uint32_t octets = (bits + bitsPerOctet - 1) / bitsPerOctet;
    if (from + octets > byteAreaOffset) {
        return {};
    }
    return {record + from, record + from + octets};
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

// The room for addresses is left as it comes: it is large, and of it only what was stored is read.
KeyRecord::KeyRecord() : octets_(std::make_unique_for_overwrite<std::uint8_t[]>(recordOctets)) {
    std::fill(octets_.get() + presenceStart, octets_.get() + recordOctets, std::uint8_t{0});
}

std::vector<KeyValue> KeyRecord::values(std::span<const KeyFieldRow> table, std::span<const KeyType> types,
                                        std::uint16_t byteAreaOffset) const {
    std::vector<KeyValue> values;
    for (std::size_t number = 0; number < table.size(); ++number) {
        const KeyFieldRow &row = table[number];
        if ((octets_[row.presenceOffset] & row.presenceMask) == 0) {
            continue;
        }
        KeyValue &value = values.emplace_back();
        const std::uint8_t *const place = octets_.get() + row.valueOffset;
        value.name = row.fieldName;
        value.row = static_cast<std::uint32_t>(number);
        value.type = types[number];
        value.number = loadAs(value.type, place);
        if (value.type == KeyType::ipv6Address) {
            value.octets = loadOctets(octets_.get(), place, byteAreaOffset);
        }
    }
    return values;
}

} // namespace netfloor
