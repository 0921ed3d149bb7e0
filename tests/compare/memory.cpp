// SPDX-License-Identifier: MIT
#include "memory.h"

#include <algorithm>
#include <cstring>
#include <new>

#include <sys/mman.h>
#include <unistd.h>

namespace netfloor::compare {
namespace {

constexpr std::size_t arenaOctets = std::size_t{1} << 28; // only what is touched takes memory
constexpr std::size_t borderOctets = 64;
constexpr std::uint8_t borderPattern = 0xb0;
constexpr std::uint8_t freshPattern = 0xf5;
constexpr std::uint8_t spoiltPattern = 0xd0;

std::uint8_t *map(std::size_t octets) {
    void *const mapping =
        mmap(nullptr, octets, PROT_READ | PROT_WRITE, MAP_PRIVATE | MAP_ANONYMOUS | MAP_NORESERVE, -1, 0);
    if (mapping == MAP_FAILED) {
        throw std::bad_alloc();
    }
    return static_cast<std::uint8_t *>(mapping);
}

} // namespace

GuardedCopy::GuardedCopy() {
    const auto page = static_cast<std::size_t>(sysconf(_SC_PAGESIZE));
    end_ = map(mostOctets + page) + mostOctets;
    if (mprotect(end_, page, PROT_NONE) != 0) {
        throw std::bad_alloc();
    }
}

void GuardedCopy::assign(std::span<const std::uint8_t> octets) {
    size_ = octets.size();
    std::copy(octets.begin(), octets.end(), data());
}

Arena::Arena() : base_(map(arenaOctets)) {}

void Arena::clear() {
    used_ = 0;
    blocks_.clear();
}

void *Arena::allocate(std::size_t size) {
    constexpr std::size_t alignment = alignof(std::max_align_t);
    const std::size_t space = (size + borderOctets + alignment - 1) / alignment * alignment;
    if (space < size || space > arenaOctets - used_) {
        return nullptr;
    }
    std::uint8_t *const block = base_ + used_;
    std::memset(block, freshPattern, size);
    std::memset(block + size, borderPattern, space - size);
    blocks_.push_back({used_, size});
    used_ += space;
    return block;
}

void *Arena::reallocate(void *old, std::size_t size) {
    const auto block = std::find_if(blocks_.begin(), blocks_.end(),
                                    [&](const Block &candidate) { return base_ + candidate.offset == old; });
    if (block == blocks_.end()) {
        return nullptr;
    }
    const Block from = *block;
    void *const grown = allocate(size);
    if (grown != nullptr) {
        std::memcpy(grown, old, std::min(size, from.size));
        std::memset(old, spoiltPattern, from.size);
    }
    return grown;
}

bool Arena::overrun() const {
    for (std::size_t i = 0; i < blocks_.size(); ++i) {
        const std::size_t next = i + 1 < blocks_.size() ? blocks_[i + 1].offset : used_;
        const auto border = std::span(base_, next).subspan(blocks_[i].offset + blocks_[i].size);
        if (!std::ranges::all_of(border, [](std::uint8_t octet) { return octet == borderPattern; })) {
            return true;
        }
    }
    return false;
}

} // namespace netfloor::compare
