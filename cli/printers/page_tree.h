// SPDX-License-Identifier: MIT
// The fields of one packet as items of the page, written while the MD pass goes.
#pragma once

#include <cstdint>
#include <span>
#include <string>
#include <string_view>

#include "gaps.h"
#include "netfloor-host/sink.h"
#include "printers/data_run.h"
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
    DataRun run_;
    std::uint32_t lastDepth_ = 0;
    bool isReadToCut_ = false;
    OctetSpan lastOctets_; // of the field before
    std::string text_;
};

} // namespace netfloor::cli
