// SPDX-License-Identifier: MIT
// The start of the grammar, and what the passes need to know of all of it.
#pragma once

#include <cstdint>

#include "frame/block.h"
#include "frame/step.h"
#include "frame/variables.h"
#include "icmp/message_type.h"
#include "ipv4/header.h"
#include "ipv6/extension_headers.h"
#include "sctp/variables.h"
#include "tables/catalogue.h"
#include "tables/key_fields.h"
#include "version.h"

namespace netfloor {

struct Grammar {
    // All variables of a pass, cleared at its entry.
    struct Variables : SharedVariables,
                       ipv4::FragmentVariables,
                       ipv4::OptionVariables,
                       ipv6::HeaderVariables,
                       ipv6::OptionVariables,
                       ipv6::ExtensionHeaderVariables,
                       icmp::MessageVariables,
                       tcp::TcpVariables,
                       sctp::Variables {};

    static constexpr std::uint32_t noKeyRow = netfloor::noKeyRow;
    static constexpr auto &keyRows = netfloor::keyRows;

    template <const Field &field>
    static constexpr std::uint32_t displayId = displayIdOf(field);
    template <const Field &field>
    static constexpr std::uint32_t keyRow = keyRowOf(field);

    // One packet, from its version on. With a version other than 4 and 6 nothing further is read.
    template <class Pass>
    NETFLOOR_INLINE static void packet(Reader<Pass> &at) {
        auto &variables = at.variables();
        const Block<Pass> ip{at, "Ip"};
        const Block<Pass> header{at, "Ip Header"};
        read<version>(at, &variables.ipVersion);
        if (variables.ipVersion == 4) {
            ipv4::datagram(at);
        } else if (variables.ipVersion == 6) {
            apart<ipv6::datagram<Pass>>(at);
        }
    }
};

} // namespace netfloor
