// SPDX-License-Identifier: MIT
// Octets of data come as a field each. A few are shown one by one; more of them are taken back from the output and
// become one.
#pragma once

#include <cstdint>
#include <string_view>

#include "gaps.h"
#include "netfloor-host/sink.h"
#include "output.h"

namespace netfloor::cli {

struct DataRun {
    static constexpr std::uint32_t least = 5; // fewer octets are shown one by one

    std::uint32_t id = 0;
    std::string_view name;
    std::uint32_t first = 0; // octet
    std::uint32_t octets = 0;
    std::uint32_t depth = 0;
    Output::Mark start = 0; // of what was written of it, as long as there are few

    [[nodiscard]] bool isOne() const { return octets >= least; }
    [[nodiscard]] OctetSpan span() const { return {first, first + octets}; }

    // Starts at a field that is one octet, and is none at others.
    void begin(const FieldView &field, Output::Mark mark) {
        octets = 0;
        if (isOneOctet(field)) {
            *this = {field.id, field.name, octetOf(field), 1, field.depth, mark};
        }
    }

    [[nodiscard]] bool continues(const FieldView &field) const {
        return octets != 0 && field.id == id && isOneOctet(field) && octetOf(field) == first + octets &&
               field.depth == depth && (field.name.data() == name.data() || field.name == name);
    }

private:
    [[nodiscard]] static std::uint32_t octetOf(const FieldView &field) { return (field.ranges[0].firstBit - 1) / 8; }
    [[nodiscard]] static bool isOneOctet(const FieldView &field) {
        return field.ranges.size() == 1 && field.ranges[0].firstBit % bitsPerOctet == 1 &&
               field.ranges[0].lastBit - field.ranges[0].firstBit + 1 == bitsPerOctet;
    }
};

} // namespace netfloor::cli
