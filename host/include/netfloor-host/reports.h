// SPDX-License-Identifier: MIT
// What a pass reported about one packet, kept as plain records, and the sink that keeps them. It is for tests and for
// programs that need a packet as a whole. An output that needs each report only once is a sink of its own, see sink.h.
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "netfloor-host/sink.h"

namespace netfloor {

// One piece of a field.
struct ReportedRange {
    std::uint32_t value;
    std::uint32_t firstBit;
    std::uint32_t lastBit;

    friend bool operator==(const ReportedRange &, const ReportedRange &) = default;
};

// A named part of the packet in which fields were read. A block in which no field was read directly, but only
// in blocks inside it, has an empty name: a plug-in gives a block's name with its fields.
struct Block {
    static constexpr std::size_t none = static_cast<std::size_t>(-1);

    std::string name;
    std::size_t parent = none; // index of the enclosing block in Report::blocks
    std::uint32_t firstBit = 0;
};

// MD: one field.
struct FieldReport {
    std::uint32_t id = 0; // 0 for what an owner in the host reported
    std::string name;     // unchanged, leading blanks included
    std::string text;     // the display line; may be empty
    std::uint32_t value = 0;
    std::vector<ReportedRange> ranges; // in the order in which they were read
    std::uint32_t bitOrder = 0;        // 8 where the bits of each octet were read reversed
    std::uint32_t flags = 0;           // of the decode state: what was raised before it was reported
    std::size_t block = Block::none;   // index in Report::blocks
    // What the plug-in wrote into the head of the host's field record: the layer number, then two octets
    // that are 0, or 0xff where the plug-in did not write them.
    std::array<std::uint8_t, 3> recordHead = {};

    [[nodiscard]] std::uint8_t layerNumber() const { return recordHead[0]; }
};

// TO: one short text.
struct DisplayReport {
    std::uint32_t displayId = 0; // 0 for what an owner in the host reported
    std::string text;
    std::uint8_t layerNumber = 0;
};

// XTR: one key field that the packet has.
struct KeyValue {
    std::string name;
    std::uint32_t row = 0; // row of the key-field table
    KeyType type = KeyType::number32;
    std::uint32_t number = 0;         // every type but ipv6Address; an IPv4 address has its first octet on top
    std::vector<std::uint8_t> octets; // ipv6Address: as stored, that is with the nibbles of each octet exchanged

    // So that functions for a KeyView, such as keyText(), take it as well.
    operator KeyView() const { return {name, row, type, number, octets}; } // NOLINT(*-explicit-*)
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

    // What the decode state held at the end, for programs that compare plug-ins.
    std::uint32_t stateBitsLeft = 0;
    std::uint32_t blockDepth = 0;
    std::uint32_t limitDepth = 0;
    std::uint32_t layerIndex = 0;
    bool layerHandedOff = false;
    bool condition = false;
    std::uint8_t layerNumber = 0;
    std::uint32_t decoderId = 0;
    std::array<std::uint32_t, 32> scratch = {};

    // The names of the blocks around a field, the outermost first, joined by `separator`. Blocks without a name
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

// Keeps all of one pass in `report`, which has to outlive it. An owner may read there what was reported so far.
class ReportSink final : public Sink {
public:
    explicit ReportSink(Report &report) : report_(report) {}

    void begin(Pass pass, std::span<const std::uint8_t> packet) override;
    void field(const FieldView &field) override;
    void text(const ShortTextView &text) override;
    void key(const KeyView &key) override;
    void layer(const LayerRecord &layer) override;
    void handOff(const HandOff &handOff) override;
    void end(const PassEnd &end) override;

private:
    void keepBlocks(std::span<const BlockView> blocks);

    Report &report_;
};

} // namespace netfloor
