// SPDX-License-Identifier: MIT
// The storage of a host that runs packets through a plug-in, and its work for each packet: no more than the
// boundary requires.
#pragma once

#include <algorithm>
#include <array>
#include <cstdint>
#include <cstring>
#include <memory>
#include <span>
#include <vector>

#include <netfloor/plugin.h>

#include "null_host.h"

namespace netfloor::bench {

class PacketHost {
public:
    PacketHost() {
        state_.blockName = blockName_.data();
        state_.blockStarts = {stacks_[0].data(), stacks_[0].data(), 0, stackCapacity};
        state_.limits = {stacks_[1].data(), stacks_[1].data(), 0, stackCapacity};
        state_.fieldRecord.fieldName = fieldName_.data();
        state_.fieldRecord.valueText = valueText_.data();
        state_.fieldRecord.ranges = ranges_.data();
        state_.fieldRecord.rangeCapacity = rangeCapacity;
        state_.layerFrames = layerFrames_.data();
        state_.layerCapacity = layerCapacity;
        context_.fieldRecords = fieldRecord_.data();
        context_.layerInfo = layerInfo_.data();
        context_.layerInfoCapacity = layerCapacity - 1;
        context_.decodeState = &state_;
        keyContext_.keyRecord = keyRecord_.data();
        keyContext_.byteAreaSize = bench::byteAreaSize;
        keyContext_.decodeState = &state_;
    }
    PacketHost(const PacketHost &) = delete;
    PacketHost &operator=(const PacketHost &) = delete;

    // Before a pass with a PreDecodeContext.
    PreDecodeContext &prepare(std::span<std::uint8_t> packet) {
        reset(packet);
        context_.layerNumber = 1;
        context_.decoderId = 1;
        context_.verdict = 0;
        context_.fieldRecordCount = 0;
        context_.layerInfoCount = 0;
        return context_;
    }

    // Before the XTR pass.
    XtrContext &prepareKeys(std::span<std::uint8_t> packet) {
        reset(packet);
        std::memset(keyRecord_.data(), 0, presenceOctets);
        keyContext_.byteAreaOffset = bench::byteAreaOffset;
        return keyContext_;
    }

    std::uint8_t run(NetfloorPreDecode pass, std::span<std::uint8_t> packet) { return pass(&prepare(packet)); }

    std::int32_t run(NetfloorExtract pass, std::span<std::uint8_t> packet) { return pass(&prepareKeys(packet)); }

    [[nodiscard]] const PreDecodeContext &context() const { return context_; }

private:
    static constexpr std::uint32_t stackCapacity = 64;
    static constexpr std::uint32_t rangeCapacity = 200;
    static constexpr std::uint32_t layerCapacity = 8;

    // The working copy is the packet itself: no pass changes the octets of these packets.
    [[gnu::always_inline]] void reset(std::span<std::uint8_t> packet) {
        const auto bitCount = static_cast<std::uint32_t>(packet.size() * 8);
        state_.data = packet.data();
        state_.sourceData = packet.data();
        state_.totalBits = bitCount;
        state_.cursor = 1;
        state_.bitsLeft = bitCount;
        state_.flags = 0;
        state_.blockStarts.top = state_.blockStarts.base;
        *state_.blockStarts.base = 1;
        state_.limits.top = state_.limits.base;
        *state_.limits.base = bitCount;
        state_.condition = 0;
        state_.advance = 0;
        *state_.blockName = '\0';
        // In pieces: for one copy of this size compilers choose a string instruction, which starts slowly.
        for (std::size_t word = 0; word < std::size(state_.scratch); word += 8) {
            std::memset(state_.scratch + word, 0, 8 * sizeof *state_.scratch);
        }
        state_.layerHandedOff = 1;
        state_.layerIndex = 0;
    }

    DecodeState state_{};
    PreDecodeContext context_{};
    XtrContext keyContext_{};
    std::array<std::array<std::uint32_t, stackCapacity>, 2> stacks_{};
    std::array<BitRange, rangeCapacity> ranges_{};
    std::array<LayerFrame, layerCapacity> layerFrames_{};
    std::array<LayerInfoRecord, layerCapacity> layerInfo_{};
    std::array<char, 64> blockName_{};
    std::array<char, 255> fieldName_{};
    std::array<char, 255> valueText_{};
    std::array<std::uint8_t, 1000> fieldRecord_{}; // the null host uses the same one for all fields
    std::array<std::uint8_t, keyRecordOctets> keyRecord_{};
};

} // namespace netfloor::bench
