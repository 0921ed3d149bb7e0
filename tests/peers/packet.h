// SPDX-License-Identifier: MIT
// A packet as the MD pass reports it and as tshark shows it.
#pragma once

#include <algorithm>
#include <span>
#include <string>
#include <vector>

#include "netfloor-host/plugin_host.h"
#include "peers/pairs.h"

namespace netfloor::test {

using Values = std::vector<std::string>;

struct Packet {
    const Report &md;
    std::span<const std::uint8_t> octets;
    bool isCut; // by the snap length

    template <class Test>
    [[nodiscard]] bool any(Test test) const {
        return std::any_of(md.fields.begin(), md.fields.end(), test);
    }

    [[nodiscard]] bool has(std::uint32_t id) const { return value(id).has_value(); }

    // Of the first field of that id.
    [[nodiscard]] std::optional<std::uint32_t> value(std::uint32_t id) const {
        const auto found = std::ranges::find(md.fields, id, &FieldReport::id);
        return found == md.fields.end() ? std::nullopt : std::optional(found->value);
    }
};

// A pair whose values are not the same.
struct Difference {
    std::string_view peer;
    const Values &ours;
    const Values &theirs;

    [[nodiscard]] bool oursAreFewer() const { return begins(ours, theirs); }
    [[nodiscard]] bool oursAreMore() const { return begins(theirs, ours); }

    // The number that tshark shows next after those that both have.
    [[nodiscard]] unsigned long firstMissing() const { return std::stoul(theirs.at(ours.size())); }

private:
    [[nodiscard]] static bool begins(const Values &front, const Values &all) {
        return front.size() < all.size() && std::equal(front.begin(), front.end(), all.begin());
    }
};

} // namespace netfloor::test
