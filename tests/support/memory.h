// SPDX-License-Identifier: MIT
// Memory in which a fault shows: octets with an inaccessible page after them, and a small stack.
#pragma once

#include <cstddef>
#include <cstdint>
#include <functional>
#include <span>

namespace netfloor::test {

// A copy of some octets that ends where an inaccessible page begins: a read past the last octet is fatal.
class GuardedOctets {
public:
    explicit GuardedOctets(std::span<const std::uint8_t> octets);
    ~GuardedOctets();
    GuardedOctets(const GuardedOctets &) = delete;
    GuardedOctets &operator=(const GuardedOctets &) = delete;

    [[nodiscard]] std::span<std::uint8_t> octets() const { return octets_; }

private:
    void *mapping_ = nullptr;
    std::size_t mappedOctets_ = 0;
    std::span<std::uint8_t> octets_;
};

// Runs `work` on a thread with a stack of 64 KiB (more under a sanitizer, whose frames are larger) and waits
// for it. Throws what `work` throws.
void onSmallStack(const std::function<void()> &work);

} // namespace netfloor::test
