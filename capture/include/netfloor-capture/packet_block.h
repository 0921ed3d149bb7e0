// SPDX-License-Identifier: MIT
// Copies of packets, for who needs them after the next one was read: another thread, for example.
#pragma once

#include <cstddef>
#include <cstdint>
#include <memory_resource>
#include <span>
#include <string_view>
#include <vector>

#include "netfloor-capture/packet.h"

namespace netfloor {

// A block keeps its storage when it is cleared: a usual one allocates nothing after the first time.
class PacketBlock {
public:
    PacketBlock();
    PacketBlock(const PacketBlock &) = delete;
    PacketBlock &operator=(const PacketBlock &) = delete;

    // Copies the packet with its octets, comments and name of the interface.
    void add(const CapturedPacket &packet);
    void clear();

    // Whether it has as much as a block should have. A full one takes more all the same.
    [[nodiscard]] bool isFull() const { return packets_.size() >= mostPackets || octets_ >= mostOctets; }
    [[nodiscard]] bool isEmpty() const { return packets_.empty(); }
    [[nodiscard]] std::span<const CapturedPacket> packets() const { return packets_; }

private:
    static constexpr std::size_t mostPackets = 512;
    static constexpr std::size_t mostOctets = std::size_t{256} * 1024;
    static constexpr std::size_t firstRoom = mostOctets + std::size_t{64} * 1024; // the last packet goes past the most

    [[nodiscard]] std::string_view keep(std::string_view text);

    std::vector<std::uint8_t> first_;
    std::pmr::monotonic_buffer_resource room_;
    std::vector<CapturedPacket> packets_;
    std::size_t octets_ = 0; // of the packets
};

} // namespace netfloor
