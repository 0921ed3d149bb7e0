// SPDX-License-Identifier: MIT
// The hand-off: gives control to the owner of the next layer, and takes it back.
#pragma once

#include <cstdint>

#include "frame/block.h"
#include "frame/reader.h"
#include "netfloor/records.h"

namespace netfloor::plugin {

// Who gets the payload.
struct NextLayer {
    std::uint32_t key;
    std::uint32_t port;
    bool writesPort;
    bool writesProtocol;
};

// Hands the rest of the packet, which `protocol` carries, to the owner of the next layer. The XTR pass ends here; the
// others come back with the cursor where the next layer left it.
template <class Pass>
NETFLOOR_INLINE inline void handOffTo(Reader<Pass> &reader, const NextLayer &next, std::uint32_t protocol) {
    const Block<Pass> transfer{reader, "NEXT LAYER"};
    if (reader.ended()) {
        return;
    }
    LayerFrame &frame = reader.state->layerFrames[reader.state->layerIndex];
    frame.nextLayerKey = next.key;
    if (next.writesProtocol) {
        frame.nextLayerProtocol = protocol;
    }
    reader.state->layerHandedOff = 1;
    reader.giveState();
    reader.context->bitsLeft = reader.left;
    if (const Outcome outcome = Pass::transfer(*reader.context); outcome != Outcome::running) {
        reader.end(outcome);
        return;
    }
    reader.takeState();
    reader.variables().copyRestored = false; // the next layer may have changed it
}

} // namespace netfloor::plugin
