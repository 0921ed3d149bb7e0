// SPDX-License-Identifier: MIT
#include "gaps.h"

namespace netfloor::cli {

std::optional<Gap> GapFinder::nextGap(std::uint32_t end) {
    // What was looked at ahead may have been reached.
    for (std::size_t i = 0; i < ahead_.size();) {
        if (ahead_[i].first > covered_) {
            ++i;
            continue;
        }
        covered_ = std::max(covered_, ahead_[i].end);
        ahead_[i] = ahead_.back();
        ahead_.pop_back();
        i = 0;
    }
    if (end <= covered_) {
        return std::nullopt;
    }
    for (const OctetSpan &span : ahead_) {
        end = std::min(end, span.first);
    }
    const Gap gap = {covered_, end - covered_};
    covered_ = end;
    return gap;
}

} // namespace netfloor::cli
