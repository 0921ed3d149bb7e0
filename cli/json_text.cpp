// SPDX-License-Identifier: MIT
#include "json_text.h"

#include <algorithm>
#include <array>
#include <chrono>
#include <string>

#include "netfloor-analysis/utf8.h"
#include "text.h"

namespace netfloor::cli {

namespace {

constexpr bool isPlain(char character) {
    return character >= ' ' && character < '\x7f' && character != '"' && character != '\\';
}

void writeCharacter(Output &out, std::string_view character) {
    const char first = character.front();
    if (character.size() > 1 || isPlain(first)) {
        out << character;
    } else if (first == '"' || first == '\\') {
        out << '\\' << first;
    } else {
        const auto octet = static_cast<unsigned char>(first);
        out << "\\u00" << hexDigits[octet >> 4U] << hexDigits[octet & 0xfU];
    }
}

template <std::size_t count>
void writeDigits(Output &out, std::uint64_t number) {
    std::array<char, count> digits;
    for (std::size_t place = count; place > 0; number /= 10) {
        digits[--place] = static_cast<char>('0' + number % 10);
    }
    out << std::string_view(digits.data(), count);
}

std::string dateOf(std::int64_t day) {
    const std::chrono::year_month_day date{std::chrono::sys_days(std::chrono::days(day))};
    const auto twoDigits = [](unsigned number) { return (number < 10 ? "0" : "") + std::to_string(number); };
    return std::to_string(static_cast<int>(date.year())) + '-' + twoDigits(static_cast<unsigned>(date.month())) + '-' +
           twoDigits(static_cast<unsigned>(date.day()));
}

} // namespace

void writeJsonText(Output &out, std::string_view text) {
    out << '"';
    if (std::ranges::all_of(text, isPlain)) {
        out << text << '"';
        return;
    }
    while (!text.empty()) {
        const std::size_t octets = utf8Octets(text);
        if (octets == 0) {
            out << replacementCharacter;
        } else {
            writeCharacter(out, text.substr(0, octets));
        }
        text.remove_prefix(std::max<std::size_t>(1, octets));
    }
    out << '"';
}

void writeJsonOctets(Output &out, std::span<const std::uint8_t> octets) {
    out << '"';
    for (const std::uint8_t octet : octets) {
        out.octet(octet);
    }
    out << '"';
}

void JsonTime::write(Output &out, std::int64_t nanoseconds) {
    constexpr std::int64_t perSecond = 1'000'000'000;
    constexpr std::int64_t secondsPerDay = 86400;
    constexpr std::int64_t perDay = secondsPerDay * perSecond;
    const std::int64_t day = nanoseconds / perDay - (nanoseconds % perDay < 0 ? 1 : 0);
    if (date_.empty() || day != day_) {
        day_ = day;
        date_ = dateOf(day);
    }
    const std::int64_t rest = nanoseconds % perDay;
    const auto ofDay = static_cast<std::uint64_t>(rest < 0 ? rest + perDay : rest);
    const std::uint64_t second = ofDay / perSecond;
    out << '"' << date_ << 'T';
    writeDigits<2>(out, second / 3600);
    out << ':';
    writeDigits<2>(out, second / 60 % 60);
    out << ':';
    writeDigits<2>(out, second % 60);
    out << '.';
    writeDigits<9>(out, ofDay % perSecond);
    out << "Z\"";
}

} // namespace netfloor::cli
