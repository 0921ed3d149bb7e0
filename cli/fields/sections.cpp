// SPDX-License-Identifier: MIT
#include <algorithm>
#include <array>
#include <cstdint>

#include "fields/fields.h"

namespace netfloor::cli {

namespace {

struct Section {
    std::uint32_t firstId;
    std::string_view title;
};

// The tables name no protocols. But they stand in the order of the grammar, so that the fields of one lie together,
// and a section starts with the id of its first field. A plug-in without that id goes on in the section before.
constexpr std::array sections = {
    Section{150, "IPv4"},
    Section{318, "IPv4 options"},
    Section{285, "Unknown protocols"},
    Section{531, "ICMP"},
    Section{384, "TCP"},
    Section{441, "TCP options"},
    Section{479, "UDP"},
    Section{629, "IP in IP"},
    Section{640, "Minimal encapsulation"},
    Section{692, "GRE"},
    Section{246, "ICMPv6"},
    Section{795, "SCTP"},
    Section{823, "SCTP INIT, INIT ACK"},
    Section{873, "SCTP SACK, HEARTBEAT"},
    Section{944, "SCTP ABORT, causes"},
    Section{884, "SCTP, other chunks"},
    Section{166, "IPv6"},
    Section{222, "IPv6 extensions"},
};

} // namespace

Fields listFields(const FieldTables &tables) {
    Fields fields;
    std::string_view title;
    for (const FieldDescription &field : tables.fields()) {
        const auto *const section = std::ranges::find(sections, field.id, &Section::firstId);
        title = section == sections.end() ? title : section->title;
        fields.push_back({&field, title});
    }
    return fields;
}

} // namespace netfloor::cli
