// SPDX-License-Identifier: MIT
#include "netfloor-capture/time_text.h"

#include <array>
#include <charconv>
#include <ctime>
#include <string_view>

namespace netfloor {

namespace {

using Room = std::array<char, 40>; // for the longest number of seconds, with nine digits after it

} // namespace

std::size_t TimeText::width() const {
    constexpr std::size_t toSeconds = std::string_view("2000-01-01T00:00:00.Z").size();
    constexpr std::size_t fourDigits = std::string_view("1000.").size();
    return (form_ == TimeForm::utc ? toSeconds : fourDigits) + start_.digits;
}

const std::string &TimeText::text(const CapturedPacket &packet) {
    see(packet);
    text_.clear();
    if (packet.time && form_ == TimeForm::utc) {
        writeDate(*packet.time);
    } else if (packet.time) {
        writeSinceFirst(*packet.time);
    }
    return text_;
}

template <typename Seconds>
void TimeText::writeSeconds(Seconds seconds, std::uint32_t nanoseconds) {
    Room room;
    char *const end = std::to_chars(room.data(), room.data() + room.size(), seconds).ptr;
    text_.append(room.data(), writeFraction(end, nanoseconds));
}

// The larger minus the smaller: a difference of two signed numbers always fits into the unsigned one.
void TimeText::writeSinceFirst(const CaptureTime &time) {
    const bool isEarlier = time < *start_.time;
    const CaptureTime &later = isEarlier ? *start_.time : time;
    const CaptureTime &earlier = isEarlier ? time : *start_.time;
    std::uint64_t seconds = static_cast<std::uint64_t>(later.seconds) - static_cast<std::uint64_t>(earlier.seconds);
    std::uint32_t nanoseconds = later.nanoseconds - earlier.nanoseconds;
    if (later.nanoseconds < earlier.nanoseconds) {
        --seconds;
        nanoseconds += nanosecondsPerSecond;
    }
    if (isEarlier) {
        text_ += '-';
    }
    writeSeconds(seconds, nanoseconds);
}

void TimeText::writeDate(const CaptureTime &time) {
    if (dateSecond_ != time.seconds) {
        dateSecond_ = time.seconds;
        date_.clear();
        std::tm parts = {};
        const std::time_t seconds = time.seconds;
        std::array<char, 64> text{};
        if (gmtime_r(&seconds, &parts) != nullptr) {
            date_.assign(text.data(), std::strftime(text.data(), text.size(), "%Y-%m-%dT%H:%M:%S", &parts));
        }
    }
    if (date_.empty()) { // a year that has no calendar
        return writeSeconds(time.seconds, time.nanoseconds);
    }
    Room room;
    char *const end = writeFraction(room.data(), time.nanoseconds);
    text_.append(date_).append(room.data(), end) += 'Z';
}

char *TimeText::writeFraction(char *to, std::uint32_t nanoseconds) const {
    constexpr unsigned microsecondDigits = 6;
    constexpr std::uint32_t nanosecondsPerMicrosecond = 1000;
    std::uint32_t rest = start_.digits == microsecondDigits ? nanoseconds / nanosecondsPerMicrosecond : nanoseconds;
    *to++ = '.';
    for (std::size_t i = start_.digits; i > 0; rest /= 10) {
        to[--i] = static_cast<char>('0' + rest % 10);
    }
    return to + start_.digits;
}

} // namespace netfloor
