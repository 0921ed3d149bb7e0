// SPDX-License-Identifier: MIT
// Where the fields of plain packets are. The places are those of the plug-in: it reads a few sample packets, and what
// it reports of them is what is known here.
#pragma once

#include <array>
#include <cstdint>
#include <vector>

#include "netfloor-host/layer_fields.h"
#include "netfloor-host/plugin_host.h"
#include "octets.h"
#include "plain_shape.h"

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

// The fields of a part.
struct PlainHeader {
    std::uint32_t octets = 0;
    std::uint32_t present = 0;  // a bit for each field, by place
    std::uint32_t endOctet = 0; // after its last field
    std::vector<PlainField> fields;
};

class PlainPackets {
public:
    PlainPackets(Host &host, const LayerFieldMap &map);

    // Whether the plug-in reads the samples as expected.
    [[nodiscard]] bool isUsable() const { return isUsable_; }
    [[nodiscard]] const PlainHeader &header(PlainPart part) const { return headers_[static_cast<std::size_t>(part)]; }

private:
    bool isUsable_ = true;
    std::array<PlainHeader, plainParts> headers_;
};

} // namespace netfloor
