// SPDX-License-Identifier: MIT
// The reports of a pass while it runs, and the class that takes them. An output is such a class.
//
//     class Lines final : public netfloor::Sink {
//     public:
//         void field(const netfloor::FieldView &field) override {
//             std::cout << std::string(2 * field.depth, ' ') << field.text.view() << '\n';
//         }
//     };
//
//     netfloor::Host host(netfloor::PluginLibrary::open("build/plugin/libnetfloor.so"));
//     Lines lines;
//     host.run(netfloor::Pass::md, packet, lines);
//
// A view is valid during the call that gives it, with two exceptions: the name of a field of the plug-in's tables and
// the name of a block are valid as long as the Host lives.
//
// Bits are numbered as in netfloor/records.h: from 1, and within an octet from the least significant up.
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <span>
#include <string_view>

#include <netfloor/records.h>

namespace netfloor {

constexpr std::uint32_t bitsPerOctet = 8;

enum class Pass : std::uint8_t {
    md,  // every field with its long text and its bit ranges
    to,  // every field's short display text
    mv,  // a verdict
    xtr, // the values of the key fields
};

// A text that ends with a zero, as the plug-in gives it, or one of known length. The length is computed when it is
// needed, since many sinks use a few texts only.
class LazyText {
public:
    LazyText() = default;
    explicit LazyText(const char *zeroTerminated) : start_(zeroTerminated) {}
    explicit LazyText(std::string_view text) : start_(text.data()), size_(text.size()) {}

    [[nodiscard, gnu::always_inline]] std::string_view view() const {
        if (start_ == nullptr) {
            return {};
        }
        return size_ == unknown ? std::string_view(start_) : std::string_view(start_, size_);
    }

private:
    static constexpr std::size_t unknown = static_cast<std::size_t>(-1);

    const char *start_ = nullptr;
    std::size_t size_ = unknown;
};

// A named block of the packet in which fields are read.
//
// `depth` is the depth at which it is shown. It is not the number of blocks that the plug-in has open: a grammar keeps
// the links of a chain (tunnels, extension headers, chunks, options) open inside one another, and thousands of links
// would be thousands of levels deep. The host shows links side by side:
//
//   - A block of the same name as one that is shown around it takes the place of that one.
//   - A block is a link if its parent has no field of its own so far and does not begin where the block shown around
//     it begins. It is shown beside the first link under the same limit.
//
// So the depth never exceeds the number of names that blocks have.
struct BlockView {
    std::string_view name;      // empty where no field was read directly in the block so far, or where it has none
    std::uint32_t number = 0;   // 0, 1, 2... in the order in which the blocks of this pass were opened
    std::uint32_t firstBit = 0; // where it starts
    std::uint32_t depth = 0;    // of its name; its fields are one level deeper
    bool continued = false;     // it was shown before, and another took its place in between
};

// MD: one field.
struct FieldView {
    std::uint32_t id = 0;    // 0 for what an owner in the host reported
    std::string_view name;   // as the field tables have it, or as it was reported where they do not know the id
    bool isKey = false;      // one of the key fields, which the XTR pass stores
    LazyText text;           // the display line; may be empty
    LazyText reportedName;   // unchanged, leading blanks included
    std::uint32_t value = 0; // as the field record has it
    std::span<const BitRange> ranges = {}; // in the order in which they were read; value, firstBit, lastBit count
    std::uint32_t bitOrder = 0;            // 8 where the bits of each octet were read reversed
    std::uint32_t flags = 0;               // of the decode state: what was raised before the field was reported
    std::uint32_t cursor = 0;              // likewise: the first bit that the plug-in has not gone past
    LazyText blockName = {};               // of the innermost block, also for a sink that wants no blocks
    std::uint32_t depth = 0;               // blocks that are shown around it
    std::span<const BlockView> blocks =
        {}; // all that the plug-in has open, the outermost first, nameless ones included
    // What the plug-in wrote into the head of the host's field record: the layer number, then two octets
    // that are 0, or 0xff where the plug-in did not write them.
    std::array<std::uint8_t, 3> recordHead = {};

    [[nodiscard]] std::uint8_t layerNumber() const { return recordHead[0]; }
};

// TO: one short text.
struct ShortTextView {
    std::uint32_t displayId = 0; // 0 for what an owner in the host reported
    std::string_view name;       // of the first field of that id, empty where the field tables do not know it
    bool isKey = false;          // as in FieldView
    LazyText text;
    std::uint8_t layerNumber = 0;
};

// How the value of a key field is to be shown.
enum class KeyType : std::uint8_t { number8, number16, number32, ipv4Address, ipv6Address };

// MD and TO: the first field that was not captured as a whole.
struct NotCaptured {
    std::string_view name;   // as in FieldView; "data" for what an owner took as such
    std::uint32_t flags = 0; // of the decode state: what was raised before it
};

// XTR: one key field that the packet has.
struct KeyView {
    std::string_view name;
    std::uint32_t row = 0; // row of the key-field table
    KeyType type = KeyType::number32;
    std::uint32_t number = 0;             // every type but ipv6Address; an IPv4 address has its first octet on top
    std::span<const std::uint8_t> octets; // ipv6Address: as stored, that is with the nibbles of each octet exchanged
};

// MD and TO: one record of the host's list of layers.
struct LayerRecord {
    std::uint32_t firstBit = 0;
    std::uint32_t lastBit = 0; // firstBit - 1 for a layer without bits
    std::uint32_t decoderId = 0;
    std::uint32_t layerNumber = 0;

