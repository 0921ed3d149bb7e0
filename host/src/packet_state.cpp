// SPDX-License-Identifier: MIT
#include "netfloor-host/testing.h"

#include <algorithm>
#include <array>
#include <cstring>
#include <limits>
#include <new>
#include <stdexcept>
#include <string>

#include "links.h"

namespace netfloor {
namespace {

constexpr std::size_t mostOctets = std::numeric_limits<std::uint32_t>::max() / bitsPerOctet;
constexpr std::size_t textOctets = 255;

std::uint32_t bitsOf(std::span<const std::uint8_t> packet) {
    if (packet.size() > mostOctets) {
        throw std::invalid_argument("a packet has at most " + std::to_string(mostOctets) + " octets");
    }
    return static_cast<std::uint32_t>(packet.size() * bitsPerOctet);
}

std::uint32_t checkedBits(std::span<const std::uint8_t> packet, const StateOptions &options) {
    const std::uint32_t allBits = bitsOf(packet);
    const std::uint32_t totalBits = options.totalBits.value_or(allBits);
    if (totalBits > allBits) {
        throw std::invalid_argument("totalBits is above the bits that the packet has");
    }
    if (options.cursor == 0 || options.cursor - 1 > totalBits) {
        throw std::invalid_argument("the cursor is outside the packet");
    }
    if (options.blockCapacity == 0 || options.limitCapacity == 0 || options.layerCapacity == 0 ||
        options.rangeCapacity == 0) {
        throw std::invalid_argument("a capacity is 0; each array has at least one element");
    }
    return totalBits;
}

// An array on the host's heap. The plug-in may let it grow and move: only the record has its current address.
template <typename Element>
Element *allocate(std::size_t count, standin::HeapKeeper &keeper) {
    void *const block = standin::allocateBlock(&keeper, count * sizeof(Element));
    if (block == nullptr) {
        throw std::bad_alloc();
    }
    std::memset(block, 0, count * sizeof(Element));
    return static_cast<Element *>(block);
}

void setUp(BitStack &stack, std::uint32_t capacity, std::uint32_t bottom, standin::HeapKeeper &keeper) {
    stack.base = allocate<std::uint32_t>(capacity, keeper);
    stack.base[0] = bottom;
    stack.top = stack.base;
    stack.capacity = capacity;
}

void clear(BitStack &stack, std::uint32_t bottom) {
    *stack.base = bottom;
    stack.top = stack.base;
    stack.count = 0;
}

} // namespace

struct PacketState::Storage final : standin::HeapKeeper {
    Storage() = default;
    Storage(const Storage &) = delete;
    Storage &operator=(const Storage &) = delete;

    ~Storage() {
        standin::freeBlock(state.fieldRecord.ranges);
        standin::freeBlock(state.layerFrames);
        standin::freeBlock(state.limits.base);
        standin::freeBlock(state.blockStarts.base);
    }

    // Not in the constructor: the destructor must free the earlier arrays when a later one fails.
    void setUpFor(std::span<const std::uint8_t> octets, const StateOptions &options) {
        allowGrowth = options.allowGrowth;
        const std::uint32_t totalBits = checkedBits(octets, options);
        take(octets, (std::size_t{totalBits} + bitsPerOctet - 1) / bitsPerOctet);

        state.totalBits = totalBits;
        state.cursor = options.cursor;
        state.bitsLeft = totalBits - (options.cursor - 1);
        state.flags = options.flags;
        state.blockName = blockName.data();
        state.layerHandedOff = 1;
        state.layerCapacity = options.layerCapacity;
        state.fieldRecord.rangeCapacity = options.rangeCapacity;
        state.fieldRecord.fieldName = fieldName.data();
        state.fieldRecord.valueText = valueText.data();
        setUp(state.blockStarts, options.blockCapacity, 1, *this);
        setUp(state.limits, options.limitCapacity, totalBits, *this);
        state.layerFrames = allocate<LayerFrame>(options.layerCapacity, *this);
        state.fieldRecord.ranges = allocate<BitRange>(options.rangeCapacity, *this);
    }

    // The ranges of the field record are left as they are: a field writes those that count for it.
    void resetTo(std::span<const std::uint8_t> octets) {
        const std::uint32_t totalBits = bitsOf(octets);
        take(octets, octets.size());
        const std::size_t frames = std::size_t{std::min(state.layerIndex, state.layerCapacity - 1)} + 1;
        std::memset(state.layerFrames, 0, frames * sizeof *state.layerFrames);

        state.totalBits = totalBits;
        state.cursor = 1;
        state.bitsLeft = totalBits;
        state.flags = 0;
        clear(state.blockStarts, 1);
        clear(state.limits, totalBits);
        state.condition = 0;
        state.advance = 0;
        *state.blockName = '\0';
        // In pieces: for one copy of this size compilers choose a string instruction, which starts slowly.
        constexpr std::size_t wordsEach = 8;
        for (std::size_t word = 0; word < std::size(state.scratch); word += wordsEach) {
            std::memset(state.scratch + word, 0, wordsEach * sizeof *state.scratch);
        }
        FieldRecord &record = state.fieldRecord;
        record.fieldId = 0;
        *record.fieldName = '\0';
        record.value = 0;
        *record.valueText = '\0';
        record.rangeCount = record.outputRangeCount = 0;
        record.wideStart = record.wideBits = 0;
        record.rawFlag = 0;
        state.layerHandedOff = 1;
        state.layerIndex = 0;
    }

    // Copies the octets; the state shows the copy and the original.
    void take(std::span<const std::uint8_t> octets, std::size_t copied) {
        if (copied > copyOctets || !copy) {
            copy.reset(); // first, so that old and new need no memory at the same time
            copyOctets = 0;
            copy = std::make_unique_for_overwrite<std::uint8_t[]>(copied);
            copyOctets = copied;
        }
        if (copied != 0) {
            std::memcpy(copy.get(), octets.data(), copied);
        }
        packet = octets;
        state.data = copy.get();
        state.sourceData = octets.data();
    }

    bool allowsGrowth(std::size_t octets) noexcept override { return !allowGrowth || allowGrowth(octets); }

    DecodeState state = {};
    std::span<const std::uint8_t> packet;
    std::function<bool(std::size_t)> allowGrowth;
    std::unique_ptr<std::uint8_t[]> copy;
    std::size_t copyOctets = 0;
    std::array<char, textOctets> blockName = {};
    std::array<char, textOctets> fieldName = {};
    std::array<char, textOctets> valueText = {};
};

PacketState::PacketState(std::span<const std::uint8_t> packet, const StateOptions &options)
    : storage_(std::make_unique<Storage>()) {
    storage_->setUpFor(packet, options);
    if (options.prepare) {
        options.prepare(storage_->state);
    }
}

PacketState::~PacketState() = default;

void PacketState::reset(std::span<const std::uint8_t> packet) {
    storage_->resetTo(packet);
}

DecodeState &PacketState::state() {
    return storage_->state;
}

const DecodeState &PacketState::state() const {
    return storage_->state;
}

std::span<const std::uint8_t> PacketState::packet() const {
    return storage_->packet;
}

} // namespace netfloor
