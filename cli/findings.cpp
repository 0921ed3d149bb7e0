// SPDX-License-Identifier: MIT
#include "findings.h"

#include <algorithm>

#include <netfloor/records.h>

#include "netfloor-host/plain_tcp.h"
#include "text.h"

namespace netfloor::cli {

namespace {

std::size_t indexOf(std::uint32_t flag) {
    return static_cast<std::size_t>(std::countr_zero(flag));
}

} // namespace

FlagExplainer::FlagExplainer(const FieldTables &tables)
    : tables_(tables), knowledge_(tables.fields()), flagNames_(flagNames(~std::uint32_t{0})) {}

std::span<const Finding> FlagExplainer::explain(std::uint32_t flags, Host &host, std::span<const std::uint8_t> packet,
                                                const RunOptions &options, std::uint32_t firstOctet) {
    const std::size_t before = findings_.size();
    const bool isPlain =
        flags == NETFLOOR_FLAG_EXPECTATION && options.wireOctets <= packet.size() && isPlainTcp(packet);
    if (isPlain && plainTcp_) {
        findings_.push_back(*plainTcp_);
        return findings().subspan(before);
    }
    firstOctet_ = firstOctet;
    wanted_ = flags;
    wantsGap_ = (flags & NETFLOOR_FLAG_BITS_LEFT_OVER) != 0;
    wantsLengths_ = (flags & NETFLOOR_FLAG_LIMIT_TOO_LONG) != 0;
    host.run(Pass::md, packet, *this, options);
    for (std::uint32_t left = flags; left != 0; left &= left - 1) {
        findings_.push_back(finding(left & -left));
        findings_.back().place.lastOctet += firstOctet_;
    }
    if (isPlain && findings_.back().kind == FindingKind::byDesign) {
        plainTcp_ = findings_.back();
        plainTcp_->place = {}; // of this packet alone, and what is by design is told without it
    }
    return findings().subspan(before);
}

void FlagExplainer::begin(Pass /*pass*/, std::span<const std::uint8_t> /*packet*/) {
    flags_ = 0;
    last_ = {};
    gap_ = {};
    gaps_.reset();
    lengths_.clear();
}

void FlagExplainer::field(const FieldView &field) {
    if (field.flags != flags_) {
        seeFlags(field.flags);
    }
    if (isSettled()) {
        return;
    }
    const auto octets = octetsOf(field);
    if (wantsLengths_ && octets) {
        seeLength(field);
    }
    if (wantsGap_) {
        const std::uint32_t passed = (field.cursor - 1) / bitsPerOctet;
        seeGapBefore(octets ? std::min(octets->first, passed) : passed);
        if (octets) {
            gaps_.cover(*octets);
        }
    }
    last_ = {true, field.id, octets ? octets->end - 1 : last_.lastOctet, 0, field.blockName.view()};
}

// A field carries the flags that were raised before it. All passes raise a flag at the same place.
void FlagExplainer::seeFlags(std::uint32_t flags) {
    for (std::uint32_t raised = flags & ~flags_; raised != 0; raised &= raised - 1) {
        places_[indexOf(raised)] = last_;
    }
    flags_ = flags;
}

void FlagExplainer::seeLength(const FieldView &field) {
    if (const LengthField *const length = knowledge_.lengthField(field.id)) {
        lengths_.push_back({length, field.ranges.front().firstBit, length->endBit(field)});
    }
}

void FlagExplainer::seeGapBefore(std::uint32_t octet) {
    if (gap_.isKnown) {
        return;
    }
    if (const auto gap = gaps_.before(octet)) {
        gap_ = last_;
        gap_.skippedOctets = gap->octets;
    }
}

void FlagExplainer::end(const PassEnd &end) {
    seeFlags(end.state.flags);
    cursor_ = end.state.cursor;
    if (wantsGap_) {
        seeGapBefore((cursor_ - 1) / bitsPerOctet);
    }
}

Finding FlagExplainer::finding(std::uint32_t flag) const {
    Finding finding;
    finding.flag = flag;
    if (flag == NETFLOOR_FLAG_LIMIT_TOO_LONG) {
        if (const LengthField *const length = lengthByDesign()) {
            finding.kind = FindingKind::byDesign;
            finding.why = length->why;
        }
        return finding;
    }
    const bool wasRaised = (flags_ & flag) != 0;
    if (flag == NETFLOOR_FLAG_EXPECTATION && !wasRaised) {
        finding.isShortOfCount = true; // only the MV pass raises the flag for this
        return finding;
    }
    const bool isGap = flag == NETFLOOR_FLAG_BITS_LEFT_OVER;
    finding.kind = isGap ? FindingKind::unread : FindingKind::damage;
    if (isGap) {
        finding.place = gap_;
    } else if (wasRaised) {
        finding.place = places_[indexOf(flag)];
    }
    if (!finding.place.isKnown) {
        return finding;
    }
    const auto *const design =
        knowledge_.flagByDesign(flag, finding.place.fieldId, finding.place.skippedOctets * bitsPerOctet);
    if (design != nullptr) {
        finding.kind = FindingKind::byDesign;
        finding.why = design->why;
    }
    return finding;
}

// Whether each length inside the outer one ends no later than that.
bool FlagExplainer::innerLengthsFit(std::size_t outer) const {
    for (std::size_t i = outer + 1; i < lengths_.size() && lengths_[i].firstBit < lengths_[outer].endBit; ++i) {
        if (lengths_[i].row->why.empty() && lengths_[i].endBit > lengths_[outer].endBit) {
            return false;
        }
    }
    return true;
}

// The length whose limit is longer than what is left by design: the packet holds all that the length counts.
const LengthField *FlagExplainer::lengthByDesign() const {
    for (std::size_t i = 0; i < lengths_.size(); ++i) {
        const Length &length = lengths_[i];
        if (!length.row->why.empty() && length.endBit <= cursor_ && innerLengthsFit(i)) {
            return length.row;
        }
    }
    return nullptr;
}

void FlagExplainer::write(Output &out, const Finding &finding) const {
    if (finding.kind == FindingKind::byDesign) {
        out << finding.why;
        return;
    }
    out << flagNames_[indexOf(finding.flag)];
    if (finding.isShortOfCount) {
        out << ": something is shorter than its count";
    }
    const FlagPlace &place = finding.place;
    if (!place.isKnown) {
        return;
    }
    if (place.skippedOctets != 0) {
        (out << ": ").count(place.skippedOctets, "octet");
    }
    const FieldDescription *const field = tables_.find(place.fieldId);
    out << " after '" << (field == nullptr ? "data" : field->name) << "' at octet " << place.lastOctet;
    if (!place.block.empty()) {
        out << " (" << withoutLeadingBlanks(place.block) << ')';
    }
}

} // namespace netfloor::cli
