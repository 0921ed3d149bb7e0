// SPDX-License-Identifier: MIT
// What a pcapng section says about its interfaces.
#pragma once

#include <cstdint>
#include <optional>
#include <vector>

#include "netfloor-capture/packet.h"
#include "records.h"

namespace netfloor {

// Only what a packet needs is kept; names and comments are not.
struct Interface {
    std::int64_t timeOffset = 0; // seconds
    std::uint32_t snapOctets = 0;
    std::uint16_t linkType = 0;
    std::uint8_t timeResolution = 6; // 10 to the minus this, or 2 to the minus this with the top bit set

    // None where the seconds do not fit into 64 bits.
    [[nodiscard]] std::optional<CaptureTime> timeOf(std::uint64_t units) const;
    // Decimal digits of a second that hold the resolution, at most 9.
    [[nodiscard]] std::uint8_t timeDigits() const;
};

// From the body of an interface description block, of at least 8 octets.
[[nodiscard]] Interface readInterface(const NumberView &body);

class InterfaceTable {
public:
    // Further interfaces are counted and not kept, so that a small packed file cannot take all memory.
    static constexpr std::uint32_t mostKept = std::uint32_t{256} * 1024;

    void add(const Interface &interface) {
        if (kept_.size() < mostKept) {
            kept_.push_back(interface);
        }
        ++count_;
    }
    void clear() {
        kept_.clear();
        count_ = 0;
    }
    [[nodiscard]] std::uint64_t count() const { return count_; }
    // None where the number is unknown or not kept.
    [[nodiscard]] const Interface *find(std::uint32_t number) const {
        return number < kept_.size() ? &kept_[number] : nullptr;
    }

private:
    std::vector<Interface> kept_;
    std::uint64_t count_ = 0;
};

} // namespace netfloor
