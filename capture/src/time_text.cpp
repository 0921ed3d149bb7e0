// SPDX-License-Identifier: MIT
#include "netfloor-capture/time_text.h"

#include <array>
#include <charconv>
#include <ctime>
#include <string_view>

namespace netfloor {

namespace {

template <typename Number>
void append(std::string &text, Number number) {
    std::array<char, 24> digits{};
    const auto end = std::to_chars(digits.data(), digits.data() + digits.size(), number);
    text.append(digits.data(), end.ptr);
}

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
    append(text_, seconds);
    writeFraction(nanoseconds);
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
        append(text_, time.seconds);
        writeFraction(time.nanoseconds);
        return;
    }
    text_ += date_;
    writeFraction(time.nanoseconds);
    text_ += 'Z';
}

void TimeText::writeFraction(std::uint32_t nanoseconds) {
    std::array<char, 9> digits{};
    for (std::size_t i = digits.size(); i > 0; nanoseconds /= 10) {
        digits[--i] = static_cast<char>('0' + nanoseconds % 10);
    }
    text_ += '.';
    text_.append(digits.data(), start_.digits);
}

} // namespace netfloor
