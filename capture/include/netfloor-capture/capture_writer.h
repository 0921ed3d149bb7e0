// SPDX-License-Identifier: MIT
// Writes packets into a pcapng file (draft-ietf-opsawg-pcapng), as they were captured.
//
//     netfloor::CaptureWriter writer("some.pcapng");
//     while (capture.next(packet)) {
//         writer.write(packet);
//     }
//     writer.finish();
#pragma once

#include <compare>
#include <cstdint>
#include <filesystem>
#include <fstream>
#include <map>
#include <string>
#include <string_view>

#include "netfloor-capture/packet.h"

namespace netfloor {

class CaptureWriter {
public:
    // Creates the file, or empties it. Throws CaptureWriteError, as all do here.
    explicit CaptureWriter(const std::filesystem::path &path);

    // Adds the packet with its octets, length on the wire, time, link type, name of the interface and comments. A
    // packet without a time gets that of the packet before, or of 1970: pcapng has no other way.
    void write(const CapturedPacket &packet);

    // All packets are in the file. One that is not called leaves the last ones out.
    void finish();

private:
    // pcapng has these for an interface, and not for a packet.
    struct Interface {
        int linkType = 0;
        std::uint8_t timeDigits = 0;
        std::int64_t timeOffset = 0; // seconds
        std::string name;

        auto operator<=>(const Interface &) const = default; // NOLINT(modernize-use-nullptr): taken for a null
    };

    [[nodiscard]] std::uint32_t numberOf(const Interface &interface);
    void startBlock(std::uint32_t type);
    void endBlock();
    void addOption(std::uint16_t code, std::string_view value);
    template <typename Number>
    void add(Number number);
    void addPadded(std::string_view octets);

    std::filesystem::path path_;
    std::ofstream file_;
    std::string block_; // that is being written
    std::map<Interface, std::uint32_t> interfaces_;
    Interface wanted_; // of the packet at hand; its storage is kept
    CaptureTime time_; // of the last packet that had one
};

} // namespace netfloor
