// SPDX-License-Identifier: MIT
#include "address_parser.h"

#include <algorithm>
#include <charconv>
#include <optional>

namespace netfloor {
namespace {

// A number of so many digits at most, and nothing else.
std::optional<std::uint32_t> parseNumber(std::string_view text, std::size_t mostDigits, int base) {
    std::uint32_t number = 0;
    const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), number, base);
    const bool isNumber = !text.empty() && error == std::errc() && end == text.data() + text.size();
    return isNumber && text.size() <= mostDigits ? std::optional(number) : std::nullopt;
}

} // namespace

bool parseIpv4(std::string_view text, std::span<std::uint8_t, 4> octets) {
    for (std::size_t i = 0; i < octets.size(); ++i) {
        const bool isLast = i + 1 == octets.size();
        const std::size_t end = isLast ? text.size() : text.find('.');
        if (end == std::string_view::npos) {
            return false;
        }
        const auto number = parseNumber(text.substr(0, end), 3, 10);
        const bool mayBeOctal = end > 1 && text.front() == '0';
        if (!number || *number > 0xff || mayBeOctal) {
            return false;
        }
        octets[i] = static_cast<std::uint8_t>(*number);
        text.remove_prefix(std::min(end + 1, text.size()));
    }
    return true;
}

bool parseIpv6(std::string_view text, std::span<std::uint8_t, 16> octets) {
    std::ranges::fill(octets, std::uint8_t{0});
    std::size_t used = 0;
    std::optional<std::size_t> gap; // where "::" stands
    std::size_t at = 0;
    if (text.starts_with("::")) {
        gap = 0;
        at = 2;
    }
    while (at < text.size()) {
        const std::size_t end = std::min(text.find(':', at), text.size());
        const std::string_view group = text.substr(at, end - at);
        if (end == text.size() && group.find('.') != std::string_view::npos) {
            if (used > 12 || !parseIpv4(group, octets.subspan(used).first<4>())) {
                return false;
            }
            used += 4;
            break;
        }
        const auto number = parseNumber(group, 4, 16);
        if (!number || used == octets.size()) {
            return false;
        }
        octets[used++] = static_cast<std::uint8_t>(*number >> 8U);
        octets[used++] = static_cast<std::uint8_t>(*number);
        at = end + 1;
        if (at < text.size() && text[at] == ':' && !gap) {
            gap = used;
            ++at;
        } else if (at == text.size()) { // a colon at the end
            return false;
        }
    }
    if (!gap) {
        return used == octets.size();
    }
    if (used > 14) { // the gap stands for one group at least
        return false;
    }
    const std::size_t after = used - *gap;
    std::copy_backward(octets.begin() + static_cast<std::ptrdiff_t>(*gap),
                       octets.begin() + static_cast<std::ptrdiff_t>(used), octets.end());
    std::fill_n(octets.begin() + static_cast<std::ptrdiff_t>(*gap), octets.size() - after - *gap, std::uint8_t{0});
    return true;
}

} // namespace netfloor
