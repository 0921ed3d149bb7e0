// SPDX-License-Identifier: MIT
#include "plain_packets.h"

#include <algorithm>
#include <utility>

#include "ip_numbers.h"

namespace netfloor {
namespace {

using Octets = std::span<const std::uint8_t>;

constexpr std::uint32_t wordOctets = 4;
constexpr std::uint32_t wordBits = 32;

// The samples. No field has the same value when its octets are read in another order. As DF is set, the fragment offset
// does not matter to the plug-in.
constexpr std::array<std::uint8_t, 72> tcpSample = {
    0x45, 0xa9, 0x00, 0x48, 0x12, 0x34, 0x61, 0x23, 0x39, 0x06, 0xab, 0xcd, // IPv4
    0x0a, 0x01, 0x02, 0x03, 0xc0, 0xa8, 0x05, 0x06,                         //
    0x30, 0x39, 0xd4, 0x31, 0x01, 0x23, 0x45, 0x67, 0x89, 0xab, 0xcd, 0xef, // TCP
    0xd0, 0x12, 0x7f, 0x1a, 0x9b, 0x2d, 0x00, 0x07,                         //
    0x02, 0x04, 0x05, 0xb4, 0x04, 0x02, 0x03, 0x03, 0x07, 0x01,             // maximum segment size ... no operation
    0x05, 0x0a, 0x91, 0x92, 0x93, 0x94, 0xa1, 0xa2, 0xa3, 0xa4,             // SACK
    0x08, 0x0a, 0x11, 0x22, 0x33, 0x44, 0x55, 0x66, 0x77, 0x88, 0x01, 0x01, // timestamps
};
constexpr std::uint32_t optionsOctet = ipv4Octets + tcpOctets;
constexpr std::array<std::uint8_t, 28> udpSample = {
    0x45, 0xa9, 0x00, 0x1c, 0x12, 0x34, 0x40, 0x00, 0x39, 0x11, 0xab, 0xcd, // IPv4
    0x0a, 0x01, 0x02, 0x03, 0xc0, 0xa8, 0x05, 0x06,                         //
    0x30, 0x39, 0xd4, 0x31, 0x00, 0x08, 0x9b, 0x2d,                         // UDP
};
constexpr std::array<std::uint8_t, 28> echoSample = {
    0x45, 0xa9, 0x00, 0x1c, 0x12, 0x34, 0x40, 0x00, 0x39, 0x01, 0xab, 0xcd, // IPv4
    0x0a, 0x01, 0x02, 0x03, 0xc0, 0xa8, 0x05, 0x06,                         //
    0x08, 0x00, 0x9b, 0x2d, 0x12, 0x34, 0x56, 0x78,                         // ICMP
};
constexpr std::array<std::uint8_t, 48> ipv6Sample = {
    0x6a, 0xb1, 0x23, 0x45, 0x00, 0x08, 0x11, 0x39,                                                 // IPv6
    0x20, 0x01, 0x0d, 0xb8, 0x00, 0x01, 0x00, 0x02, 0x00, 0x03, 0x00, 0x04, 0x00, 0x05, 0x00, 0x06, //
    0x20, 0x01, 0x0d, 0xb8, 0x00, 0x11, 0x00, 0x12, 0x00, 0x13, 0x00, 0x14, 0x00, 0x15, 0x00, 0x16, //
    0x30, 0x39, 0xd4, 0x31, 0x00, 0x08, 0x9b, 0x2d,                                                 // UDP
};

// A bit as it stands on the wire, from 0; the plug-in numbers those of an octet from its least significant one up.
std::uint32_t wireBit(std::uint32_t bit) {
    const std::uint32_t index = bit - 1;
    return index - index % bitsPerOctet + (bitsPerOctet - 1 - index % bitsPerOctet);
}

// What the plug-in reports of a sample.
class Sample final : public Sink {
public:
    Sample(Host &host, const LayerFieldMap &map, Octets packet) : map_(map), packet_(packet) {
        host.run(Pass::md, packet, *this);
    }

    // The fields of the octets from `first` on.
    [[nodiscard]] PlainHeader header(std::uint32_t first, std::uint32_t octets) {
        PlainHeader header;
        header.octets = octets;
        for (const Seen &field : fields_) {
            if (field.firstBit / bitsPerOctet >= first && field.lastBit / bitsPerOctet < first + octets) {
                add(header, field, first);
            }
        }
        isUsable_ &= header.present != 0;
        return header;
    }

