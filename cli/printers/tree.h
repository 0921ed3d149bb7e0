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
#include "printers/data_run.h"
#include "printers/field_text.h"
#include "text.h"

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
    void addToRun(const FieldView &field);
    void endRun();

    // An address is read a second time for its key, without a text.
    [[nodiscard]] bool isReadAgain(const FieldView &field) const;

    [[nodiscard]] static std::size_t indent(std::uint32_t depth) { return 2 * (std::size_t{depth} + 1); }
    void newLine(std::uint32_t depth, std::size_t extra = 0) {
        out_.blanks(indent(depth) + 2 * extra);
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
    void writeOpened(const FieldView &field);
    void writeField(const FieldView &field, std::uint32_t bits, std::string_view text);
    [[gnu::always_inline]] std::string_view shownOf(const FieldView &field, std::string_view text) {
        const std::string_view shown = withoutLeadingBlanks(text);
        return shown.empty() ? nameOf(field) : shown;
    }
    void writeText(const FieldView &field, std::string_view text) {
        depth_ = field.depth;
        out_.untrusted(shownOf(field, text), indent(field.depth));
    }
    void writeWithNumber(const FieldView &field, std::string_view text);
    // A field of more bits than a number holds.
    void writeWide(const FieldView &field, std::uint32_t bits, std::string_view text);
    void endField(const FieldView &field) {
        if (bits_ && !field.ranges.empty()) {
            writeFieldBits(field);
        }
        out_ << '\n';
    }
    void writeFieldBits(const FieldView &field);
    void writeOctets(std::string_view name, OctetSpan octets, std::uint32_t depth);

    bool all_;
    bool bits_;
    Output &out_;

    std::span<const std::uint8_t> packet_;
    GapFinder gaps_;
    DataRun run_;
    std::uint32_t depth_ = 0; // of the last line
    bool isReadToCut_ = false;
    std::uint32_t firstOctet_ = 0;
    std::optional<std::uint32_t> opened_;
    bool isOpenedShown_ = false;
    std::uint32_t addressBit_ = 0; // where the field before begins, if it is an IPv6 address
    std::string_view addressName_; // of that one
};

} // namespace netfloor::cli
