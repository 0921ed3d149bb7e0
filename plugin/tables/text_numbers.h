// SPDX-License-Identifier: MIT
// Numbers for texts, worked out at compile time.
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <string_view>

namespace netfloor::plugin {

// Gives each distinct text a number, in the order of first use.
template <std::size_t most>
class TextNumbers {
public:
    constexpr std::uint32_t numberOf(std::string_view text) {
        std::size_t slot = hash(text) % slots_.size();
        for (; slots_[slot] != 0; slot = (slot + 1) % slots_.size()) {
            if (texts_[slots_[slot] - 1u] == text) {
                return slots_[slot] - 1u;
            }
        }
        texts_[count_] = text;
        slots_[slot] = static_cast<std::uint16_t>(count_ + 1);
        return count_++;
    }

    [[nodiscard]] constexpr std::uint32_t count() const { return count_; }

    [[nodiscard]] constexpr std::string_view operator[](std::size_t number) const { return texts_[number]; }

private:
    // FNV-1a, of the first characters and the length: few names have the same.
    [[nodiscard]] static constexpr std::uint32_t hash(std::string_view text) {
        std::uint32_t value = 2166136261u ^ static_cast<std::uint32_t>(text.size());
        for (const char character : text.substr(0, 24)) {
            value = (value ^ static_cast<std::uint8_t>(character)) * 16777619u;
        }
        return value;
    }

    std::array<std::string_view, most> texts_{};
    std::array<std::uint16_t, most * 2> slots_{};
    std::uint32_t count_ = 0;
};

} // namespace netfloor::plugin
