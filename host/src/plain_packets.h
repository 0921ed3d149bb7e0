// SPDX-License-Identifier: MIT
// Plain packets: one IP header without options or extension headers, then UDP, TCP with the usual options, an echo of
// ICMP, or a later fragment. Most traffic is that. The fields of such a packet have fixed places, so that they can be
// read without a pass.
//
// The places are those of the plug-in: it reads a few sample packets, and what it reports of them is what is known
// here.
#pragma once

#include <array>
#include <cstdint>
#include <optional>
#include <span>
#include <vector>

#include "netfloor-host/layer_fields.h"
#include "netfloor-host/plugin_host.h"
#include "octets.h"

namespace netfloor {

// A field of up to 32 bits inside four octets; an address of IPv6 has its place alone.
struct PlainField {
    std::uint16_t id = 0;   // the plug-in's
    std::uint8_t place = 0; // among the names of its layer
    LayerValue value = LayerValue::number;
    std::uint8_t octet = 0;    // its first one, counted from the start of the header
    std::int8_t wordOctet = 0; // of the four octets, likewise; those of a short option begin before it
    std::uint8_t shift = 0;    // to the right, of these as one number
    std::uint32_t mask = 0;    // after the shift

    std::uint8_t unit = 1; // by which it is multiplied

    // `header` is where the header begins.
    [[nodiscard]] std::uint32_t read(const std::uint8_t *header) const {
        return (loadBe32(header + wordOctet) >> shift & mask) * unit;
    }
};

// A header, or an option of TCP.
struct PlainHeader {
    std::uint32_t octets = 0;
    std::uint32_t present = 0;  // a bit for each field, by place
    std::uint32_t endOctet = 0; // after its last field
    std::vector<PlainField> fields;
};

struct PlainPacket {
    static constexpr std::size_t mostOptions = 20;

    struct Option {
        const PlainHeader *header;
        std::uint32_t octet;
    };

    const PlainHeader *ip = nullptr;
    const PlainHeader *transport = nullptr; // none in a later fragment
    LayerKind transportKind = LayerKind::tcp;
    bool isHandedOff = false; // the payload, to an owner
    std::uint32_t payloadOctet = 0;
    std::uint32_t endOctet = 0; // of the payload, by the length in the IP header
    std::uint32_t optionCount = 0;
    std::array<Option, mostOptions> options; // those with fields
};

class PlainPackets {
public:
    PlainPackets(Host &host, const LayerFieldMap &map);

    // Finds out whether a packet is plain, and where its parts are. `wireOctets` is 0 or its length on the wire.
    [[nodiscard]] bool find(std::span<const std::uint8_t> octets, std::size_t wireOctets, PlainPacket &found) const;

private:
    [[nodiscard]] bool findTransport(std::uint8_t protocol, std::span<const std::uint8_t> octets,
                                     PlainPacket &found) const;
    [[nodiscard]] bool findTcp(std::span<const std::uint8_t> octets, PlainPacket &found) const;
    [[nodiscard]] bool findOptions(std::span<const std::uint8_t> area, std::uint32_t octet, PlainPacket &found) const;
    [[nodiscard]] const PlainHeader *option(std::uint8_t kind) const;

    bool isUsable_ = true; // the plug-in reads the samples as expected
    PlainHeader ipv4_;
    PlainHeader ipv6_;
    PlainHeader tcp_;
    PlainHeader udp_;
    PlainHeader icmpEcho_;
    PlainHeader maximumSegment_;
    PlainHeader windowScale_;
    PlainHeader sackPermitted_;
    PlainHeader sackBlock_; // the two edges
    PlainHeader timestamps_;
};

} // namespace netfloor
