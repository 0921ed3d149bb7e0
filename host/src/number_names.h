// SPDX-License-Identifier: MIT
// Tables of the names that numbers have.
#pragma once

#include <algorithm>
#include <cstdint>
#include <span>
#include <string_view>
#include <utility>

namespace netfloor {

using NumberName = std::pair<std::uint32_t, std::string_view>;

// Empty for a number that is not in the table.
[[nodiscard]] inline std::string_view nameIn(std::span<const NumberName> names, std::uint32_t number) {
    const auto found = std::ranges::find(names, number, &NumberName::first);
    return found == names.end() ? std::string_view() : found->second;
}

} // namespace netfloor
