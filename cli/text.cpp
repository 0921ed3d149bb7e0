// SPDX-License-Identifier: MIT
#include "text.h"

namespace netfloor::cli {

std::string_view withoutLeadingBlanks(std::string_view text) {
    const auto first = text.find_first_not_of(' ');
    return first == std::string_view::npos ? std::string_view() : text.substr(first);
}

std::string countText(std::uint64_t count, const char *thing) {
    return std::to_string(count) + " " + thing + (count == 1 ? "" : "s");
}

} // namespace netfloor::cli
