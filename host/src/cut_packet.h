// SPDX-License-Identifier: MIT
// A packet that the snap length has cut, completed to its length on the wire. A grammar reads nothing past a length
// that reaches past the end of its packet; in a completed packet the lengths fit, and the host knows which fields lie
// past the captured octets.
#pragma once

#include <algorithm>
#include <cstdint>
#include <cstring>
#include <span>
#include <vector>

#include <netfloor/records.h>

namespace netfloor {

class CutPacket {
public:
    // The most octets that the length in an IP header can reach: an IPv6 header and its payload. A jumbo payload, which
    // tells a length of 0 there (RFC 2675), is not read at all. The plug-in works on all that it is given: a capture
    // file may hold megabytes after a packet.
    static constexpr std::size_t mostOctets = 40 + 65535;

    // Takes a packet with its length on the wire; 0 says that it is whole.
    void take(std::span<const std::uint8_t> packet, std::size_t wireOctets) {
        captured_ = packet;
        isCut_ = wireOctets > packet.size() && packet.size() < mostOctets;
        if (!isCut_) {
            return;
        }
        const std::size_t size = std::min(wireOctets, mostOctets);
        if (completed_.size() < size) {
            completed_.resize(size);
        }
        std::memcpy(completed_.data(), packet.data(), packet.size());
        octets_ = std::span(completed_).first(size);
        fill(0);
    }

    [[nodiscard]] bool isCut() const { return isCut_; }
    [[nodiscard]] std::span<const std::uint8_t> octets() const { return isCut_ ? octets_ : captured_; }

    // Sets all octets that were not captured.
    void fill(std::uint8_t octet) {
        std::memset(octets_.data() + captured_.size(), octet, octets_.size() - captured_.size());
    }

    // Bits from `bit` on that were captured.
    [[nodiscard]] std::uint32_t bitsFrom(std::uint32_t bit) const {
        const std::uint32_t end = capturedBits() + 1;
        return bit < end ? end - bit : 0;
    }

    // Whether the field that was read last was captured as a whole.
    [[nodiscard]] bool holds(std::span<const BitRange> ranges, std::uint32_t cursor) const {
        if (ranges.empty()) { // it was looked at ahead, by at most this
            constexpr std::uint32_t mostBitsAhead = 32;
            return bitsFrom(cursor) >= mostBitsAhead;
        }
        return std::ranges::all_of(ranges, [this](const BitRange &range) { return range.lastBit <= capturedBits(); });
    }

private:
    [[nodiscard]] std::uint32_t capturedBits() const { return static_cast<std::uint32_t>(captured_.size() * 8); }

    bool isCut_ = false;
    std::span<const std::uint8_t> captured_;
    std::span<std::uint8_t> octets_;
    std::vector<std::uint8_t> completed_; // its storage
};

} // namespace netfloor
