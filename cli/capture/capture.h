// SPDX-License-Identifier: MIT
// Packets out of a capture file.
#pragma once

#include <cstdint>
#include <memory>
#include <optional>
#include <span>
#include <stdexcept>

#include "capture/octet_stream.h"

namespace netfloor::cli {

// Time since 1970-01-01 00:00:00 UTC.
struct CaptureTime {
    std::int64_t seconds = 0;
    std::uint32_t nanoseconds = 0;
};

struct CapturedPacket {
    std::uint64_t number = 0; // from 1
    std::optional<CaptureTime> time;
    int linkType = 0;                     // DLT_... of libpcap
    std::uint32_t wireOctets = 0;         // what the packet had before the snap length cut it
    std::span<const std::uint8_t> octets; // valid until the next packet is read

    [[nodiscard]] bool isCut() const { return octets.size() < wireOctets; }
};

// The file ends in the middle of a packet or goes on with what is no packet; all packets before it are good.
class CaptureDamage : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

class CaptureReader {
public:
    CaptureReader() = default;
    CaptureReader(const CaptureReader &) = delete;
    CaptureReader &operator=(const CaptureReader &) = delete;
    virtual ~CaptureReader() = default;

    // The next packet, or false at the end. Throws CaptureDamage.
    [[nodiscard]] virtual bool next(CapturedPacket &packet) = 0;

    // Digits of a second that the time stamps have: 6 or 9.
    [[nodiscard]] virtual int timeDigits() const = 0;
};

// Finds out the format of the stream, which the reader borrows. Throws CaptureError when it is no capture.
[[nodiscard]] std::unique_ptr<CaptureReader> openCapture(OctetStream &stream);

// "NAME is cut in packet 7, which begins at octet 910", with the reason.
[[nodiscard]] CaptureDamage damageAt(const OctetStream &stream, std::uint64_t packetNumber, std::uint64_t firstOctet,
                                     const std::string &reason);

// No packet is larger; a length above it is damage.
constexpr std::uint32_t mostPacketOctets = std::uint32_t{16} * 1024 * 1024;

// The formats.
[[nodiscard]] std::unique_ptr<CaptureReader> openPcap(OctetStream &stream);
[[nodiscard]] std::unique_ptr<CaptureReader> openPcapng(OctetStream &stream);

} // namespace netfloor::cli
