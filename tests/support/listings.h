// SPDX-License-Identifier: MIT
// What MD and TO reported in short form, for tests of many fields.
#pragma once

#include <cstdint>
#include <sstream>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "support/runs.h"

namespace netfloor::test {

// One line a field, after the first field of id `after`: the line of MD, then that of TO.
//     542 |6 | "Code" "Code=0" 169-176 > 542 "0"
inline std::string fieldLines(const Runs &runs, std::uint32_t after) {
    const std::string start = std::to_string(after) + ' ';
    std::istringstream md(lines(runs.md));
    std::istringstream to(lines(runs.to));
    std::string result;
    bool found = false;
    for (std::string long_, short_; std::getline(md, long_) && std::getline(to, short_);) {
        if (found) {
            result += long_ + " > " + short_ + '\n';
        }
        found = found || long_.starts_with(start);
    }
    return result;
}

// Id and value in hexadecimal, of the fields after the first one of id `after`: "447=2 448=4 451=5b4".
inline std::string fieldValues(const Report &md, std::uint32_t after) {
    std::ostringstream out;
    bool found = false;
    for (const FieldReport &field : md.fields) {
        if (found && field.id != 0) {
            out << (out.tellp() > 0 ? " " : "") << std::dec << field.id << '=' << std::hex << field.value;
        }
        found = found || field.id == after;
    }
    return out.str();
}

// A packet, the values of its fields after a certain one, and the flags that it leaves.
struct ValuesCase {
    const char *name;
    Octets packet;
    const char *values;
    std::uint32_t flagsOfMd, flagsOfMv;
};

inline void expectValues(std::uint32_t after, const std::vector<ValuesCase> &cases) {
    for (const ValuesCase &one : cases) {
        SCOPED_TRACE(one.name);
        const Runs runs = runAll(one.packet);
        EXPECT_EQ(fieldValues(runs.md, after), one.values);
        EXPECT_EQ(runs.md.flags, one.flagsOfMd);
        EXPECT_EQ(runs.mv.flags, one.flagsOfMv);
    }
}

} // namespace netfloor::test
