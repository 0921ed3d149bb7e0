// SPDX-License-Identifier: MIT
// The storage that the host of a run gives to a plug-in. It lies at the same addresses in each run and is filled
// anew for each, so that only what the plug-in does can make a difference.
#pragma once

#include <algorithm>
#include <cstdint>
#include <cstring>
#include <memory>
#include <span>
#include <vector>

#if __has_include(<sanitizer/asan_interface.h>)
#include <sanitizer/asan_interface.h> // nothing without the sanitizer
#else
#define ASAN_POISON_MEMORY_REGION(from, octets) ((void)(from), (void)(octets))
#define ASAN_UNPOISON_MEMORY_REGION(from, octets) ((void)(from), (void)(octets))
#endif

namespace netfloor::compare {

class Arena {
public:
    void clear() {
        ASAN_POISON_MEMORY_REGION(octets_.get(), used_);
        used_ = 0;
        blocks_.clear();
    }

    // A block filled with a pattern, and a border after it that nobody may change. Null when the arena is full.
    void *allocate(std::size_t size) {
        const std::size_t space = (size + borderOctets + 15) / 16 * 16;
        if (space < size || space > capacity - used_) {
            return nullptr;
        }
        std::uint8_t *const block = octets_.get() + used_;
        ASAN_UNPOISON_MEMORY_REGION(block, space);
        std::memset(block, freshPattern, size);
        std::memset(block + size, borderPattern, space - size);
        ASAN_POISON_MEMORY_REGION(block + size, space - size);
        blocks_.emplace_back(block, size);
        used_ += space;
        return block;
    }

    template <class Element>
    Element *array(std::size_t count) {
        return static_cast<Element *>(allocate(count * sizeof(Element)));
    }

    // A block with the contents of the one at `old`, which is spoilt. Null for what is no block.
    void *reallocate(void *old, std::size_t size) {
        const auto block = std::ranges::find(blocks_, old, [](const auto &one) { return one.data(); });
        if (block == blocks_.end()) {
            return nullptr;
        }
        const auto from = *block;
        void *const grown = allocate(size);
        if (grown != nullptr) {
            std::memcpy(grown, old, std::min(size, from.size()));
            std::memset(old, spoiltPattern, from.size());
            ASAN_POISON_MEMORY_REGION(old, from.size());
        }
        return grown;
    }

    // Whether an octet outside the blocks was changed. The address sanitizer ends the process where one is touched.
    [[nodiscard]] bool overrun() const {
        ASAN_UNPOISON_MEMORY_REGION(octets_.get(), used_);
        const std::uint8_t *end = octets_.get() + used_;
        for (auto block = blocks_.rbegin(); block != blocks_.rend(); end = block++->data()) {
            const std::uint8_t *const border = block->data() + block->size();
            if (std::any_of(border, end, [](std::uint8_t octet) { return octet != borderPattern; })) {
                return true;
            }
        }
        return false;
    }

    [[nodiscard]] std::span<const std::uint8_t> used() const { return {octets_.get(), used_}; }

private:
    static constexpr std::size_t capacity = std::size_t{1} << 28; // untouched, it takes no memory
    static constexpr std::size_t borderOctets = 64;
    static constexpr std::uint8_t freshPattern = 0xf5;
    static constexpr std::uint8_t borderPattern = 0xb0;
    static constexpr std::uint8_t spoiltPattern = 0xd0;

    std::unique_ptr<std::uint8_t[]> octets_{new std::uint8_t[capacity]};
    std::size_t used_ = 0;
    std::vector<std::span<std::uint8_t>> blocks_;
};

} // namespace netfloor::compare
