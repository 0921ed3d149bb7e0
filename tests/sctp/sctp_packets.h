// SPDX-License-Identifier: MIT
// SCTP packets (RFC 9260) and the fields after their common header.
#pragma once

#include <string>

#include <gtest/gtest.h>

#include "support/runs.h"

namespace netfloor::test {

// Ports 2905 and 2906, so that user data go to the owner of 2906; bit 257 is the first of the chunks.
inline Octets sctp(const Octets &chunks) {
    return ipv4({.protocol = 132, .payload = hex("0b 59 0b 5a 00 00 00 2a 00 00 00 00") + chunks});
}

// A chunk with its Length, and without padding.
inline Octets chunk(std::uint8_t type, const Octets &value) {
    return Octets{type, 0} + be16(static_cast<std::uint32_t>(value.size() + 4)) + value;
}

// As many of `octets` as have room.
inline Octets repeated(const char *octets, std::size_t room) {
    const Octets unit = hex(octets);
    Octets all;
    while (all.size() + unit.size() <= room) {
        all.insert(all.end(), unit.begin(), unit.end());
    }
    return all;
}

// The ids of the fields after the common header; * is a report of the host's owner at a hand-off.
inline std::string chunkIds(const Report &md) {
    std::string ids;
    bool afterHeader = false;
    for (const FieldReport &field : md.fields) {
        if (afterHeader) {
            ids += (ids.empty() ? "" : " ") + (field.id == 0 ? "*" : std::to_string(field.id));
        }
        afterHeader |= field.id == 798;
    }
    return ids;
}

// One packet, the ids of its fields after the ids in `front`, and its flags.
struct SctpCase {
    const char *what;
    Octets chunks;
    std::string ids;
    std::uint32_t mvFlags = 0;
    std::uint32_t mdFlags = 0; // flags that all passes raise
};

inline Runs checkCase(const SctpCase &one, const std::string &front = {}) {
    SCOPED_TRACE(one.what);
    Runs runs = runAll(sctp(one.chunks));
    EXPECT_EQ(chunkIds(runs.md), front + one.ids);
    EXPECT_EQ(runs.mv.flags, one.mvFlags);
    EXPECT_EQ(runs.md.flags, one.mdFlags);
    EXPECT_EQ(runs.md.ending, Ending::complete);
    EXPECT_EQ(runs.md.bitsLeft, 0u); // what no field covers is skipped
    return runs;
}

} // namespace netfloor::test
