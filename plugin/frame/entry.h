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
[[nodiscard]] NETFLOOR_INLINE inline bool openLayerFrame(DecodeState &state) {
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

// Runs one pass over one layer, in one form of the grammar.
template <class Pass, class Grammar, auto form>
[[gnu::noinline]] typename Pass::Result runForm(typename Pass::Context &context) {
    DecodeState &state = *context.decodeState;
    clear(Pass::variables);
    if (!Pass::enter(context)) {
        return Pass::resultOf(std::nullopt);
    }
    if (!openLayerFrame(state)) {
        return Pass::resultOf(Outcome::cutOff);
    }
    Reader<Pass> reader(context);
    Grammar::template packet<form>(reader);
    if (!reader.ended()) {
        reader.giveState();
        Pass::leave(context);
        context.bitsLeft = reader.left;
    }
    return Pass::resultOf(reader.outcome);
}

// Runs the chosen form of the grammar, one of those from number `first` on. Each is a function of its own: in one that
// had them all, compilers would find fewer values that are constant.
template <class Pass, class Grammar, std::size_t first = 0>
NETFLOOR_INLINE inline typename Pass::Result runLikelyForm(typename Pass::Context &context, auto chosen) {
    constexpr auto form = Grammar::startForms[first];
    if constexpr (first + 1 < Grammar::startForms.size()) {
        if (chosen != form) {
            return runLikelyForm<Pass, Grammar, first + 1>(context, chosen);
        }
    }
    return runForm<Pass, Grammar, form>(context);
}

// Runs one pass over one layer, and gives its result.
template <class Pass, class Grammar>
NETFLOOR_INLINE inline typename Pass::Result runPass(typename Pass::Context &context) {
    if constexpr (!Pass::Writer::hasCheckedRuns) {
        return runForm<Pass, Grammar, Grammar::startForms.front()>(context);
    } else {
        return runLikelyForm<Pass, Grammar>(context, Grammar::likelyForm(*context.decodeState));
    }
}

} // namespace netfloor::plugin
