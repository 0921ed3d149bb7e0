// SPDX-License-Identifier: MIT
// The key record: where the XTR pass stores the values of a packet's key fields.
//
// A plug-in may write an address at any 16-bit offset of the record, so the first 128 KiB are for addresses.
// Presence bits and values come after them, where no address can overwrite them.
#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <span>
#include <string_view>

#include <netfloor/records.h>

#include "netfloor-host/sink.h"

namespace netfloor {

// What a row of the key-field table holds.
struct KeyColumn {
    std::string_view name;
    KeyType type = KeyType::number32;
};

class KeyRecord {
public:
    // Fills the host's three words of each row.
    static void layOut(std::span<KeyFieldRow> table);

    // Room for all rows of a table that was laid out.
    static constexpr std::uint32_t mostRows = 256;

    KeyRecord();

    // Before a packet: no row is present. Values need not be cleared: only those of rows that are present are read.
    void reset();

    [[nodiscard]] std::uint8_t *octets() { return octets_.get(); }

    // Reports the rows whose presence bit is set, of a table with these columns. `byteAreaOffset` is that of the
    // context after the pass.
    void report(std::span<const KeyColumn> columns, std::uint16_t byteAreaOffset, Sink &sink) const;

private:
    std::unique_ptr<std::uint8_t[]> octets_;
};

} // namespace netfloor
