// SPDX-License-Identifier: MIT
// The four passes over one packet, under a host of any kind. An input is twelve octets that say how the host behaves,
// all of them 0 for an ordinary one, and the packet.
#include <algorithm>
#include <cstdint>
#include <span>

#include "checks.h"
#include "inputs.h"
#include "packet_mutator.h"

namespace netfloor::compare {
namespace {

constexpr std::size_t planOctets = 12;
constexpr std::size_t mostPacketOctets = 4096;

// Each bit of the first octet turns on what the octets after it say more about.
Input inputFrom(std::span<const std::uint8_t> octets) {
    const auto head = octets.first(planOctets);
    const auto on = [&](unsigned bit) { return (head[0] >> bit & 1) != 0; };
    const auto packet = octets.subspan(planOctets).first(std::min(octets.size() - planOctets, mostPacketOctets));
    Input input{{packet.begin(), packet.end()}, {}, "fuzzed"};
    Plan &plan = input.plan;
    plan.seed = head[1] | std::uint64_t{head[2]} << 8;
    plan.oddOwners = on(0);
    if (on(1)) {
        plan.blockCapacity = 1 + head[3] % 8;
        plan.limitCapacity = 1 + head[3] / 8 % 4;
        plan.layerCapacity = 1 + head[3] / 32 % 2;
        plan.rangeCapacity = 1 + head[4] % 64;
        plan.layerInfoCapacity = head[4] / 64;
    }
    plan.refusedGrowth = on(2) ? head[5] : 0;
    if (on(3)) {
        const unsigned shift = head[6] % 8;
        const std::size_t before = head[6] / 8 % 4;
        input.packet = shift == 0 ? input.packet : test::shifted(input.packet, shift);
        input.packet.insert(input.packet.begin(), before, head[6]);
        plan.cursor = static_cast<std::uint32_t>(1 + before * 8 + shift);
        plan.layerIndex = head[6] / 64;
    }
    const auto bitsFromCursor = static_cast<std::uint32_t>(input.packet.size() * 8 + 1 - plan.cursor);
    plan.missingBits = on(4) ? std::min<std::uint32_t>(head[7] % 8, bitsFromCursor) : 0;
    plan.outerBits = on(5) ? head[8] : 0;
    plan.flags = on(6) ? std::uint32_t{head[9]} << 1 : 0;
    plan.sourceMask = on(7) ? head[10] : 0;
    plan.byteAreaSize = static_cast<std::uint16_t>(head[11] == 0 ? 64 : head[11] % 32);
    return input;
}

const Plugin &loadedPlugin() {
    static const Plugin plugin = [] {
        Plugin loaded(NETFLOOR_PLUGIN);
        setKeyFieldsUp(loaded);
        return loaded;
    }();
    return plugin;
}

} // namespace
} // namespace netfloor::compare

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size) {
    using namespace netfloor::compare;
    if (size < planOctets) {
        return 0;
    }
    checkPasses(loadedPlugin(), inputFrom({data, size}));
    return 0;
}

extern "C" std::size_t LLVMFuzzerCustomMutator(std::uint8_t *data, std::size_t size, std::size_t mostOctets,
                                               unsigned seed) {
    const auto changeHead = [](std::span<std::uint8_t> head, netfloor::compare::Random &random) {
        std::ranges::generate(head, [&random] { return random.octet(); });
        head[0] = random.oneIn(4) ? 0 : static_cast<std::uint8_t>(random.octet() & random.octet());
    };
    return netfloor::compare::mutateInput({data, mostOctets}, size, netfloor::compare::planOctets, seed, changeHead);
}
