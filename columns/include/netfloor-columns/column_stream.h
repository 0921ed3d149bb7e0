// SPDX-License-Identifier: MIT
// A capture as columns: the rows of one table of netfloor-analysis/columns.h as Arrow record batches, for any program
// that takes an Arrow C stream.
//
//     netfloor::ColumnScan scan{.path = "traffic.pcap", .plugin = plugin, .table = netfloor::RowKind::chunk};
//     ArrowArrayStream stream;
//     netfloor::openColumns(scan, stream);
//     for (ArrowArray batch; stream.get_next(&stream, &batch) == 0 && batch.release != nullptr;) {
//         use(batch);
//         batch.release(&batch);
//     }
//     stream.release(&stream);
//
// The columns are those of the table, with '_' for the dot of a name: "ip_ttl". What a row does not have is null. The
// types:
//
//     boolean             bool
//     u8 u16 u32 u64      uint8 uint16 uint32 uint64
//     time                timestamp[ns, UTC]
//     text                string
//     octets              binary
//     address             string, dictionary-encoded with int32; or binary, 4 or 16 octets
#pragma once

#include <cstddef>
#include <filesystem>
#include <optional>
#include <string>
#include <vector>

#include "netfloor-analysis/columns.h"
#include "netfloor-capture/shards.h"
#include "netfloor-columns/arrow_abi.h"

namespace netfloor {

struct ColumnScan {
    std::string path;                      // of the capture
    std::optional<CapturePlan> shard = {}; // its first shard alone, instead of all of `path`
    std::filesystem::path plugin = {};
    RowKind table = RowKind::layer;
    std::vector<std::string> columns = {}; // "ip.ttl" or "ip_ttl"; none: all
    std::string where = {};                // the rows for which this condition holds, see condition.h
    bool binaryAddresses = false;
    // A batch ends after so many rows, or where its texts, addresses and octets reach so many octets.
    std::size_t batchRows = 65536;
    std::size_t batchOctets = 16777216;
};

// Throws std::invalid_argument for a column that is none, and ConditionError.
void checkScan(const ColumnScan &scan);

// The type of the batches. The caller releases it. Throws std::invalid_argument.
void columnSchema(const ColumnScan &scan, ArrowSchema &out);

// Begins to read. The caller releases the stream. Throws as checkScan does, CaptureError and PluginError.
//
// A stream loads the plug-in for itself, so that any number may be read at the same time; one stream serves one thread
// at a time. Memory is bounded for any capture. Where the capture is damaged, the rows of the packets before come
// first; then get_next gives EIO, and get_last_error names the file and the packet.
void openColumns(const ColumnScan &scan, ArrowArrayStream &out);

} // namespace netfloor
