// SPDX-License-Identifier: MIT
// For tests of a plug-in, and for nothing else: states with any set-up, also one that no packet needs, and memory of
// exact size, so that a memory checker sees each read past the end.
#pragma once

#include <cstddef>
#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <span>

#include <netfloor/records.h>

#include "netfloor-host/plugin_host.h"

namespace netfloor {

// How a DecodeState is set up. The defaults suit any packet.
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

// A run with a state of its own, built anew, which Host::run takes in the place of RunOptions.
struct TestRunOptions : RunOptions {
    StateOptions state;
    std::uint32_t layerInfoCapacity = 7; // highest index of the list of layers at the start
    std::uint16_t byteAreaSize = 64;     // XTR: room for one address; it needs 17
    bool followStop = true;              // XTR: go on with the owner of the next layer
};

// Owns a DecodeState and everything it points to but the packet itself.
class PacketState {
public:
    // The working copy has exactly the octets that `totalBits` needs. `packet` has to outlive the object, or its use
    // for this packet. Throws std::invalid_argument when totalBits, the cursor or a capacity make no sense, and
    // std::bad_alloc.
    explicit PacketState(std::span<const std::uint8_t> packet, const StateOptions &options = {});
    ~PacketState();
    PacketState(const PacketState &) = delete;
    PacketState &operator=(const PacketState &) = delete;

    // Takes another packet, with all its octets, into the same storage. The working copy may have more room than the
    // packet needs. Only what the last packet may have left, and the next one may see, is cleared.
    void reset(std::span<const std::uint8_t> packet);

    [[nodiscard]] DecodeState &state();
    [[nodiscard]] const DecodeState &state() const;
    [[nodiscard]] std::span<const std::uint8_t> packet() const;

private:
    struct Storage;
    std::unique_ptr<Storage> storage_;
};

// Elements above the bottom one.
[[nodiscard]] inline std::uint32_t depthOf(const BitStack &stack) {
    return static_cast<std::uint32_t>(stack.top - stack.base);
}

} // namespace netfloor
