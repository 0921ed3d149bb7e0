// SPDX-License-Identifier: MIT
#include "where.h"

#include <algorithm>

#include "exit_code.h"
#include "text.h"

namespace netfloor::cli {

Condition parseWhere(const std::string &text) {
    try {
        return Condition(text);
    } catch (const ConditionError &error) {
        // On one line, so that the mark stands below its place.
        std::string line = text;
        std::ranges::replace_if(
            line, [](unsigned char c) { return c < ' ' || c == 0x7f; }, ' ');
        throw UsageError(std::string("--where: ") + error.what() + "\n    " + line + "\n    " +
                         std::string(error.place(), ' ') + std::string(error.length(), '^'));
    }
}

} // namespace netfloor::cli
