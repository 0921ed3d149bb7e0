// SPDX-License-Identifier: MIT
#include "text.h"

namespace netfloor::cli {

std::string countText(std::uint64_t count, const char *thing) {
    return std::to_string(count) + " " + thing + (count == 1 ? "" : "s");
}

} // namespace netfloor::cli