    friend bool operator==(const LayerRecord &, const LayerRecord &) = default;
};

// All passes: one hand-off to an owner of a next layer, as the plug-in left it.
struct HandOff {
    std::uint32_t key = 0;      // LayerFrame::nextLayerKey
    std::uint32_t protocol = 0; // LayerFrame::nextLayerProtocol, 0 where it was not written
    std::uint32_t port = 0;     // the scratch words
    std::uint32_t nextLayerOctets = 0;
    std::uint32_t precedingOctets = 0;
    std::uint32_t layerNumber = 0; // of the next layer
    std::uint32_t layerIndex = 0;  // of the layer frame that names the owner
    std::uint32_t cursor = 0;      // the first bit of the next layer
    std::uint32_t bitsLeft = 0;    // what the limit allows from there on
    std::uint32_t contextBitsLeft = 0;
    std::uint32_t blockDepth = 0; // blocks and limits open, the bottom elements not counted
    std::uint32_t limitDepth = 0;
    std::uint32_t nesting = 0;      // how many hand-offs are around this one
    std::uint32_t consumedBits = 0; // what the owner took
    bool refused = false;           // the owner refused; the pass was cut off
};

// MV.
struct Verdict {
    std::int32_t value = 0;  // 0, or -52 when a flag is set
    std::uint32_t flags = 0; // NETFLOOR_FLAG_..., see flagNames() in value_text.h
    [[nodiscard]] bool fault() const { return value != 0; }
};

enum class Ending : std::uint8_t {
    complete,   // the pass ran to its end; bits may be left
    cutOff,     // storage ran out, an owner refused, or an address did not fit into the key record
    keysDenied, // XTR: the set-up of the key-field table was refused
};

// The end of a pass.
struct PassEnd {
    Pass pass;
    Ending ending;
    std::int32_t result;      // as the entry returned it
    std::uint32_t bitsLeft;   // of the context: bits that were not decoded
    Verdict verdict;          // MV
    std::uint8_t layerNumber; // of the last layer; not XTR
    std::uint32_t decoderId;  // not XTR
    const DecodeState &state; // as the plug-in left it: cursor, flags
};

// Takes what a pass reports, in this order:
//
//   begin                   once
//   blockOpened, field, blockClosed, text, handOff, notCaptured    as the plug-in goes
//   layer, key              one by one, in the order of the layers and of the rows
//   end                     once
//
// An exception ends the pass: nothing more is reported, and it reaches the caller of Host::run. A sink may be used
// for one packet after the other. It must not run the plug-in that is reporting to it.
class Sink {
public:
    Sink() = default;
    Sink(const Sink &) = delete;
    Sink &operator=(const Sink &) = delete;
    virtual ~Sink() = default;

    // Asked before each pass. Without blocks there are no calls for them, and a field has the depth 0 and no `blocks`:
    // to find out which blocks are open takes a good part of the MD pass.
    [[nodiscard]] virtual bool wantsBlocks() const { return true; }

    // Asked likewise. Without them, and without blocks, FieldView::blockName is empty.
    [[nodiscard]] virtual bool wantsBlockNames() const { return true; }

    // Asked likewise, for MD: an element for each id of a field, 0 for one that `field` is not to be called for. Ids
    // past the end are not wanted either. Empty: all are.
    [[nodiscard]] virtual std::span<const std::uint8_t> wantedFields() const { return {}; }

    virtual void begin(Pass /*pass*/, std::span<const std::uint8_t> /*packet*/) {}

    // MD. Each block that is opened is closed, the last one first, and `depth` blocks are open when one opens. Each
    // block that has a name and fields of its own is opened before the first of them. It is opened again, with
    // `continued`, where a field follows after another block took its place.
    virtual void blockOpened(const BlockView & /*block*/) {}
    virtual void blockClosed(const BlockView & /*block*/) {}
    virtual void field(const FieldView & /*field*/) {}

    virtual void text(const ShortTextView & /*text*/) {} // TO
    // Neither this field nor anything after it is reported, layers excepted. See RunOptions::wireOctets.
    virtual void notCaptured(const NotCaptured & /*first*/) {} // MD and TO
    virtual void key(const KeyView & /*key*/) {}               // XTR
    virtual void layer(const LayerRecord & /*layer*/) {}       // MD and TO
    virtual void handOff(const HandOff & /*handOff*/) {}       // after the owner's work
    virtual void end(const PassEnd & /*end*/) {}
};

} // namespace netfloor
