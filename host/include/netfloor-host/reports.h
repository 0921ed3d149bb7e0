// SPDX-License-Identifier: MIT
// What a pass reported about one packet, as plain records. Whoever prints or compares results needs this
// header only, and no knowledge of any protocol.
//
// Bits are numbered as in netfloor/records.h: from 1, and within an octet from the least significant up.
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <variant>
#include <vector>

namespace netfloor {

enum class Pass : std::uint8_t {
    md,  // every field with its long text and its bit ranges
    to,  // every field's short display text
    mv,  // a verdict
    xtr, // the values of the key fields
};

// One piece of a field.
struct ReportedRange {
    std::uint32_t value;
    std::uint32_t firstBit;
    std::uint32_t lastBit;

    friend bool operator==(const ReportedRange &, const ReportedRange &) = default;
};

// A named stretch of the packet in which fields were read. A block in which no field was read directly, but
// only in blocks inside it, has an empty name: a plug-in gives a block's name with its fields.
struct Block {
    static constexpr std::size_t none = static_cast<std::size_t>(-1);

    std::string name;
    std::size_t parent = none; // index of the enclosing block in Report::blocks
    std::uint32_t firstBit = 0;
};

// MD: one field.
struct FieldReport {
    std::uint32_t id = 0; // 0 for what an owner in the host reported
    std::string name;     // letter for letter, leading blanks included
    std::string text;     // the display line; may be empty
    std::uint32_t value = 0;
    std::vector<ReportedRange> ranges; // in the order in which they were read
    std::uint32_t bitOrder = 0;        // 8 where the bits of each octet were read reversed
    std::uint32_t flags = 0;           // of the decode state: what was raised before it was reported
    std::size_t block = Block::none;   // index in Report::blocks
    // What the plug-in wrote into the head of the host's field record: the layer number, then two octets
    // that are 0, or 0xff where the plug-in left them alone.
    std::array<std::uint8_t, 3> recordHead = {};

    [[nodiscard]] std::uint8_t layerNumber() const { return recordHead[0]; }
};

// TO: one short text.
struct DisplayReport {
    std::uint32_t displayId = 0; // 0 for what an owner in the host reported
    std::string text;
    std::uint8_t layerNumber = 0;
};

// MV.
struct Verdict {
    std::int32_t value = 0;  // 0, or -52 when a flag is set
    std::uint32_t flags = 0; // NETFLOOR_FLAG_..., see flagNames() in text.h
    [[nodiscard]] bool fault() const { return value != 0; }
};

// How the value of a key field is to be shown.
enum class KeyType : std::uint8_t { number8, number16, number32, ipv4Address, ipv6Address };

// XTR: one key field that the packet has.
struct KeyValue {
    std::string name;
    std::uint32_t row = 0; // row of the key-field table
    KeyType type = KeyType::number32;
    std::uint32_t number = 0;         // every type but ipv6Address; an IPv4 address has its first octet on top
    std::vector<std::uint8_t> octets; // ipv6Address: as stored, that is with the nibbles of each octet exchanged
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
    std::uint32_t nesting = 0;      // how many hand-offs this one stands in
    std::uint32_t consumedBits = 0; // what the owner took
    bool refused = false;           // the owner refused; the pass was cut off
};

enum class Ending : std::uint8_t {
    complete,   // the pass ran to its end; bits may be left
    cutOff,     // storage ran out, an owner refused, or an address did not fit into the key record
    keysDenied, // XTR: the set-up of the key-field table was refused
};

// One pass over one packet. The lists that the pass does not fill stay empty.
struct Report {
    Pass pass = Pass::md;
    Ending ending = Ending::complete;
    std::int32_t result = 0;    // as the entry returned it
    std::uint32_t cursor = 0;   // of the decode state, at the end
    std::uint32_t bitsLeft = 0; // of the context: bits that were not decoded
    std::uint32_t flags = 0;

    std::vector<Block> blocks;           // MD
    std::vector<FieldReport> fields;     // MD
    std::vector<DisplayReport> displays; // TO
    Verdict verdict;                     // MV
    std::vector<KeyValue> keys;          // XTR, by row
    std::vector<LayerRecord> layers;     // MD and TO
    std::vector<HandOff> handOffs;       // all passes, in the order of their ends

    // What the decode state held at the end, for who compares plug-ins.
    std::uint32_t stateBitsLeft = 0;
    std::uint32_t blockDepth = 0;
    std::uint32_t limitDepth = 0;
    std::uint32_t layerIndex = 0;
    bool layerHandedOff = false;
    bool condition = false;
    std::uint8_t layerNumber = 0;
    std::uint32_t decoderId = 0;
    std::array<std::uint32_t, 32> scratch = {};

    // The blocks in which a field stands, from the outside in, joined by `separator`; blocks without a name
    // are left out.
    [[nodiscard]] std::string path(const FieldReport &field, std::string_view separator = "/") const;

    // The name of the innermost block of a field.
    [[nodiscard]] std::string_view blockName(const FieldReport &field) const {
        return field.block == Block::none ? std::string_view() : std::string_view(blocks[field.block].name);
    }

    // The first field, or key field, of that name, or null.
    [[nodiscard]] const FieldReport *field(std::string_view name) const;
    [[nodiscard]] const KeyValue *key(std::string_view name) const;
};

} // namespace netfloor
