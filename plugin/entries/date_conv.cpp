// SPDX-License-Identifier: MIT
// The formatter of time stamps, which the host calls.
#include <chrono>
#include <cstdint>
#include <cstring>

#include "frame/export.h"
#include "netfloor/plugin.h"

namespace {

// Writes `number` in `digits` digits, padded with zeros, and gives the place after them.
char *writeDigits(char *to, std::uint32_t number, std::uint32_t digits) {
    for (std::uint32_t place = digits; place-- > 0; number /= 10) {
        to[place] = static_cast<char>('0' + number % 10);
    }
    return to + digits;
}

} // namespace

extern "C" NETFLOOR_EXPORT char *NETFLOOR_CDECL date_conv(char *text, void * /*ignored*/, DecodeState *state) {
    using namespace std::chrono;
    const sys_seconds time{seconds{state->fieldRecord.value}};
    const sys_days day = floor<days>(time);
    const year_month_day date{day};
    const hh_mm_ss clock{time - day};

    char *to = text + std::strlen(text);
    to = writeDigits(to, static_cast<std::uint32_t>(static_cast<int>(date.year())), 4);
    *to++ = '-';
    to = writeDigits(to, static_cast<unsigned>(date.month()), 2);
    *to++ = '-';
    to = writeDigits(to, static_cast<unsigned>(date.day()), 2);
    *to++ = ' ';
    to = writeDigits(to, static_cast<std::uint32_t>(clock.hours().count()), 2);
    *to++ = ':';
    to = writeDigits(to, static_cast<std::uint32_t>(clock.minutes().count()), 2);
    *to++ = ':';
    to = writeDigits(to, static_cast<std::uint32_t>(clock.seconds().count()), 2);
    *to = '\0';
    return text;
}
