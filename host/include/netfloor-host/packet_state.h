// SPDX-License-Identifier: MIT
// A packet in the form in which plug-ins work on it: a DecodeState with the storage behind it.
#pragma once

#include <cstddef>
#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <span>

#include <netfloor/records.h>

namespace netfloor {

// How a DecodeState is set up. The defaults suit any packet; the rest is for tests of a plug-in's frame.
struct StateOptions {
    std::optional<std::uint32_t> totalBits; // default: all octets of the packet
    std::uint32_t cursor = 1;               // the bit at which the first layer starts
    std::uint32_t flags = 0;

    // Room at the start, in elements. At least 1 each; the plug-in asks for more through hs_Realloc.
    std::uint32_t blockCapacity = 32;
    std::uint32_t limitCapacity = 16;
    std::uint32_t layerCapacity = 4;
    std::uint32_t rangeCapacity = 200;

    // Asked before an array of the state grows to `octets` octets: false makes hs_Realloc fail.
    std::function<bool(std::size_t octets)> allowGrowth;

    // Called when the state is set up, and before the plug-in sees it.
    std::function<void(DecodeState &state)> prepare;
};

// Owns a DecodeState and everything it points to but the packet itself. The working copy has exactly the
// octets that `totalBits` needs, so that a memory checker sees each read behind it.
class PacketState {
public:
    // `packet` has to outlive the object. Throws std::invalid_argument when totalBits, the cursor or a
    // capacity make no sense, and std::bad_alloc.
    explicit PacketState(std::span<const std::uint8_t> packet, const StateOptions &options = {});
    ~PacketState();
    PacketState(const PacketState &) = delete;
    PacketState &operator=(const PacketState &) = delete;

    [[nodiscard]] DecodeState &state();
    [[nodiscard]] const DecodeState &state() const;
    [[nodiscard]] std::span<const std::uint8_t> packet() const;

private:
    struct Storage;
    std::unique_ptr<Storage> storage_;
};

// Elements above the bottom one.
[[nodiscard]] std::uint32_t depthOf(const BitStack &stack);

} // namespace netfloor
