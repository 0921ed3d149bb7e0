// SPDX-License-Identifier: MIT
#include "plain_packets.h"

#include <algorithm>
#include <utility>

#include "ip_numbers.h"
#include "octets.h"
#include "ports.h"

namespace netfloor {
namespace {

using Octets = std::span<const std::uint8_t>;

constexpr std::uint32_t wordOctets = 4;
constexpr std::uint32_t wordBits = 32;
constexpr std::uint32_t sackBlockOctets = 8;
constexpr std::uint32_t echoOctets = 8;

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
            const std::int32_t wordOctet = static_cast<std::int32_t>(std::min(octet + wordOctets, header.octets)) -
                                           static_cast<std::int32_t>(wordOctets);
            const std::uint32_t wordEnd = (first + wordOctets) * bitsPerOctet + wordOctet * bitsPerOctet;
            if (seen.bits != seen.lastBit - seen.firstBit + 1 || seen.bits > wordBits || seen.lastBit >= wordEnd) {
                isUsable_ = false;
                return;
            }
            field.wordOctet = static_cast<std::int8_t>(wordOctet);
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
    Sample tcp(host, map, tcpSample);
    ipv4_ = tcp.header(0, ipv4Octets);
    tcp_ = tcp.header(ipv4Octets, tcpOctets);
    maximumSegment_ = tcp.header(optionsOctet, 4);
    sackPermitted_ = tcp.header(optionsOctet + 4, 2);
    windowScale_ = tcp.header(optionsOctet + 6, 3);
    sackBlock_ = tcp.header(optionsOctet + 12, sackBlockOctets);
    timestamps_ = tcp.header(optionsOctet + 20, 10);
    Sample udp(host, map, udpSample);
    udp_ = udp.header(ipv4Octets, udpOctets);
    Sample echo(host, map, echoSample);
    icmpEcho_ = echo.header(ipv4Octets, echoOctets);
    Sample ipv6(host, map, ipv6Sample);
    ipv6_ = ipv6.header(0, ipv6Octets);
    isUsable_ = tcp.isUsable() && udp.isUsable() && echo.isUsable() && ipv6.isUsable();
}

bool PlainPackets::find(Octets octets, std::size_t wireOctets, PlainPacket &found) const {
    if (!isUsable_ || octets.size() < ipv4Octets + udpOctets) {
        return false;
    }
    std::uint8_t protocol = 0;
    bool isLaterFragment = false;
    if (octets[0] == 0x45) {
        found.ip = &ipv4_;
        found.endOctet = be16(octets, 2);
        protocol = octets[9];
        isLaterFragment = (be16(octets, 6) & 0x1fffU) != 0;
    } else if (octets[0] >> 4U == 6 && octets.size() >= ipv6Octets + udpOctets) {
        found.ip = &ipv6_;
        found.endOctet = ipv6Octets + be16(octets, 4);
        protocol = octets[6];
    } else {
        return false;
    }
    found.optionCount = 0;
    if (found.endOctet < found.ip->octets || found.endOctet > std::max(octets.size(), wireOctets)) {
        return false;
    }
    if (isLaterFragment) {
        found.transport = nullptr;
        return true;
    }
    // A pass looks up to four octets ahead; what it sees there must have been captured.
    return findTransport(protocol, octets, found) &&
           (found.endOctet <= octets.size() || found.payloadOctet + wordOctets <= octets.size());
}

bool PlainPackets::findTransport(std::uint8_t protocol, Octets octets, PlainPacket &found) const {
    const std::uint32_t first = found.ip->octets;
    found.isHandedOff = true;
    switch (protocol) {
    case protocolTcp: return findTcp(octets, found);
    case protocolUdp:
        found.transport = &udp_;
        found.transportKind = LayerKind::udp;
        found.payloadOctet = first + udpOctets;
        return found.payloadOctet <= found.endOctet && !isGtpPort(be16(octets, first)) &&
               !isGtpPort(be16(octets, first + 2));
    case protocolIcmp: {
        constexpr std::uint32_t echoReply = 0; // type and code
        constexpr std::uint32_t echo = 0x0800;
        const std::uint32_t message = be16(octets, first);
        found.transport = &icmpEcho_;
        found.transportKind = LayerKind::icmp;
        found.payloadOctet = first + echoOctets;
        found.isHandedOff = false;
        return found.ip == &ipv4_ && (message == echo || message == echoReply) && found.payloadOctet <= found.endOctet;
    }
    default: return false;
    }
}

bool PlainPackets::findTcp(Octets octets, PlainPacket &found) const {
    constexpr std::uint32_t dataOffset = 12;
    const std::uint32_t first = found.ip->octets;
    if (first + tcpOctets > std::min<std::size_t>(found.endOctet, octets.size())) {
        return false;
    }
    const std::uint32_t header = (octets[first + dataOffset] >> 4U) * wordOctets;
    found.transport = &tcp_;
    found.transportKind = LayerKind::tcp;
    found.payloadOctet = first + header;
    if (header < tcpOctets || found.payloadOctet > std::min<std::size_t>(found.endOctet, octets.size())) {
        return false;
    }
    const std::uint32_t options = first + tcpOctets;
    return findOptions(octets.subspan(options, found.payloadOctet - options), options, found);
}

// Options of a length that is not theirs, and those of a length that varies, are left to the pass.
bool PlainPackets::findOptions(Octets area, std::uint32_t octet, PlainPacket &found) const {
    constexpr std::uint8_t lastOfOneOctet = 1; // end of list, which ends nothing for the plug-in, and no operation
    constexpr std::uint8_t md5Signature = 19;
    std::size_t at = 0;
    while (at < area.size()) {
        if (area[at] <= lastOfOneOctet) {
            ++at;
            continue;
        }
        const PlainHeader *const header = option(area[at]);
        if (header == nullptr) {
            return area[at] != md5Signature; // for the plug-in all others make the rest padding
        }
        const bool isSack = header == &sackBlock_;
        const std::uint32_t headOctets = isSack ? 2 : 0;
        const std::uint32_t length = at + 1 < area.size() ? area[at + 1] : 0;
        if (length < header->octets || at + length > area.size() || (length - headOctets) % header->octets != 0 ||
            (!isSack && length != header->octets)) {
            return false;
        }
        const auto first = octet + static_cast<std::uint32_t>(at);
        for (std::uint32_t part = headOctets; part < length; part += header->octets) {
            found.options[found.optionCount++] = {header, first + part};
        }
        at += length;
    }
    return true;
}

const PlainHeader *PlainPackets::option(std::uint8_t kind) const {
    switch (kind) {
    case 2: return &maximumSegment_;
    case 3: return &windowScale_;
    case 4: return &sackPermitted_;
    case 5: return &sackBlock_;
    case 8: return &timestamps_;
    default: return nullptr;
    }
}

} // namespace netfloor
