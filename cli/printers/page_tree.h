// SPDX-License-Identifier: MIT
// The fields of one packet as items of the page, written while the MD pass goes.
#pragma once

#include <cstdint>
#include <span>
#include <string>
#include <string_view>

#include "gaps.h"
#include "netfloor-host/sink.h"
#include "printers/page_data.h"

namespace netfloor::cli {

class PageTree final : public Sink {
public:
    PageTree(Output &out, PageItems &items) : out_(out), items_(items) {}

    // Where the packet of the next pass begins, as an octet of the packet that the page shows, and how deep its tree
    // stands.
    void place(std::uint32_t octet, std::uint32_t depth) {
        octet_ = octet;
        depth_ = depth;
    }

    void begin(Pass pass, std::span<const std::uint8_t> packet) override;
    void blockOpened(const BlockView &block) override;
    void field(const FieldView &field) override;
    void notCaptured(const NotCaptured &first) override;
    void handOff(const HandOff &handOff) override;
    void end(const PassEnd &end) override;

private:
    // Octets of data come as a field each. More than a few are taken back and become one item.
    struct Run {
        std::uint32_t id = 0;
        std::string_view name;
        std::uint32_t first = 0; // octet
        std::uint32_t octets = 0;
        std::uint32_t depth = 0;
        Output::Mark start = 0; // of the items, as long as there are few
    };

    [[nodiscard]] bool continuesRun(const FieldView &field) const;
    void addToRun(const FieldView &field);
    void endRun();
    void writeGapsBefore(std::uint32_t octet, std::uint32_t depth);
    void writeField(const FieldView &field);
    [[nodiscard]] std::string_view valueOf(const FieldView &field, std::string_view shown);
    void writeOctets(PageItems::Kind kind, std::string_view label, OctetSpan octets, std::uint32_t depth);
    void writeNote(PageItems::Kind kind, std::uint32_t depth, std::string_view label, std::string_view text);

    Output &out_;
    PageItems &items_;
    std::uint32_t octet_ = 0;
    std::uint32_t depth_ = 0;

    std::span<const std::uint8_t> packet_;
    GapFinder gaps_;
    Run run_;
    std::uint32_t lastDepth_ = 0;
    bool isReadToCut_ = false;
    OctetSpan lastOctets_; // of the field before
    std::string text_;
};

} // namespace netfloor::cli
