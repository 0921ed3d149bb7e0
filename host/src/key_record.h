// SPDX-License-Identifier: MIT
// The key record: where the XTR pass stores the values of a packet's key fields.
//
// A plug-in writes an address at any 16-bit offset of the record and has no bound but the room for one, so
// the first 128 KiB belong to addresses. Presence bits and values stand behind them, out of its way.
#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <span>
#include <vector>

#include <netfloor/records.h>

#include "netfloor-host/reports.h"

namespace netfloor {

class KeyRecord {
public:
    // Fills the host's three words of each row.
    static void layOut(std::span<KeyFieldRow> table);

    // Room for all rows of a table that was laid out.
    static constexpr std::uint32_t mostRows = 256;

    KeyRecord();

    [[nodiscard]] std::uint8_t *octets() { return octets_.get(); }

    // The rows that are marked present, `types` those of all rows. `byteAreaOffset` is that of the context behind
    // the pass.
    [[nodiscard]] std::vector<KeyValue> values(std::span<const KeyFieldRow> table, std::span<const KeyType> types,
                                               std::uint16_t byteAreaOffset) const;

private:
    std::unique_ptr<std::uint8_t[]> octets_;
};

} // namespace netfloor
