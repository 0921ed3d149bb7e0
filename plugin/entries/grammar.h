// SPDX-License-Identifier: MIT
// What the passes need to know of the grammar and of its fields.
#pragma once

#include <cstdint>

#include "packet/packet.h"
#include "tables/catalogue.h"
#include "tables/key_fields.h"

namespace netfloor::plugin {

struct Grammar {
    using Variables = plugin::Variables;
    using Fields = CatalogueFields;

    static constexpr std::uint32_t noKeyRow = plugin::noKeyRow;
    static constexpr auto &keyRows = plugin::keyRows;

    template <const Field &field>
    static constexpr std::uint32_t displayId = displayIdOf(field);
    template <const Field &field>
    static constexpr std::uint32_t keyRow = keyRowOf(field);

    // The form is chosen by the octet of the IPv4 protocol.
    static_assert(protocolBit == bitsFromTo<CatalogueFields>(version, ipv4::timeToLive) + 1);
    static_assert(leastHeaderBits == bitsFromTo<CatalogueFields>(version, ipv4::destinationAddress));
    static constexpr auto &startForms = plugin::startForms;

    [[nodiscard]] NETFLOOR_INLINE static Form likelyForm(const DecodeState &state) { return plugin::likelyForm(state); }

    template <Form form, class Pass>
    NETFLOOR_INLINE static void packet(Reader<Pass> &reader) {
        plugin::packet<form>(reader);
    }
};

} // namespace netfloor::plugin
