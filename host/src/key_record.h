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

    // The context's offset after the pass. An address that is complete ends at or before it.
    void setEnd(std::uint16_t byteAreaOffset) { end_ = byteAreaOffset; }

    // Reports the rows whose presence bit is set, of a table with these columns; with `other`, those that are the same
    // there.
    void report(std::span<const KeyColumn> columns, const KeyRecord *other, Sink &sink) const;

private:
    [[nodiscard]] bool has(std::size_t row) const;
    [[nodiscard]] KeyView view(std::size_t row, const KeyColumn &column) const;

    std::unique_ptr<std::uint8_t[]> octets_;
    std::uint16_t end_ = 0;
};

} // namespace netfloor
