// SPDX-License-Identifier: MIT
// Two records of known contents, by which a host checks how the plug-in lays out its records. Each has a head, a
// body with a placeholder for each pointer, and pairs of offsets: of a pointer, and of what it points to.
#pragma once

#include <array>
#include <cstdint>
#include <string_view>

namespace netfloor::plugin {

inline constexpr std::uint8_t probePadding = 60;

template <std::size_t size>
class ProbeRecord {
public:
    constexpr ProbeRecord &words(std::size_t at, std::initializer_list<std::uint32_t> values) {
        for (const std::uint32_t value : values) {
            put(at, value, 4);
            at += 4;
        }
        return *this;
    }

    constexpr ProbeRecord &halves(std::size_t at, std::initializer_list<std::uint32_t> values) {
        for (const std::uint32_t value : values) {
            put(at, value, 2);
            at += 2;
        }
        return *this;
    }

    constexpr ProbeRecord &octets(std::size_t at, std::initializer_list<std::uint8_t> values) {
        for (const std::uint8_t value : values) {
            octets_[at++] = value;
        }
        return *this;
    }

    constexpr ProbeRecord &text(std::size_t at, std::string_view characters) {
        for (const char character : characters) {
            octets_[at++] = static_cast<std::uint8_t>(character);
        }
        return *this;
    }

    [[nodiscard]] constexpr std::array<std::uint8_t, size> record() const { return octets_; }

private:
    // Words are little-endian, on every machine.
    constexpr void put(std::size_t at, std::uint32_t value, std::size_t width) {
        for (std::size_t octet = 0; octet < width; ++octet) {
            octets_[at + octet] = static_cast<std::uint8_t>(value >> (octet * 8));
        }
    }

    std::array<std::uint8_t, size> octets_{};
};

inline constexpr std::uint32_t pointerPlaceholder = 0xa5a5a5a5;
inline constexpr std::uint32_t otherPointerPlaceholder = 0x4b4b4b4b;

// A sample of a field row.
alignas(8) inline constexpr auto fieldProbe = ProbeRecord<124>{}
                                                  .words(0, {4, 124, 92, probePadding})
                                                  .words(16,
                                                         {pointerPlaceholder, pointerPlaceholder, pointerPlaceholder, 1,
                                                          0xfffd, 0x106, 0xffff, otherPointerPlaceholder})
                                                  .halves(48, {8, 13, 1, 3})
                                                  .text(56, "VEX Protocol Prototype dummy field")
                                                  .words(92, {16, 36, 20, 32, 24, 32, 44, 56})
                                                  .record();

// A sample of a table of one row.
alignas(8) inline constexpr auto tableProbe = ProbeRecord<220>{}
                                                  .words(0, {5, 220, 172, probePadding})
                                                  .words(16,
                                                         {pointerPlaceholder, pointerPlaceholder, pointerPlaceholder,
                                                          pointerPlaceholder, pointerPlaceholder, 0, 0,
                                                          pointerPlaceholder, 0, 0x10000, 1})
                                                  .text(60, "test_vex_protocol_DLL.dll")
                                                  .octets(86, {probePadding, probePadding})
                                                  .words(88, {1, 0, 0, 0})
                                                  .words(104, {1})
                                                  .octets(108, {0, 0, probePadding, probePadding})
                                                  .words(112, {7})
                                                  .octets(116, {0, 0, probePadding, probePadding})
                                                  .octets(120, {1, probePadding, 1, 0})
                                                  .words(124, {8})
                                                  .octets(128, {0, probePadding, 0, 0})
                                                  .words(132, {0, 3})
                                                  .octets(140, {0, 0, 0, probePadding})
                                                  .words(144, {0, 0, 13})
                                                  .words(172, {16, 88, 20, 104, 24, 120, 28, 156, 32, 164, 44, 112})
                                                  .record();

// Where the body of a probe starts.
inline constexpr std::size_t probeHead = 16;

} // namespace netfloor::plugin
