// SPDX-License-Identifier: MIT
// How the three stand-in libraries call the host library, without linking to it: by these interfaces alone.
//
// A run is found by its context record, which is the first member of a PreDecodeRun. A block of the heap has its
// keeper's address in front of it, since hs_Realloc gets no context. hx_InitialiseOptXTR gets no context either, so
// the host names the plug-in that its thread is about to enter (netfloor_setKeyOptions).
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstdlib>

#include <netfloor/host.h>

// Marks what a stand-in exports; all else is hidden.
#ifdef _WIN32
#define NETFLOOR_STANDIN __declspec(dllexport)
#else
#define NETFLOOR_STANDIN [[gnu::visibility("default")]]
#endif

namespace netfloor::standin {

// Decides whether the arrays of one DecodeState may grow.
class HeapKeeper {
public:
    virtual bool allowsGrowth(std::size_t octets) noexcept = 0;

protected:
    ~HeapKeeper() = default;
};

// One run of the MD, TO or MV pass.
class RunOperations {
public:
    // With the arguments and the result of hs_AddDecodedFieldsData, so that it is passed on by a jump.
    virtual std::int32_t addField(std::uint32_t outputRangeCount, const BitRange *ranges, const char *display,
                                  std::uint32_t zero, const char *fieldName, std::uint32_t fieldId,
                                  std::uint32_t otherZero, std::uint32_t bitOrder) noexcept = 0;
    virtual void addDisplay(const char *display, std::uint32_t displayId) noexcept = 0;
    virtual void growLayerInfo() noexcept = 0;
    virtual std::int32_t preDecode(std::uint32_t mode) noexcept = 0;

protected:
    ~RunOperations() = default;
};

// A context of the host. The plug-in sees the first member alone.
struct PreDecodeRun {
    PreDecodeContext context;
    RunOperations *operations;
};

[[nodiscard]] inline RunOperations &operationsOf(PreDecodeContext *context) {
    return *reinterpret_cast<PreDecodeRun *>(context)->operations;
}

// The set-up of one plug-in's key-field table.
class KeyOptions {
public:
    virtual std::int32_t initialise(KeyFieldRow *table, std::uint32_t rowCount,
                                    std::uint16_t *presenceRow) noexcept = 0;

protected:
    ~KeyOptions() = default;
};

// The octets in front of each block of the heap. Two pointers are what Windows aligns its blocks to; max_align_t is not
// the same in all of mingw's headers, and the stand-ins and the host library have to agree.
struct alignas(2 * sizeof(void *)) BlockHead {
    HeapKeeper *keeper;
};

[[nodiscard]] inline void *allocateBlock(HeapKeeper *keeper, std::size_t octets) {
    if (octets > SIZE_MAX - sizeof(BlockHead)) {
        return nullptr;
    }
    auto *const head = static_cast<BlockHead *>(std::malloc(sizeof(BlockHead) + octets));
    if (head == nullptr) {
        return nullptr;
    }
    head->keeper = keeper;
    return head + 1;
}

[[nodiscard]] inline BlockHead *headOf(void *block) {
    return static_cast<BlockHead *>(block) - 1;
}

inline void freeBlock(void *block) {
    if (block != nullptr) {
        std::free(headOf(block));
    }
}

} // namespace netfloor::standin

// libhx_KeyOptions: sets what answers hx_InitialiseOptXTR on this thread; null for nothing. No other stand-in exports
// more than the operations of netfloor/host.h.
extern "C" void netfloor_setKeyOptions(netfloor::standin::KeyOptions *options);
