// SPDX-License-Identifier: MIT
// The host of one run: it sets the records up as a plan says, answers the seven operations, and writes down
// each of them with all that it can see at that moment.
#pragma once

#include <bitset>
#include <csetjmp>
#include <cstdint>
#include <string>

#include "memory.h"
#include "plugin.h"
#include "support/packets.h"
#include "trace.h"

namespace netfloor::compare {

enum class Pass : std::uint8_t { to, md, mv, xtr }; // the first three as the modes of the boundary
[[nodiscard]] const char *nameOf(Pass pass);

// How a host behaves. As it stands here it is an ordinary one.
struct Plan {
    std::uint64_t seed = 0; // for what is drawn during the run
    std::uint32_t blockCapacity = 32;
    std::uint32_t limitCapacity = 16;
    std::uint32_t layerCapacity = 4;
    std::uint32_t rangeCapacity = 200;
    std::uint32_t layerInfoCapacity = 7;
    std::uint32_t refusedGrowth = 0; // number of the growth that is refused, from 1; 0: none
    bool oddOwners = false;          // next layers leave the packet in any state
    std::int32_t keyStatus = 1;
    std::uint16_t byteAreaSize = 64;
    std::uint32_t cursor = 1;
    std::uint32_t missingBits = 0; // of the last octet, up to 7
    std::uint32_t outerBits = 0;   // at the end of the packet, outside the limit of this layer
    std::uint32_t flags = 0;
    std::uint32_t layerIndex = 0;
    std::uint8_t sourceMask = 0; // by which the octets of the source differ from those of the working copy

    // A plug-in keeps what the key-field set-up said, so that a plan with another one needs it as loaded.
    [[nodiscard]] bool needsFreshPlugin() const { return keyStatus != 1; }
};

struct Input {
    test::Octets packet;
    Plan plan;
    const char *origin = "";
};

class Host {
public:
    Host();

    // Compares also what has no meaning: elements past the counts, texts past their end.
    bool strict = false;

    // False when the plug-in crashed, did not end or wrote outside its storage; the trace says which.
    bool run(const Plugin &plugin, Pass pass, const Input &input, Trace &trace);

    // Ids that the MD pass has reported in any run.
    [[nodiscard]] const std::bitset<1024> &fieldsSeen() const { return fieldsSeen_; }

    // The seven operations.
    void *grow(void *old, std::size_t size);
    std::int32_t createLayerInfo(PreDecodeContext *context);
    std::int32_t addDecodedField(PreDecodeContext *context, std::uint32_t outputRangeCount, const BitRange *ranges,
                                 const char *display, std::uint32_t zero1, const char *fieldName, std::uint32_t fieldId,
                                 std::uint32_t zero2, std::uint32_t bitOrder);
    std::int32_t addDisplay(PreDecodeContext *context, const char *display, std::uint32_t displayId);
    std::int32_t handOff(PreDecodeContext *context, std::uint32_t mode);
    std::int32_t setUpKeys(KeyFieldRow *table, std::uint32_t rowCount, std::uint16_t *presenceRow);

private:
    void setUp(const Input &input);
    void setUpState();
    void enter();
    void extractLayers();
    void leavePacket(std::uint64_t draw);
    void moveStorage();
    void event(const char *name);
    void snapshot();
    void snapshotFieldRecord();
    void snapshotContext();
    void pointer(const char *label, const void *to);

    const Plugin *plugin_ = nullptr;
    const Plan *plan_ = nullptr;
    Trace *trace_ = nullptr;
    Pass pass_ = Pass::to;

    GuardedCopy data_, source_;
    Arena arena_;
    test::Octets original_; // of the working copy
    DecodeState *state_ = nullptr;
    PreDecodeContext *context_ = nullptr;
    XtrContext *keyContext_ = nullptr;
    std::size_t keyRecordOctets_ = 0;
    std::uint32_t growths_ = 0;
    std::uint32_t handOffs_ = 0;
    std::uint32_t depth_ = 0;
    std::bitset<1024> fieldsSeen_;
};

} // namespace netfloor::compare
