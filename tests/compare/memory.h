// SPDX-License-Identifier: MIT
// The storage of the host of one run. It lies at the same addresses in each run and is filled anew for each.
#pragma once

#include <cstddef>
#include <cstdint>
#include <span>
#include <vector>

namespace netfloor::compare {

// Octets that end where an inaccessible page begins: a read after the last one is fatal.
class GuardedCopy {
public:
    GuardedCopy();
    GuardedCopy(const GuardedCopy &) = delete;
    GuardedCopy &operator=(const GuardedCopy &) = delete;

    static constexpr std::size_t mostOctets = std::size_t{1} << 17;

    // Takes a copy; the one before is gone.
    void assign(std::span<const std::uint8_t> octets);
    [[nodiscard]] std::uint8_t *data() const { return end_ - size_; }
    [[nodiscard]] std::size_t size() const { return size_; }

private:
    std::uint8_t *end_ = nullptr; // never unmapped: it lives as long as the program
    std::size_t size_ = 0;
};

// Blocks of storage, with octets between them that nobody may change. Nothing is given back before `clear`.
class Arena {
public:
    Arena();
    Arena(const Arena &) = delete;
    Arena &operator=(const Arena &) = delete;

    void clear();

    // A block filled with a pattern; null when the arena is full.
    [[nodiscard]] void *allocate(std::size_t size);
    template <class Element>
    [[nodiscard]] Element *allocate(std::size_t count) {
        return static_cast<Element *>(allocate(count * sizeof(Element)));
    }

    // A block with the contents of the one at `old`, which is spoilt. Null for what is no block.
    [[nodiscard]] void *reallocate(void *old, std::size_t size);

    // Whether an octet outside the blocks was changed.
    [[nodiscard]] bool overrun() const;

    [[nodiscard]] std::span<const std::uint8_t> used() const { return {base_, used_}; }

private:
    struct Block {
        std::size_t offset;
        std::size_t size;
    };
    std::uint8_t *base_ = nullptr;
    std::size_t used_ = 0;
    std::vector<Block> blocks_;
};

} // namespace netfloor::compare
