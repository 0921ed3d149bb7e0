// SPDX-License-Identifier: MIT
// The times of packets as text: seconds since the first packet, or date and time of day.
#pragma once

#include <cstdint>
#include <optional>
#include <string>

#include "netfloor-capture/packet.h"

namespace netfloor {

enum class TimeForm : std::uint8_t { sinceFirst, utc };

// The first packet with a time is the start of the count, and decides whether all times get 6 digits or 9.
struct TimeStart {
    std::optional<CaptureTime> time;
    unsigned digits = 6;

    // Call it for each packet in the order of the capture.
    void see(const CapturedPacket &packet) {
        if (!time && packet.time) {
            time = packet.time;
            digits = packet.timeDigits > 6 ? 9 : 6;
        }
    }
};

class TimeText {
public:
    explicit TimeText(TimeForm form) : form_(form) {}

    // Call one of the two for each packet in the order of the capture.
    void see(const CapturedPacket &packet) { start_.see(packet); }
    void startAt(const TimeStart &start) { start_ = start; }

    // What most texts take, by the form and the digits. Longer ones are far from the first packet.
    [[nodiscard]] std::size_t width() const;

    // Empty for a packet without a time; valid until the next call.
    [[nodiscard]] const std::string &text(const CapturedPacket &packet);

private:
    void writeSinceFirst(const CaptureTime &time);
    void writeDate(const CaptureTime &time);
    template <typename Seconds>
    void writeSeconds(Seconds seconds, std::uint32_t nanoseconds);
    // Gives the end of the text.
    [[nodiscard]] char *writeFraction(char *to, std::uint32_t nanoseconds) const;

    TimeForm form_;
    TimeStart start_;
    std::optional<std::int64_t> dateSecond_; // the second of which date_ is the text
    std::string date_;
    std::string text_;
};

} // namespace netfloor
