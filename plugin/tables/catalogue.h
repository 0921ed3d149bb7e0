// SPDX-License-Identifier: MIT
// The catalogue of all fields and of all key fields: the joined rows of the protocols. The fields have the order of the
// published field table: depth first, each protocol where the grammar first reaches it. A new protocol comes last, so
// that the rows of the others keep their numbers, which hosts may have stored.
#pragma once

#include <algorithm>
#include <array>
#include <cstdint>

#include "frame/field_list.h"
#include "icmp/icmp.h"
#include "icmp/icmpv6.h"
#include "ip/unknown_data.h"
#include "ip/version.h"
#include "ipv4/header.h"
#include "ipv4/options.h"
#include "ipv6/extension_headers.h"
#include "ipv6/header.h"
#include "sctp/sctp.h"
#include "tables/text_numbers.h"
#include "transport/tcp.h"
#include "transport/udp.h"
#include "tunnels/gre.h"
#include "tunnels/ip_in_ip.h"
#include "tunnels/minimal_encapsulation.h"

namespace netfloor::plugin {

// clang-format off
using CatalogueRows = JoinedRows<
    VersionRows,
    ipv4::HeaderRows,
    ipv4::OptionRows,
    UnknownDataRows,
    icmp::MessageRows,
    tcp::SegmentRows,
    udp::DatagramRows,
    ipinip::HeaderRows,
    minimal::HeaderRows,
    gre::PacketRows,
    icmpv6::MessageRows,
    sctp::PacketRows,
    ipv6::HeaderRows,
    ipv6::ExtensionHeaderRows>;
// clang-format on

using CatalogueFields = CatalogueRows::Fields;
using CatalogueKeys = CatalogueRows::Keys;

inline constexpr auto &catalogue = CatalogueFields::pointers;

// These fields have another number than the others in the highest octet of their flags. Hosts keep the number; its
// meaning is not known.
using CatalogueOfTopOctet6 = Joined<tcp::FieldsOfTopOctet6, udp::FieldsOfTopOctet6, sctp::FieldsOfTopOctet6>;

// For each field id the id under which the TO pass reports the field: that of the first field of the same name.
inline constexpr auto displayIds = [] {
    constexpr std::uint32_t highest = std::ranges::max(catalogue, {}, &Field::id)->id;
    std::array<std::uint32_t, highest + 1> ids{};
    std::array<std::uint32_t, catalogue.size()> ofName{};
    TextNumbers<catalogue.size()> names;
    for (const Field *const field : catalogue) {
        std::uint32_t &first = ofName[names.numberOf(field->tableName())];
        first = first == 0 ? field->id : first;
        ids[field->id] = first;
    }
    return ids;
}();

[[nodiscard]] constexpr std::uint32_t displayIdOf(const Field &field) {
    return displayIds[field.id];
}

} // namespace netfloor::plugin
