// SPDX-License-Identifier: MIT
// What the flags of a verdict mean. A plug-in raises one flag for many reasons, and some packets have a flag although
// nothing is wrong with them. The place where the flag was raised tells one from the other.
#pragma once

#include <array>
#include <bit>
#include <cstdint>
#include <optional>
#include <span>
#include <string>
#include <string_view>
#include <vector>

#include "gaps.h"
#include "netfloor-host/field_knowledge.h"
#include "netfloor-host/plugin_host.h"
#include "output.h"

namespace netfloor::cli {

// In the order in which they count: a packet is what the worst of its findings is.
enum class FindingKind : std::uint8_t {
    byDesign, // says nothing against the packet
    unread,   // octets inside a length that the plug-in reads no field from: surplus, or a form that it does not know
    damage,
};

// A place in the packet where a flag was raised: after a field, with the octets that were skipped there.
struct FlagPlace {
    bool isKnown = false;
    std::uint32_t fieldId = 0;
    std::uint32_t lastOctet = 0; // of the field
    std::uint32_t skippedOctets = 0;
    std::string_view block; // the innermost one of the field
};

struct Finding {
    std::uint32_t flag = 0;
    FindingKind kind = FindingKind::damage;
    std::string_view why; // it is by design
    FlagPlace place;      // otherwise, where it is known
    bool isShortOfCount = false;
};

// Finds the places in an MD pass over the packet whose MV pass raised the flags. Every TCP header raises one by design,
// and in plain TCP packets that is always in the same place: for these, one such pass is enough.
class FlagExplainer final : public Sink {
public:
    explicit FlagExplainer(const FieldTables &tables); // which are to live longer

    // Adds one finding for each flag, and gives these. The packet begins at `firstOctet` of the one around it.
    [[nodiscard]] std::span<const Finding> explain(std::uint32_t flags, Host &host,
                                                   std::span<const std::uint8_t> packet, const RunOptions &options,
                                                   std::uint32_t firstOctet = 0);

    // All that were added since `clear`.
    [[nodiscard]] std::span<const Finding> findings() const { return findings_; }
    void clear() { findings_.clear(); }

    // What a finding says, and where it was raised.
    void write(Output &out, const Finding &finding) const;

    [[nodiscard]] bool wantsBlocks() const override { return false; }
    void begin(Pass pass, std::span<const std::uint8_t> packet) override;
    void field(const FieldView &field) override;
    void end(const PassEnd &end) override;

private:
    // A length that came, and the bits that it counts.
    struct Length {
        const LengthField *row;
        std::uint32_t firstBit;
        std::uint32_t endBit;
    };

    static constexpr std::size_t flagCount = 32;

    // Nothing that is still to come matters.
    [[nodiscard]] bool isSettled() const { return !wantsGap_ && !wantsLengths_ && (wanted_ & ~flags_) == 0; }
    void seeFlags(std::uint32_t flags);
    void seeLength(const FieldView &field);
    void seeGapBefore(std::uint32_t octet);
    [[nodiscard]] Finding finding(std::uint32_t flag) const;
    [[nodiscard]] bool innerLengthsFit(std::size_t outer) const;
    [[nodiscard]] const LengthField *lengthByDesign() const;

    const FieldTables &tables_;
    FieldKnowledge knowledge_;
    std::vector<std::string> flagNames_; // by bit
    std::vector<Finding> findings_;
    std::optional<Finding> plainTcp_; // that of all plain TCP packets, once one came

    // Of the pass.
    std::uint32_t firstOctet_ = 0;
    std::uint32_t wanted_ = 0; // flags to explain
    bool wantsGap_ = false;
    bool wantsLengths_ = false;
    std::uint32_t flags_ = 0; // raised so far
    std::uint32_t cursor_ = 0;
    FlagPlace last_; // the field before
    std::array<FlagPlace, flagCount> places_;
    FlagPlace gap_; // the first one
    GapFinder gaps_;
    std::vector<Length> lengths_;
};

} // namespace netfloor::cli
