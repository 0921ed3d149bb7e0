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
        text = ": " + std::to_string(place.skippedBits / bitsPerOctet) + " octets";
    }
    const auto nameStart = place.behind->name.find_first_not_of(' ');
    text += " behind '" + (nameStart == std::string::npos ? place.behind->name : place.behind->name.substr(nameStart)) +
            "' at octet " + std::to_string((lastBitOf(*place.behind) - 1) / bitsPerOctet);
    if (const std::string path = detail.path(*place.behind); !path.empty()) {
        text += " (" + path + ")";
    }
    return text;
}

} // namespace

std::vector<Mark> explainFlags(std::uint32_t flags, const Report &detail) {
    std::vector<Mark> marks;
    for (std::uint32_t flag = 1; flag != 0; flag <<= 1U) {
        if ((flags & flag) == 0) {
            continue;
        }
        const auto place = flag == NETFLOOR_FLAG_BITS_LEFT_OVER ? placeOfGap(detail) : placeOfFlag(flag, detail);
        Mark mark{flag, false, flagNames(flag).front()};
        if (place && place->behind != nullptr) {
            const auto *const usual = std::find_if(usualMarks.begin(), usualMarks.end(), [&](const UsualMark &row) {
                return row.flag == flag && row.firstFieldId <= place->behind->id &&
                       place->behind->id <= row.lastFieldId && place->skippedBits <= row.mostSkippedBits;
            });
            mark.byDesign = usual != usualMarks.end();
            mark.text += mark.byDesign ? ": " + std::string(usual->text) : placeText(*place, detail);
        }
        marks.push_back(std::move(mark));
    }
    return marks;
}

} // namespace netfloor::cli
