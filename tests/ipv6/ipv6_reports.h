// SPDX-License-Identifier: MIT
// The fields after the first IPv6 header, in short form.
#pragma once

#include <string>

#include <gtest/gtest.h>

#include "support/runs.h"

namespace netfloor::test {

constexpr std::size_t ipv6Fields = 11; // of a header, its version and both readings of each address

// The ids of the fields after the first header.
inline std::string idsAfterHeader(const Report &md) {
    std::string ids;
    for (std::size_t at = ipv6Fields; at < md.fields.size(); ++at) {
        ids += (ids.empty() ? "" : " ") + std::to_string(md.fields[at].id);
    }
    return ids;
}

// One payload, the fields after the header and the flags of the MV pass; the others raise none.
struct Ipv6Case {
    const char *what;
    std::uint8_t nextHeader;
    Octets payload;
    std::string ids;
    std::uint32_t mvFlags = 0;
};

inline void checkCase(const Ipv6Case &one) {
    SCOPED_TRACE(one.what);
    const Runs runs = runAll(ipv6({.nextHeader = one.nextHeader, .payload = one.payload}));
    EXPECT_EQ(idsAfterHeader(runs.md), one.ids);
    EXPECT_EQ(runs.mv.flags, one.mvFlags);
    EXPECT_EQ(runs.md.flags, 0u);
    EXPECT_EQ(runs.md.ending, Ending::complete);
    EXPECT_EQ(runs.md.bitsLeft, 0u); // what no field covers is skipped
}

} // namespace netfloor::test
