// SPDX-License-Identifier: MIT
// The fields of one packet as a tree of blocks, written while the MD pass goes.
#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <span>
#include <string_view>

#include "gaps.h"
#include "netfloor-host/sink.h"
#include "options.h"
#include "output.h"

namespace netfloor::cli {

class Tree final : public Sink {
public:
    Tree(const Options &options, Output &out) : all_(options.all), bits_(options.bits), out_(out) {}

    // Of the next packet: where it begins in the outermost one, from where octets are counted, and where another one
    // begins in it, which is shown by itself.
    void place(std::uint32_t firstOctet, std::optional<std::uint32_t> opened) {
        firstOctet_ = firstOctet;
        opened_ = opened;
    }

    void begin(Pass pass, std::span<const std::uint8_t> packet) override;
    void blockOpened(const BlockView &block) override;
    void field(const FieldView &field) override;
    void notCaptured(const NotCaptured &first) override;
    void handOff(const HandOff &handOff) override;
    void layer(const LayerRecord &layer) override;
    void end(const PassEnd &end) override;

private:
    // Octets of data come as a field each. A few stand on lines of their own; more of them are taken back and shown as
    // one.
    struct Run {
        std::uint32_t id = 0;
        std::string_view name;
        std::uint32_t first = 0; // octet
        std::uint32_t octets = 0;
        std::uint32_t depth = 0;
        Output::Mark start = 0; // of the lines, as long as there are few
    };

    [[nodiscard]] bool continuesRun(const FieldView &field) const;
    void beginRun(const FieldView &field);
    void addToRun(const FieldView &field);
    void endRun();

    // An address is read a second time for its key, without a text.
    [[nodiscard]] bool isReadAgain(const FieldView &field, std::string_view text) const;

    void newLine(std::uint32_t depth, std::size_t extra = 0) {
        out_.blanks(2 * (std::size_t{depth} + 1 + extra));
        depth_ = depth;
    }
    void writeGapsBefore(std::uint32_t octet, std::uint32_t depth) {
        if (!gaps_.isCovered(octet)) {
            writeGaps(octet, depth);
        }
    }
    void writeGaps(std::uint32_t octet, std::uint32_t depth);
    void writePlace(OctetSpan octets);
    // A field of octets that hold the packet that was opened.
    void writeOpened(const FieldView &field, OctetSpan octets);
    void writeField(const FieldView &field, std::string_view text);
    void writeOctets(std::string_view name, OctetSpan octets, std::uint32_t depth);

    bool all_;
    bool bits_;
    Output &out_;

    std::span<const std::uint8_t> packet_;
    GapFinder gaps_;
    Run run_;
    std::uint32_t depth_ = 0; // of the last line
    bool isReadToCut_ = false;
    std::uint32_t firstOctet_ = 0;
    std::optional<std::uint32_t> opened_;
    bool isOpenedShown_ = false;
    std::string_view addressName_; // of the field before, if it is an IPv6 address
    std::uint32_t addressBit_ = 0;
};

} // namespace netfloor::cli
