// SPDX-License-Identifier: MIT
#include "marks.h"

#include <algorithm>
#include <array>
#include <optional>
#include <string_view>

#include <netfloor/records.h>

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

// Limits that reach a little further than the length they are taken from: a mark of a packet that ends there, as long
// as it holds all that the length says.
struct WideLimit {
    std::uint32_t lengthFieldId;
    std::uint32_t bitsInFront; // that the length counts and that stand in front of its field
    std::string_view text;
};

constexpr std::array wideLimits = {
    WideLimit{824, 16, "an SCTP INIT at the end of a packet leaves it, as its limit lies one octet further"},
};

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

// Where bits were passed over: the first stretch in front of the cursor that no field covers.
std::optional<Place> placeOfGap(const Report &detail) {
    std::uint32_t covered = 0;
    Place place;
    for (const FieldReport &field : detail.fields) {
        for (const ReportedRange &range : field.ranges) {
            // Fields of one octet come from the top down, so a gap is one of whole octets.
            if (range.firstBit > covered + bitsPerOctet) {
                place.skippedBits = range.firstBit - covered - 1;
                return place;
            }
            covered = std::max(covered, range.lastBit);
        }
        place.behind = &field;
    }
    if (detail.cursor <= covered + 1) {
        return std::nullopt;
    }
    place.skippedBits = detail.cursor - covered - 1;
    return place;
}

std::string placeText(const Place &place, const Report &detail) {
    if (place.behind == nullptr) {
        return {};
    }
    std::string text;
    if (place.skippedBits != 0) {
        const std::uint32_t octets = place.skippedBits / bitsPerOctet;
        text = ": " + std::to_string(octets) + (octets == 1 ? " octet" : " octets");
    }
    const auto nameStart = place.behind->name.find_first_not_of(' ');
    text += " behind '" + (nameStart == std::string::npos ? place.behind->name : place.behind->name.substr(nameStart)) +
            "' at octet " + std::to_string((lastBitOf(*place.behind) - 1) / bitsPerOctet);
    if (const std::string path = detail.path(*place.behind); !path.empty()) {
        text += " (" + path + ")";
    }
    return text;
}

// Whether the flag that a limit leaves comes from one that is wide, in a packet that is whole.
const WideLimit *wideLimitOf(const Report &detail) {
    for (const WideLimit &limit : wideLimits) {
        for (const FieldReport &field : detail.fields) {
            if (field.id == limit.lengthFieldId && !field.ranges.empty() &&
                field.ranges.front().firstBit - limit.bitsInFront + field.value * bitsPerOctet <= detail.cursor) {
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
