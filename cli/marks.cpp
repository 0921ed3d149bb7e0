// SPDX-License-Identifier: MIT
#include "marks.h"

#include <algorithm>
#include <array>
#include <optional>
#include <string_view>

#include <netfloor/records.h>

#include "gaps.h"
#include "text.h"

namespace netfloor::cli {

namespace {

constexpr std::uint32_t bitsPerOctet = 8;

// A place in the packet where a flag was raised: behind a field, with the bits that were passed over there.
struct Place {
    const FieldReport *behind = nullptr;
    std::uint32_t skippedBits = 0;
};

// Marks that say nothing against a packet, by the field behind which they are raised.
struct UsualMark {
    std::uint32_t flag;
    std::uint32_t firstFieldId;
    std::uint32_t lastFieldId;
    std::uint32_t mostSkippedBits;
    std::string_view text;
};

constexpr std::array usualMarks = {
    // Each kind of option is asked for in turn, and each that does not come is an expectation not met.
    UsualMark{NETFLOOR_FLAG_EXPECTATION, 408, 478, 0, "every TCP header leaves it, as none has every kind of option"},
    UsualMark{NETFLOOR_FLAG_EXPECTATION, 698, 715, 0, "every GRE payload that is no HDLC frame leaves it"},
    // Behind TCP and UDP only more than 32 bits go to an owner of a next layer.
    UsualMark{NETFLOOR_FLAG_BITS_LEFT_OVER, 408, 478, 32, "a TCP payload of at most 4 octets stays unread"},
    UsualMark{NETFLOOR_FLAG_BITS_LEFT_OVER, 490, 490, 32, "a UDP payload of at most 4 octets stays unread"},
};

// Chunks whose reading ordinarily ends with a limit that is longer than what is left: a mark of design, as long as the
// packet holds all that their lengths say.
struct WideLimit {
    std::uint32_t lengthFieldId;
    std::string_view text;
};

constexpr std::string_view causesText =
    "a list of SCTP error causes leaves it, as another cause is looked for behind the last";
constexpr std::array wideLimits = {
    WideLimit{824, "an SCTP INIT at the end of a packet leaves it, as its limit lies one octet further"},
    WideLimit{910, causesText},
    WideLimit{946, causesText},
};
constexpr std::array<std::uint32_t, 11> causeLengthIds = {914, 917, 921, 923, 924, 926, 928, 929, 932, 934, 935};

// A chunk's type and flags, and a cause's code, stand in front of the Length and are counted by it.
constexpr std::uint32_t bitsInFrontOfLength = 16;

std::uint32_t lastBitOf(const FieldReport &field) {
    std::uint32_t last = 0;
    for (const ReportedRange &range : field.ranges) {
        last = std::max(last, range.lastBit);
    }
    return last;
}

// Where the MD pass raised the flag, which all passes raise there.
std::optional<Place> placeOfFlag(std::uint32_t flag, const Report &detail) {
    if ((detail.flags & flag) == 0) {
        return std::nullopt;
    }
    // A field carries the flags that were raised before it.
    const auto next = std::find_if(detail.fields.begin(), detail.fields.end(),
                                   [flag](const FieldReport &field) { return (field.flags & flag) != 0; });
    return Place{next == detail.fields.begin() ? nullptr : &*(next - 1), 0};
}

// Where bits were passed over first.
std::optional<Place> placeOfGap(const Report &detail) {
    const std::vector<Gap> gaps = findGaps(detail);
    if (gaps.empty()) {
        return std::nullopt;
    }
    const Gap &first = gaps.front();
    return Place{first.behind(detail), first.lastBit - first.firstBit + 1};
}

std::string placeText(const Place &place, const Report &detail) {
    if (place.behind == nullptr) {
        return {};
    }
    std::string text;
    if (place.skippedBits != 0) {
        text = ": " + countText(place.skippedBits / bitsPerOctet, "octet");
    }
    text += " behind '" + std::string(withoutLeadingBlanks(place.behind->name)) + "' at octet " +
            std::to_string((lastBitOf(*place.behind) - 1) / bitsPerOctet);
    if (const std::string path = detail.path(*place.behind); !path.empty()) {
        text += " (" + path + ")";
    }
    return text;
}

// The bit behind what a Length field counts.
std::uint32_t endBit(const FieldReport &length) {
    return length.ranges.front().firstBit - bitsInFrontOfLength + length.value * bitsPerOctet;
}

bool causesFit(const FieldReport &chunkLength, const Report &detail) {
    return std::none_of(detail.fields.begin(), detail.fields.end(), [&](const FieldReport &field) {
        const bool isCause = std::find(causeLengthIds.begin(), causeLengthIds.end(), field.id) != causeLengthIds.end();
        return isCause && !field.ranges.empty() &&
               field.ranges.front().firstBit > chunkLength.ranges.front().firstBit &&
               field.ranges.front().firstBit < endBit(chunkLength) && endBit(field) > endBit(chunkLength);
    });
}

const WideLimit *wideLimitOf(const Report &detail) {
    for (const WideLimit &limit : wideLimits) {
        for (const FieldReport &field : detail.fields) {
            if (field.id == limit.lengthFieldId && !field.ranges.empty() && endBit(field) <= detail.cursor &&
                causesFit(field, detail)) {
                return &limit;
            }
        }
    }
    return nullptr;
}

Mark explain(std::uint32_t flag, const Report &detail) {
    Mark mark{flag, MarkKind::damage, flagNames(flag).front()};
    if (flag == NETFLOOR_FLAG_LIMIT_TOO_LONG) {
        if (const WideLimit *const wide = wideLimitOf(detail)) {
            return {flag, MarkKind::byDesign, std::string(wide->text)};
        }
        return mark;
    }
    if (flag == NETFLOOR_FLAG_EXPECTATION && (detail.flags & flag) == 0) {
        mark.text += ": something is shorter than its count"; // which only the MV pass marks
        return mark;
    }
    const bool isGap = flag == NETFLOOR_FLAG_BITS_LEFT_OVER;
    mark.kind = isGap ? MarkKind::unread : MarkKind::damage;
    const auto place = isGap ? placeOfGap(detail) : placeOfFlag(flag, detail);
    if (!place || place->behind == nullptr) {
        return mark;
    }
    const auto *const usual = std::find_if(usualMarks.begin(), usualMarks.end(), [&](const UsualMark &row) {
        return row.flag == flag && row.firstFieldId <= place->behind->id && place->behind->id <= row.lastFieldId &&
               place->skippedBits <= row.mostSkippedBits;
    });
    if (usual != usualMarks.end()) {
        return {flag, MarkKind::byDesign, std::string(usual->text)};
    }
    mark.text += placeText(*place, detail);
    return mark;
}

} // namespace

std::vector<Mark> explainFlags(std::uint32_t flags, const Report &detail) {
    std::vector<Mark> marks;
    for (std::uint32_t flag = 1; flag != 0; flag <<= 1U) {
        if ((flags & flag) != 0) {
            marks.push_back(explain(flag, detail));
        }
    }
    return marks;
}

} // namespace netfloor::cli
