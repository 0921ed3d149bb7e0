// SPDX-License-Identifier: MIT
// Cuts a capture into shards: ranges of octets that hold whole packets, and that several programs can read at once.
//
//     const netfloor::CapturePlan plan = netfloor::planShards("traffic.pcap", 1'000'000'000);
//     netfloor::CaptureFile third(plan, 2); // its packets alone, with the numbers of the whole capture
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "netfloor-capture/packet.h"
#include "netfloor-capture/time_text.h"

namespace netfloor {

// A place between two packets, and what a reader must know to go on there.
struct ReadingPlace {
    std::uint64_t position = 0; // octet of the capture
    std::uint64_t packets = 0;  // in front of it
    // pcapng: where the section begins, and how many of its interfaces are described in front of the place.
    std::uint64_t section = 0;
    std::uint64_t interfaces = 0;
};

struct Shard {
    ReadingPlace begin;
    std::optional<std::uint64_t>
        end; // octet at which the next shard begins; none: it goes on to the end of the capture
    std::uint64_t packets = 0;
    std::optional<CaptureTime> firstTime; // of its first packet
    TimeStart timeStart;                  // of the capture, by the packets in front of the shard
};

// The blocks of a section that describe its interfaces, by their octets in the file.
struct SectionBlocks {
    std::uint64_t begin = 0;
    std::vector<std::uint64_t> interfaces; // as many as a reader keeps
};

// What a file was when it was planned. One that has changed since is refused.
struct FileState {
    std::uint64_t octets = 0;
    std::int64_t modified = 0; // nanoseconds since 1970
    std::string start;         // its first octets

    bool operator==(const FileState &) const = default;
};

struct CapturePlan {
    std::string path;
    FileState file;
    bool isPacked = false; // with gzip, which can be read from its start alone: there is one shard
    std::vector<SectionBlocks> sections;
    std::vector<Shard> shards; // at least one
    std::string damage;        // at which the last shard ends, as a sentence, or empty
};

// Reads the capture once. A shard ends with the first packet that ends past a multiple of `shardOctets`; there is none
// without a packet, unless the capture has none. Throws CaptureError, also for what is no file that can be read twice.
[[nodiscard]] CapturePlan planShards(const std::string &path, std::uint64_t shardOctets);

} // namespace netfloor
