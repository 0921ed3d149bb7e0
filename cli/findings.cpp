// SPDX-License-Identifier: MIT
#include "findings.h"

#include <algorithm>
#include <optional>

#include <netfloor/records.h>

#include "gaps.h"
#include "text.h"

namespace netfloor::cli {

namespace {

constexpr std::uint32_t bitsPerOctet = 8;

// A place in the packet where a flag was raised: after a field, with the bits that were skipped there.
struct Place {
    const FieldReport *after = nullptr;
    std::uint32_t skippedBits = 0;
};

std::uint32_t lastBitOf(const FieldReport &field) {
    std::uint32_t last = 0;
    for (const ReportedRange &range : field.ranges) {
        last = std::max(last, range.lastBit);
    }
    return last;
}

// Where the MD pass raised the flag. All passes raise it there.
std::optional<Place> placeOfFlag(std::uint32_t flag, const Report &detail) {
    if ((detail.flags & flag) == 0) {
        return std::nullopt;
    }
    // A field carries the flags that were raised before it.
    const auto next = std::find_if(detail.fields.begin(), detail.fields.end(),
                                   [flag](const FieldReport &field) { return (field.flags & flag) != 0; });
    return Place{next == detail.fields.begin() ? nullptr : &*(next - 1), 0};
}

// Where bits were skipped first.
std::optional<Place> placeOfGap(const Report &detail) {
    const std::vector<Gap> gaps = findGaps(detail);
    if (gaps.empty()) {
        return std::nullopt;
    }
    const Gap &first = gaps.front();
    return Place{first.fieldBefore(detail), first.lastBit - first.firstBit + 1};
}

std::string placeText(const Place &place, const Report &detail) {
    std::string text;
    if (place.skippedBits != 0) {
        text = ": " + countText(place.skippedBits / bitsPerOctet, "octet");
    }
    text += " after '" + std::string(withoutLeadingBlanks(place.after->name)) + "' at octet " +
            std::to_string((lastBitOf(*place.after) - 1) / bitsPerOctet);
    if (const std::string path = detail.path(*place.after); !path.empty()) {
        text += " (" + path + ")";
    }
    return text;
}

// Whether each length inside `outer` ends no later than that.
bool innerLengthsFit(const FieldReport &outer, std::uint32_t endOfOuter, const Report &detail,
                     const FieldKnowledge &knowledge) {
    const std::uint32_t start = outer.ranges.front().firstBit;
    return std::none_of(detail.fields.begin(), detail.fields.end(), [&](const FieldReport &field) {
        const LengthField *const inner = knowledge.lengthField(field.id);
        if (inner == nullptr || !inner->why.empty() || field.ranges.empty()) {
            return false;
        }
        const std::uint32_t first = field.ranges.front().firstBit;
        return start < first && first < endOfOuter && inner->endBit(field) > endOfOuter;
    });
}

// The length whose limit is longer than what is left by design: the packet holds all that the length counts.
const LengthField *lengthByDesign(const Report &detail, const FieldKnowledge &knowledge) {
    for (const FieldReport &field : detail.fields) {
        const LengthField *const length = knowledge.lengthField(field.id);
        if (length == nullptr || length->why.empty() || field.ranges.empty()) {
            continue;
        }
        const std::uint32_t end = length->endBit(field);
        if (end <= detail.cursor && innerLengthsFit(field, end, detail, knowledge)) {
            return length;
        }
    }
    return nullptr;
}

Finding explain(std::uint32_t flag, const Report &detail, const FieldKnowledge &knowledge) {
    Finding finding{flag, FindingKind::damage, flagNames(flag).front()};
    if (flag == NETFLOOR_FLAG_LIMIT_TOO_LONG) {
        if (const LengthField *const length = lengthByDesign(detail, knowledge)) {
            return {flag, FindingKind::byDesign, std::string(length->why)};
        }
        return finding;
    }
    if (flag == NETFLOOR_FLAG_EXPECTATION && (detail.flags & flag) == 0) {
        finding.text += ": something is shorter than its count"; // only the MV pass raises the flag for this
        return finding;
    }
    const bool isGap = flag == NETFLOOR_FLAG_BITS_LEFT_OVER;
    finding.kind = isGap ? FindingKind::unread : FindingKind::damage;
    const auto place = isGap ? placeOfGap(detail) : placeOfFlag(flag, detail);
    if (!place || place->after == nullptr) {
        return finding;
    }
    if (const auto *const design = knowledge.flagByDesign(flag, place->after->id, place->skippedBits)) {
        return {flag, FindingKind::byDesign, std::string(design->why)};
    }
    finding.text += placeText(*place, detail);
    return finding;
}

} // namespace

std::vector<Finding> explainFlags(std::uint32_t flags, const Report &detail, const FieldKnowledge &knowledge) {
    std::vector<Finding> findings;
    for (std::uint32_t flag = 1; flag != 0; flag <<= 1U) {
        if ((flags & flag) != 0) {
            findings.push_back(explain(flag, detail, knowledge));
        }
    }
    return findings;
}

} // namespace netfloor::cli
