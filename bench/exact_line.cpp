// SPDX-License-Identifier: MIT
#include "exact_line.h"

#include <cstring>
#include <initializer_list>

#include <netfloor/host.h>

#include "hand_written.h"

namespace netfloor::bench {
namespace {

constexpr std::uint32_t mostElements = 32; // of a field of fixed size
constexpr std::uint32_t blocks = 8;
constexpr std::uint32_t headerBits = 28 * 8;
constexpr std::uint32_t bitsBeforeLimit = 32;
constexpr std::uint32_t handOffAbove = 32;
constexpr std::uint8_t udpNumber = 17;

std::uint32_t load16(const std::uint8_t *octets) {
    return static_cast<std::uint32_t>(octets[0] << 8 | octets[1]);
}

const std::uint8_t *octetsAtCursor(const DecodeState &state) {
    return state.data + (state.cursor - 1) / 8;
}

[[gnu::always_inline]] inline bool hasRoom(const DecodeState &state) {
    return (state.cursor - 1) % 8 == 0 && state.bitsLeft > headerBits + handOffAbove && state.flags == 0 &&
           state.layerIndex + 1 < state.layerCapacity && state.fieldRecord.rangeCapacity > mostElements &&
           state.blockStarts.capacity >
               static_cast<std::size_t>(state.blockStarts.top - state.blockStarts.base) + blocks &&
           state.limits.capacity > static_cast<std::size_t>(state.limits.top - state.limits.base) + 1;
}

// A first fragment, or a packet that may not be one, whose header has no options, and whose payload goes to an owner.
[[gnu::always_inline]] inline bool isPlainUdp(const DecodeState &state) {
    const std::uint8_t *const octets = octetsAtCursor(state);
    const std::uint32_t limit = load16(octets + 2) * 8 - bitsBeforeLimit;
    const bool isWhole = (octets[6] & 0x40) != 0 || (load16(octets + 6) & 0x1fff) == 0;
    return octets[0] == 0x45 && octets[9] == udpNumber && isWhole && limit <= state.bitsLeft - bitsBeforeLimit &&
           limit > headerBits - bitsBeforeLimit + handOffAbove;
}

struct Owner {
    std::uint32_t key;
    bool isPort;
};

[[gnu::always_inline]] inline Owner ownerOf(std::uint32_t source, std::uint32_t destination) {
    if (source == 1812 || source == 1813) {
        destination = source;
    }
    if (source < 1024 || source == 3452) {
        return {source, true};
    }
    if (destination < 9000) {
        return {destination, true};
    }
    return source < 9000 ? Owner{source, true} : Owner{udpNumber, false};
}

[[gnu::always_inline]] inline void push(BitStack &stack, std::uint32_t bit) {
    *++stack.top = bit;
    stack.count = static_cast<std::uint32_t>(stack.top - stack.base);
}

// The field that was read last.
[[gnu::always_inline]] inline void writeChecksum(FieldRecord &record, const std::uint8_t *octets,
                                                 std::uint32_t cursor) {
    std::memcpy(record.fieldName, "Checksum", sizeof "Checksum");
    record.fieldId = 490;
    record.value = load16(octets);
    record.valueText[0] = '\0';
    record.rangeCount = 2;
    record.outputRangeCount = 2;
    record.rawFlag = 0;
    for (std::uint32_t i = 0; i < 2; ++i) {
        BitRange &range = record.ranges[i];
        range.value = octets[i];
        range.firstBit = cursor + i * 8;
        range.lastBit = cursor + i * 8 + 7;
        range.flagWord = 0;
    }
}

// Everything up to the hand-off.
[[gnu::always_inline]] inline void handOff(DecodeState &state) {
    if (state.cursor != 1) {
        ++state.layerIndex;
    }
    const std::uint8_t *const octets = octetsAtCursor(state);
    const std::uint32_t start = state.cursor;
    const std::uint32_t totalLength = load16(octets + 2);
    const Owner owner = ownerOf(load16(octets + 20), load16(octets + 22));
    for (const std::uint32_t bit : {0U, 0U, 0U, bitsBeforeLimit, 160U, 192U, headerBits, headerBits}) {
        push(state.blockStarts, start + bit);
    }
    push(state.limits, start + totalLength * 8 - 1);
    state.condition = 1;
    state.advance = 16;
    std::memcpy(state.blockName, "NEXT LAYER", sizeof "NEXT LAYER");
    state.scratch[NETFLOOR_NEXT_LAYER_OCTETS] = totalLength - headerBits / 8;
    state.scratch[NETFLOOR_PRECEDING_OCTETS] = headerBits / 8;
    if (owner.isPort) {
        state.scratch[NETFLOOR_NEXT_LAYER_PORT] = owner.key;
    }
    writeChecksum(state.fieldRecord, octets + 26, start + 208);
    LayerFrame &frame = state.layerFrames[state.layerIndex];
    frame = {.firstBit = start, .cleared1 = {}, .nextLayerKey = owner.key, .nextLayerProtocol = 0, .cleared2 = 0};
    if (owner.isPort && owner.key != 3452) {
        frame.nextLayerProtocol = udpNumber;
    }
    state.layerHandedOff = 1;
    state.cursor = start + headerBits;
    state.bitsLeft = totalLength * 8 - headerBits;
}

} // namespace

bool decodeByHand(PreDecodeContext &context) {
    DecodeState &state = *context.decodeState;
    if (!hasRoom(state) || !isPlainUdp(state)) {
        return false;
    }
    handOff(state);
    const std::uint32_t decoderId = context.decoderId;
    context.bitsLeft = state.bitsLeft;
    ++context.layerNumber;
    if (hd_PreDecode(&context, NETFLOOR_MODE_MV) < 0) {
        return true;
    }
    context.decoderId = decoderId;
    if (state.bitsLeft != 0) {
        state.cursor += state.bitsLeft;
        state.flags |= NETFLOOR_FLAG_BITS_LEFT_OVER;
    }
    if (state.flags != 0) {
        context.verdict = -52;
    }
    state.blockStarts.top -= blocks;
    --state.limits.top;
    state.bitsLeft = *state.limits.top - state.cursor + 1;
    context.bitsLeft = state.bitsLeft;
    return true;
}

bool extractByHand(XtrContext &context) {
    DecodeState &state = *context.decodeState;
    if (!hasRoom(state) || !isPlainUdp(state)) {
        return false;
    }
    storeKeysByHand(context.keyRecord, octetsAtCursor(state));
    handOff(state);
    context.bitsLeft = state.bitsLeft;
    return true;
}

} // namespace netfloor::bench
