// SPDX-License-Identifier: MIT
// What a pcapng section says about its interfaces.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "netfloor-capture/packet.h"
#include "records.h"

namespace netfloor {

struct Interface {
    static constexpr std::size_t mostNameOctets = 64;

    std::string_view name;       // in the block
    std::int64_t timeOffset = 0; // seconds
    std::uint32_t snapOctets = 0;
    std::uint16_t linkType = 0;
    std::uint8_t timeResolution = 6; // 10 to the minus this, or 2 to the minus this with the top bit set

    // None where the seconds do not fit into 64 bits.
    [[nodiscard]] std::optional<CaptureTime> timeOf(std::uint64_t units) const;
    // Decimal digits of a second that hold the resolution, at most 9.
    [[nodiscard]] std::uint8_t timeDigits() const;
};

// Calls `see(code, at, size)` for each option, with the place of its value.
template <typename See>
void forEachOption(const NumberView &options, See see) {
    for (std::size_t at = 0; at + 4 <= options.size();) {
        const std::uint16_t code = options.u16(at);
        const std::size_t size = options.u16(at + 2);
        at += 4;
        if (code == 0 || at + size > options.size()) {
            return;
        }
        see(code, at, size);
        at += (size + 3) & ~std::size_t{3};
    }
}

// From the body of an interface description block, of at least 8 octets.
[[nodiscard]] Interface readInterface(const NumberView &body);

class InterfaceTable {
public:
    // Further interfaces are counted and not kept, so that a small packed file cannot take all memory.
    static constexpr std::uint32_t mostKept = std::uint32_t{256} * 1024;
    static constexpr std::size_t mostNamed = 1024;

    void add(const Interface &interface) {
        if (names_.size() < mostNamed) {
            names_.emplace_back(interface.name);
        }
        if (kept_.size() < mostKept) {
            kept_.push_back(interface);
            kept_.back().name = {};
        }
        ++count_;
    }
    // With those that are not kept.
    void setCount(std::uint64_t count) { count_ = count; }
    void clear() {
        kept_.clear();
        names_.clear();
        count_ = 0;
    }
    // Empty where it has none, or none that is kept.
    [[nodiscard]] std::string_view nameOf(std::uint32_t number) const {
        return number < names_.size() ? std::string_view(names_[number]) : std::string_view();
    }
    [[nodiscard]] std::uint64_t count() const { return count_; }
    // None where the number is unknown or not kept.
    [[nodiscard]] const Interface *find(std::uint32_t number) const {
        return number < kept_.size() ? &kept_[number] : nullptr;
    }

private:
    std::vector<Interface> kept_;
    std::vector<std::string> names_;
    std::uint64_t count_ = 0;
};

} // namespace netfloor
