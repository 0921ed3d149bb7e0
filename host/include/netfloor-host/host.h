// SPDX-License-Identifier: MIT
// The host: runs the passes of a plug-in over packets and gives back what they reported.
//
//     netfloor::Host host(netfloor::PluginLibrary::open("build/plugin/libnetfloor.so"));
//     const netfloor::Report report = host.run(netfloor::Pass::md, packet);
//     for (const netfloor::FieldReport& field : report.fields) {
//         std::cout << report.path(field) << ": " << field.text << '\n';
//     }
#pragma once

#include <cstdint>
#include <span>

#include "netfloor-host/field_tables.h"
#include "netfloor-host/owners.h"
#include "netfloor-host/packet_state.h"
#include "netfloor-host/plugin_library.h"
#include "netfloor-host/reports.h"
#include "netfloor-host/text.h"

namespace netfloor {

struct RunOptions {
    StateOptions state;
    std::uint8_t layerNumber = 1;        // of the first layer
    std::uint32_t decoderId = 1;         // the host's word for the plug-in
    std::uint32_t layerInfoCapacity = 7; // highest index of the list of layers at the start
    std::uint16_t byteAreaSize = 64;     // XTR: room for one address; it needs 17
    bool followStop = true;              // XTR: go on with the owner of the next layer
    std::uint32_t mostNesting = 64;      // how often owners may lead back into the plug-in, one in another
};

class Host {
public:
    explicit Host(PluginLibrary library);

    [[nodiscard]] const PluginLibrary &library() const { return library_; }
    [[nodiscard]] PluginLibrary &library() { return library_; }
    [[nodiscard]] OwnerRegistry &owners() { return owners_; }

    // Runs one pass over one packet, which starts with an IP header at the cursor. Throws what an owner
    // throws, and std::invalid_argument for options that contradict the packet.
    [[nodiscard]] Report run(Pass pass, std::span<const std::uint8_t> packet, const RunOptions &options = {});

private:
    PluginLibrary library_;
    OwnerRegistry owners_;
};

} // namespace netfloor
