// SPDX-License-Identifier: MIT
// Head and tail of a pass entry.
#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <optional>
#include <type_traits>

#include "frame/for_each.h"
#include "frame/reader.h"
#include "netfloor/host.h"

namespace netfloor::plugin {

// Makes room for one layer frame more and opens it. The first layer of a packet has the frame 0; a plug-in that
// starts anywhere else takes the next one.
[[nodiscard]] inline bool openLayerFrame(DecodeState &state) {
    const std::uint32_t wanted = state.layerIndex + 1;
    while (wanted >= state.layerCapacity) {
        const std::uint32_t capacity = state.layerCapacity * 2;
        void *const grown =
            capacity == 0 ? nullptr : hs_Realloc(state.layerFrames, capacity * sizeof *state.layerFrames);
        if (grown == nullptr) {
            state.flags |= NETFLOOR_FLAG_NO_LAYER_FRAMES;
            return false;
        }
        state.layerFrames = static_cast<LayerFrame *>(grown);
        state.layerCapacity = capacity;
    }
    if (state.cursor != 1) {
        ++state.layerIndex;
    }
    state.layerHandedOff = 0;
    state.layerFrames[state.layerIndex] = {
        .firstBit = state.cursor, .cleared1 = {}, .nextLayerKey = 0, .nextLayerProtocol = 0, .cleared2 = 0};
    return true;
}

// Clears the variables of a pass, piece by piece: for all at once the compiler takes a string instruction, which
// starts slowly.
template <class Variables>
NETFLOOR_INLINE inline void clear(Variables &variables) {
    static_assert(std::is_trivially_copyable_v<Variables>);
    constexpr std::size_t piece = 32;
    auto *const octets = reinterpret_cast<unsigned char *>(&variables);
    forEach<(sizeof variables + piece - 1) / piece>([&]<std::size_t i>() NETFLOOR_INLINE {
        std::memset(octets + i * piece, 0, std::min(piece, sizeof variables - i * piece));
    });
}

// Runs one pass over one layer. Nothing when the pass is refused before it starts.
template <class Pass, class Grammar>
NETFLOOR_INLINE inline std::optional<Outcome> runPass(typename Pass::Context &context) {
    DecodeState &state = *context.decodeState;
    clear(Pass::variables);
    if (!Pass::enter(context)) {
        return std::nullopt;
    }
    if (!openLayerFrame(state)) {
        return Outcome::cutOff;
    }
    Reader<Pass> reader(context);
    Grammar::template packet<Pass>(reader);
    if (!reader.ended()) {
        reader.giveState();
        Pass::leave(context);
        context.bitsLeft = reader.left;
    }
    return reader.outcome;
}

} // namespace netfloor::plugin
