// SPDX-License-Identifier: MIT
#include "netfloor-host/field_knowledge.h"

#include <algorithm>
#include <array>

#include <netfloor/records.h>

namespace netfloor {
namespace {

// The sections, each with its first and its last field. A new protocol needs a row here.
constexpr std::array sections = {
    FieldSpan{"IPv4", {"Version", 150}, {"Destination Address"}},
    FieldSpan{"IPv4 options", {"Type1, No Operation"}, {"Padding", 306}},
    FieldSpan{"Unknown protocols", {"Unknown Protocol Data"}, {"Unknown Protocol Data"}},
    FieldSpan{"ICMP", {"ICMP Message Type", 531}, {"ICMP Reserved Data"}},
    FieldSpan{"TCP", {"TCP Source Port"}, {"Urgent Pointer"}},
    FieldSpan{"TCP options", {"TCP Option Kind=0 (End of Option List)"}, {"Padding", 439}},
    FieldSpan{"UDP", {"UDP Source Port"}, {"Checksum", 490}},
    FieldSpan{"IP in IP", {"Version", 629}, {"Original Dest Address", 637}},
    FieldSpan{"Minimal encapsulation", {"MIPinIP Protocol"}, {"Original Src Address", 651}},
    FieldSpan{"GRE", {"Checksum Present"}, {"GRE Payload"}},
    FieldSpan{"ICMPv6", {"Message Type"}, {"Data ", 282}},
    FieldSpan{"SCTP", {"SCTP Source Port Number"}, {"Payload Protocol Identifier"}},
    FieldSpan{"SCTP INIT, INIT ACK", {"Chunk Flags", 823}, {"Value"}},
    FieldSpan{"SCTP SACK, HEARTBEAT", {"Chunk Flags", 873}, {"Chunk Flags", 940}},
    FieldSpan{"SCTP ABORT, causes", {"Reserved", 944}, {"Unknown Cause"}},
    FieldSpan{"SCTP, other chunks", {"Chunk flags", 884}, {"Reserved contents"}},
    FieldSpan{"IPv6", {"Traffic Class"}, {"Destination IP Address", 954}},
    FieldSpan{"IPv6 extensions", {"Header Extention length"}, {"Authentication Data"}},
};

// Key fields that are addresses or masks. The plug-in's tables display them as numbers.
struct KnownKeyType {
    std::string_view section;
    FieldName field;
    KeyType type;
};
constexpr std::array keyTypes = {
    KnownKeyType{"ICMP", {"Address Mask"}, KeyType::ipv4Address},
};

constexpr std::uint32_t fourOctets = 32;
constexpr FieldSpan endOfTcpHeader{"TCP", {"Urgent Pointer"}, {"Urgent Pointer"}};
constexpr FieldSpan tcpOptions{"TCP options", {"TCP Option Kind=0 (End of Option List)"}, {"Padding"}};
constexpr std::string_view tcpOptionsWhy = "every TCP header leaves it, as none has every kind of option";
constexpr std::string_view tcpPayloadWhy = "a TCP payload of at most 4 octets stays unread";

constexpr std::array designedFlags = {
    // The plug-in asks for each kind of option in turn. Each kind that is missing is an expectation not met.
    FlagByDesign{NETFLOOR_FLAG_EXPECTATION, endOfTcpHeader, 0, tcpOptionsWhy},
    FlagByDesign{NETFLOOR_FLAG_EXPECTATION, tcpOptions, 0, tcpOptionsWhy},
    FlagByDesign{NETFLOOR_FLAG_EXPECTATION,
                 {"GRE", {"GRE Protocol"}, {"Sequence Number"}},
                 0,
                 "every GRE payload that is no HDLC frame leaves it"},
    // After TCP and UDP, only more than 32 bits go to an owner of a next layer.
    FlagByDesign{NETFLOOR_FLAG_BITS_LEFT_OVER, endOfTcpHeader, fourOctets, tcpPayloadWhy},
    FlagByDesign{NETFLOOR_FLAG_BITS_LEFT_OVER, tcpOptions, fourOctets, tcpPayloadWhy},
    FlagByDesign{NETFLOOR_FLAG_BITS_LEFT_OVER,
                 {"UDP", {"Checksum"}, {"Checksum"}},
                 fourOctets,
                 "a UDP payload of at most 4 octets stays unread"},
};

// A chunk's type and flags, and a cause's code, are before the length and counted by it.
constexpr std::uint32_t sctpHead = 16;
constexpr std::string_view causesWhy =
    "a list of SCTP error causes leaves it, as the plug-in tries to read one cause more after the last";
constexpr std::array lengthFields = {
    LengthField{"SCTP INIT, INIT ACK",
                {"Length", 824},
                sctpHead,
                "an SCTP INIT at the end of a packet leaves it, as its limit lies one octet further"},
    LengthField{"SCTP, other chunks", {"Chunk Length"}, sctpHead, causesWhy},
    LengthField{"SCTP ABORT, causes", {"Chunk Length"}, sctpHead, causesWhy},
    LengthField{"SCTP ABORT, causes", {"Length"}, sctpHead, {}},
    LengthField{"SCTP ABORT, causes", {"Cause Length"}, sctpHead, {}},
};

} // namespace

std::uint32_t LengthField::endBit(const FieldView &view) const {
    return view.ranges.front().firstBit - bitsBefore + view.value * bitsPerOctet;
}

std::optional<KeyType> knownKeyType(std::string_view keyFieldName) {
    const auto *const row = std::ranges::find(keyTypes, keyFieldName, [](const auto &key) { return key.field.name; });
    return row == keyTypes.end() ? std::nullopt : std::optional(row->type);
}

FieldKnowledge::FieldKnowledge(Fields fields) {
    addSections(fields);
    addFlags(fields);
    addLengths(fields);
    checkKeyTypes(fields);
}

std::string_view FieldKnowledge::section(std::uint32_t fieldId) const {
    const auto found = known_.find(fieldId);
    return found == known_.end() ? std::string_view() : found->second.section;
}

const FlagByDesign *FieldKnowledge::flagByDesign(std::uint32_t flag, std::uint32_t fieldId,
                                                 std::uint32_t unreadBits) const {
    const auto found = known_.find(fieldId);
    if (found == known_.end()) {
        return nullptr;
    }
    const auto &flags = found->second.flags;
    const auto row = std::ranges::find_if(flags, [&](const FlagByDesign *candidate) {
        return candidate->flag == flag && unreadBits <= candidate->mostUnreadBits;
    });
    return row == flags.end() ? nullptr : *row;
}

const LengthField *FieldKnowledge::lengthField(std::uint32_t fieldId) const {
    const auto found = known_.find(fieldId);
    return found == known_.end() ? nullptr : found->second.length;
}

void FieldKnowledge::addSections(Fields fields) {
    for (const FieldSpan &span : sections) {
        for (const FieldDescription &field : locate(fields, span)) {
            const bool isNew = known_.try_emplace(field.id, Known{span.section, nullptr, {}}).second;
            if (!isNew) {
                miss(span.section, {field.name, field.id}, "is in two sections");
            }
        }
    }
    for (const FieldDescription &field : fields) {
        if (!known_.contains(field.id)) {
            miss({}, {field.name, field.id}, "is in no section: add a row, or move an end, in 'sections'");
        }
    }
}

void FieldKnowledge::addFlags(Fields fields) {
    for (const FlagByDesign &row : designedFlags) {
        for (const FieldDescription &field : locate(fieldsOf(fields, row.after.section), row.after)) {
            known_[field.id].flags.push_back(&row);
        }
    }
}

void FieldKnowledge::addLengths(Fields fields) {
    for (const LengthField &row : lengthFields) {
        bool isFound = false;
        for (const FieldDescription &field : fieldsOf(fields, row.section)) {
            if (row.field.fits(field)) {
                known_[field.id].length = &row;
                isFound = true;
            }
        }
        if (!isFound) {
            miss(row.section, row.field, "is a length, but no field");
        }
    }
}

void FieldKnowledge::checkKeyTypes(Fields fields) {
    for (const KnownKeyType &row : keyTypes) {
        const FieldDescription *const field = only(fieldsOf(fields, row.section), row.section, row.field);
        if (field != nullptr && field->keyIndex == 0) {
            miss(row.section, row.field, "has a key type, but is no key field");
        }
    }
}

FieldKnowledge::Fields FieldKnowledge::locate(Fields fields, const FieldSpan &span) {
    const FieldDescription *const first = only(fields, span.section, span.first);
    const FieldDescription *const last = only(fields, span.section, span.last);
    if (first == nullptr || last == nullptr) {
        return {};
    }
    if (last < first) {
        miss(span.section, span.last, "is the last field of the row, but comes before its first");
        return {};
    }
    return {first, last + 1};
}

const FieldDescription *FieldKnowledge::only(Fields fields, std::string_view section, const FieldName &name) {
    const auto fits = [&name](const FieldDescription &field) { return name.fits(field); };
    const auto found = std::ranges::find_if(fields, fits);
    if (found == fields.end()) {
        miss(section, name, "is no field of the plug-in there");
        return nullptr;
    }
    if (std::any_of(found + 1, fields.end(), fits)) {
        miss(section, name, "is the name of several fields: add the id");
        return nullptr;
    }
    return &*found;
}

FieldKnowledge::Fields FieldKnowledge::fieldsOf(Fields fields, std::string_view section) const {
    const auto isInside = [&](const FieldDescription &field) { return this->section(field.id) == section; };
    const auto first = std::ranges::find_if(fields, isInside);
    return {first, std::find_if_not(first, fields.end(), isInside)};
}

void FieldKnowledge::miss(std::string_view section, const FieldName &name, std::string_view what) {
    std::string text = section.empty() ? "" : std::string(section) + ": ";
    text.append("'").append(name.name).append("'");
    text += name.id == 0 ? "" : " (" + std::to_string(name.id) + ")";
    mismatches_.push_back(text.append(" ").append(what));
}

} // namespace netfloor
