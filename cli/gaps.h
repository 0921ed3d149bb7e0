// SPDX-License-Identifier: MIT
// Octets that a pass went over and that no field covers.
#pragma once

#include <cstdint>
#include <vector>

#include "netfloor-host/reports.h"

namespace netfloor::cli {

struct Gap {
    std::size_t nextField = 0; // index of the field after it, or the number of fields
    std::uint32_t firstBit = 0;
    std::uint32_t lastBit = 0;

    // The field before it, or null.
    [[nodiscard]] const FieldReport *fieldBefore(const Report &detail) const {
        return nextField == 0 ? nullptr : &detail.fields[nextField - 1];
    }
};

// Of an MD report, in the order of the packet.
[[nodiscard]] std::vector<Gap> findGaps(const Report &detail);

} // namespace netfloor::cli
