// SPDX-License-Identifier: MIT
#include "interfaces.h"

#include <array>

#include "pcapng_numbers.h"

namespace netfloor {

namespace {

constexpr unsigned digitsOfNanoseconds = 9;

constexpr auto powersOfTen = [] {
    std::array<std::uint64_t, 20> powers{1};
    for (std::size_t i = 1; i < powers.size(); ++i) {
        powers[i] = 10 * powers[i - 1];
    }
    return powers;
}();

struct Split {
    std::uint64_t seconds = 0;
    std::uint64_t nanoseconds = 0;
};

Split splitDecimal(std::uint64_t units, unsigned exponent) {
    Split split;
    if (exponent < powersOfTen.size()) {
        split.seconds = units / powersOfTen[exponent];
        units %= powersOfTen[exponent];
    }
    if (exponent <= digitsOfNanoseconds) {
        split.nanoseconds = units * powersOfTen[digitsOfNanoseconds - exponent];
    } else if (exponent - digitsOfNanoseconds < powersOfTen.size()) {
        split.nanoseconds = units / powersOfTen[exponent - digitsOfNanoseconds];
    } // finer ones have less than a nanosecond in 64 bits
    return split;
}

Split splitBinary(std::uint64_t units, unsigned exponent) {
    constexpr unsigned mostBits = 34; // of a fraction that is multiplied by 10 to the 9 in 64 bits
    Split split;
    if (exponent < 64) {
        split.seconds = units >> exponent;
        units &= (std::uint64_t{1} << exponent) - 1;
    }
    if (exponent > mostBits) {
        const unsigned surplus = exponent - mostBits;
        units = surplus < 64 ? units >> surplus : 0;
        exponent = mostBits;
    }
    split.nanoseconds = units * nanosecondsPerSecond >> exponent;
    return split;
}

} // namespace

std::optional<CaptureTime> Interface::timeOf(std::uint64_t units) const {
    const unsigned exponent = timeResolution & 0x7fU;
    const Split split = (timeResolution & 0x80U) != 0 ? splitBinary(units, exponent) : splitDecimal(units, exponent);
    CaptureTime time;
    if (__builtin_add_overflow(split.seconds, timeOffset, &time.seconds)) {
        return std::nullopt;
    }
    time.nanoseconds = static_cast<std::uint32_t>(split.nanoseconds);
    return time;
}

std::uint8_t Interface::timeDigits() const {
    const unsigned exponent = timeResolution & 0x7fU;
    const bool isBinary = (timeResolution & 0x80U) != 0;
    const unsigned digits = isBinary ? (exponent * 30103 + 99999) / 100000 : exponent; // by the logarithm of 2
    return static_cast<std::uint8_t>(std::min(digits, digitsOfNanoseconds));
}

Interface readInterface(const NumberView &body) {
    Interface result;
    result.linkType = body.u16(0);
    result.snapOctets = body.u32(4);
    const NumberView options = body.from(8);
    forEachOption(options, [&](std::uint16_t code, std::size_t at, std::size_t size) {
        if (code == nameOption) {
            result.name = options.text(at, std::min(size, Interface::mostNameOctets));
        } else if (code == timeResolutionOption && size >= 1) {
            result.timeResolution = options.u8(at);
        } else if (code == timeOffsetOption && size >= 8) {
            result.timeOffset = static_cast<std::int64_t>(options.u64(at));
        }
    });
    return result;
}

} // namespace netfloor
