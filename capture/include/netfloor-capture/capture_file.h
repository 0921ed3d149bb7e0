// SPDX-License-Identifier: MIT
// Reads a capture: pcap or pcapng, packed with gzip or not, from a file or from standard input.
//
//     netfloor::CaptureFile capture("traffic.pcap");
//     netfloor::CapturedPacket packet;
//     while (capture.next(packet)) {
//         const netfloor::NetworkPart network = netfloor::findNetworkPart(packet.linkType, packet.octets);
//     }
//
// Memory is bounded for any file, and nothing is allocated for a packet unless it is the largest so far.
#pragma once

#include <memory>
#include <optional>
#include <string>

#include "netfloor-capture/errors.h"
#include "netfloor-capture/packet.h"
#include "netfloor-capture/shards.h"

namespace netfloor {

class CaptureFile {
public:
    // "-" is standard input. Throws CaptureError.
    explicit CaptureFile(const std::string &path);
    // One shard of a capture, counted from 0. Its packets are those of the whole capture, with their numbers. Throws
    // CaptureError, also where the file is not as it was when it was planned.
    CaptureFile(const CapturePlan &plan, std::size_t shard);
    ~CaptureFile();
    CaptureFile(CaptureFile &&) noexcept;
    CaptureFile &operator=(CaptureFile &&) noexcept;
    CaptureFile(const CaptureFile &) = delete;
    CaptureFile &operator=(const CaptureFile &) = delete;

    // The next packet, or false at the end. Throws CaptureDamage.
    [[nodiscard]] bool next(CapturedPacket &packet);

    // Whether `next` answers at once. False where the program that makes the packets is to write first.
    [[nodiscard]] bool isNextHere() const;

    // The path, or "standard input".
    [[nodiscard]] const std::string &name() const;

    // A sentence on what is wrong with the file although it was read; empty where nothing is so far.
    [[nodiscard]] std::string note() const;

    // Whether the packets come from a program as they are made.
    [[nodiscard]] bool isLive() const;

    // The share of the file that has been read, 0 to 1, or none where its size is not known.
    [[nodiscard]] std::optional<double> progress() const;

private:
    struct Parts;
    std::unique_ptr<Parts> parts_;
};

} // namespace netfloor
