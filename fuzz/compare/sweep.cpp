// SPDX-License-Identifier: MIT
// What is few enough to be gone through as a whole: each growth of storage refused, each place at which a packet can be
// cut, each value of each octet.
//
//     sweep PLUGIN          a sample, in seconds
//     sweep PLUGIN --all    all of it, in minutes
//
// Ends with a message, by a signal, where one of the checks does not hold.
#include <algorithm>
#include <cstdio>
#include <exception>
#include <stdexcept>
#include <string_view>

#include "checks.h"
#include "inputs.h"
#include "support/packets.h"

namespace netfloor::compare {
namespace {

using test::Octets;

class Sweep {
public:
    Sweep(const char *path, bool all) : plugin_(path), all_(all), inputs_({NETFLOOR_CAPTURES}, 1) {
        setKeyFieldsUp(plugin_);
    }

    void run() {
        part("growths", [this] { refuseGrowths(); });
        part("hosts", [this] { changeHosts(); });
        part("cuts", [this] { cutEverywhere(); });
        part("values", [this] { enumerate(); });
    }

private:
    template <class Work>
    void part(const char *name, Work work) {
        runs_ = 0;
        work();
        std::printf("%s: %llu packets and hosts\n", name, static_cast<unsigned long long>(runs_));
    }

    bool check(const Octets &packet, const Plan &plan) {
        ++runs_;
        return checkPasses(plugin_, {packet, plan, "sweep"});
    }

    // Arrays have room for one element, and each growth in turn is refused, up to the one that is not asked for.
    void refuseGrowths() {
        constexpr std::uint32_t mostGrowths = 2000;
        const Plan tight{
            .blockCapacity = 1, .limitCapacity = 1, .layerCapacity = 1, .rangeCapacity = 1, .layerInfoCapacity = 0};
        for (const Octets &packet : inputs_.packets()) {
            Plan plan = tight;
            do {
                ++plan.refusedGrowth;
            } while (!check(packet, plan) && plan.refusedGrowth < mostGrowths);
        }
    }

    // Owners of all kinds, a byte area that is too small by one for an address and one that is not, starts at each bit.
    void changeHosts() {
        const std::uint64_t seeds = all_ ? 64 : 4;
        for (const Octets &packet : inputs_.packets()) {
            for (std::uint64_t seed = 0; seed < seeds; ++seed) {
                check(packet, {.seed = seed, .oddOwners = true});
            }
            check(packet, {.byteAreaSize = 16});
            check(packet, {.byteAreaSize = 17});
            for (unsigned shift = 1; shift < 8; ++shift) {
                check(test::shifted(packet, shift), {.cursor = shift + 1, .missingBits = 8 - shift});
            }
        }
    }

    void cutEverywhere() {
        const std::size_t count = all_ ? inputs_.packets().size() : inputs_.variedPackets();
        for (const Octets &packet : std::span(inputs_.packets()).first(count)) {
            const std::size_t most = std::min<std::size_t>(packet.size(), 200);
            for (std::size_t octets = 1; octets <= most; ++octets) {
                const Octets cut(packet.begin(), packet.begin() + static_cast<std::ptrdiff_t>(octets));
                for (std::uint32_t missing = 0; missing < 8; ++missing) {
                    check(cut, {.missingBits = missing});
                }
                check(test::shortened(packet, octets), {});
            }
        }
    }

    // Each octet of the headers in turn has each value; in the sample other values in each place.
    void enumerate() {
        const std::size_t step = all_ ? 1 : 61;
        for (Octets packet : std::span(inputs_.packets()).first(inputs_.variedPackets())) {
            for (std::size_t at = 0; at < packet.size(); ++at) {
                const std::uint8_t before = packet[at];
                for (std::size_t value = at % step; value < 0x100; value += step) {
                    packet[at] = static_cast<std::uint8_t>(value);
                    check(packet, {});
                }
                packet[at] = before;
            }
        }
    }

    const Plugin plugin_;
    bool all_;
    const Inputs inputs_;
    std::uint64_t runs_ = 0;
};

} // namespace
} // namespace netfloor::compare

int main(int count, char **arguments) {
    try {
        if (count < 2) {
            throw std::runtime_error("usage: sweep PLUGIN [--all]");
        }
        netfloor::compare::Sweep(arguments[1], count > 2 && std::string_view(arguments[2]) == "--all").run();
        return 0;
    } catch (const std::exception &error) {
        std::fprintf(stderr, "sweep: %s\n", error.what());
        return 2;
    }
}