    // Whether each value so far comes out as the plug-in has it.
    [[nodiscard]] bool isUsable() const { return isUsable_; }

private:
    struct Seen {
        std::uint32_t id;
        LayerFieldMap::Entry entry;
        std::uint32_t firstBit; // on the wire
        std::uint32_t lastBit;
        std::uint32_t bits;
        std::uint32_t number;
    };

    [[nodiscard]] bool wantsBlocks() const override { return false; }
    [[nodiscard]] bool wantsBlockNames() const override { return false; }

    void field(const FieldView &field) override {
        const LayerFieldMap::Entry &entry = map_.find(field.id);
        if (!entry.isKnown || field.ranges.empty()) {
            return;
        }
        Seen seen = {field.id, entry, ~std::uint32_t{0}, 0, 0, field.value};
        for (const BitRange &range : field.ranges) {
            for (std::uint32_t bit = range.firstBit; bit <= range.lastBit; ++bit) {
                seen.firstBit = std::min(seen.firstBit, wireBit(bit));
                seen.lastBit = std::max(seen.lastBit, wireBit(bit));
                ++seen.bits;
            }
        }
        fields_.push_back(seen);
    }

    void add(PlainHeader &header, const Seen &seen, std::uint32_t first) {
        const std::uint32_t octet = seen.firstBit / bitsPerOctet - first;
        const std::uint32_t endOctet = seen.lastBit / bitsPerOctet + 1 - first;
        PlainField field;
        field.id = static_cast<std::uint16_t>(seen.id);
        field.place = seen.entry.field.place;
        field.value = seen.entry.value;
        field.octet = static_cast<std::uint8_t>(octet);
        if (field.value != LayerValue::ipv6Address) {
            const std::uint32_t pastWord = std::min(octet + wordOctets, header.octets);
            const std::uint32_t wordEnd = (first + pastWord) * bitsPerOctet;
            if (seen.bits != seen.lastBit - seen.firstBit + 1 || seen.bits > wordBits || seen.lastBit >= wordEnd) {
                isUsable_ = false;
                return;
            }
            field.wordOctet =
                static_cast<std::int8_t>(static_cast<std::int32_t>(pastWord) - static_cast<std::int32_t>(wordOctets));
            field.shift = static_cast<std::uint8_t>(wordEnd - 1 - seen.lastBit);
            field.mask = ~std::uint32_t{0} >> (wordBits - seen.bits);
            const std::uint32_t number = field.read(packet_.data() + first);
            if (field.value != LayerValue::packetNumber && number != seen.number) { // in a unit of its own
                isUsable_ &= number != 0 && seen.number % number == 0;
                field.unit = static_cast<std::uint8_t>(number == 0 ? 0 : seen.number / number);
                isUsable_ &= field.read(packet_.data() + first) == seen.number;
            }
        }
        header.present |= 1U << field.place;
        header.endOctet = std::max(header.endOctet, endOctet);
        header.fields.push_back(field);
    }

    const LayerFieldMap &map_;
    Octets packet_;
    std::vector<Seen> fields_;
    bool isUsable_ = true;
};

} // namespace

PlainPackets::PlainPackets(Host &host, const LayerFieldMap &map) {
    const auto take = [this](Sample &sample, PlainPart part, std::uint32_t firstOctet) {
        headers_[static_cast<std::size_t>(part)] = sample.header(firstOctet, octetsOf(part));
        isUsable_ &= sample.isUsable();
    };
    Sample tcp(host, map, tcpSample);
    take(tcp, PlainPart::ipv4, 0);
    take(tcp, PlainPart::tcp, ipv4Octets);
    take(tcp, PlainPart::maximumSegment, optionsOctet);
    take(tcp, PlainPart::sackPermitted, optionsOctet + 4);
    take(tcp, PlainPart::windowScale, optionsOctet + 6);
    take(tcp, PlainPart::sackBlock, optionsOctet + 12);
    take(tcp, PlainPart::timestamps, optionsOctet + 20);
    Sample udp(host, map, udpSample);
    take(udp, PlainPart::udp, ipv4Octets);
    Sample echo(host, map, echoSample);
    take(echo, PlainPart::icmpEcho, ipv4Octets);
    Sample ipv6(host, map, ipv6Sample);
    take(ipv6, PlainPart::ipv6, 0);
}

} // namespace netfloor
