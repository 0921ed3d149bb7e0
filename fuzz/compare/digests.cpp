// SPDX-License-Identifier: MIT
// Known answers: what the plug-in does with captured, cut, changed and generated packets, under ordinary and unusual
// hosts, as a digest of all host calls and results for each group of packets.
//
//     digests PLUGIN           prints them, a line a group
#include <cstdio>
#include <exception>

#include "known_answers.h"

namespace netfloor::compare {
namespace {

void printDigests(const char *path) {
    const auto print = [](const std::string &name, std::uint64_t digest) {
        std::printf("%s %016llx\n", name.c_str(), static_cast<unsigned long long>(digest));
    };
    Plugin plugin(path);
    print("exports", exportsDigest(plugin));
    const Inputs inputs({NETFLOOR_CAPTURES}, 1);
    for (std::uint64_t first = 0; first < answeredPackets; first += packetsTogether) {
        print(std::to_string(first), groupDigest(plugin, inputs, first));
    }
}

} // namespace
} // namespace netfloor::compare

int main(int count, char **arguments) {
    if (count != 2) {
        std::fputs("usage: digests PLUGIN\n", stderr);
        return 2;
    }
    try {
        netfloor::compare::printDigests(arguments[1]);
        return 0;
    } catch (const std::exception &error) {
        std::fprintf(stderr, "digests: %s\n", error.what());
        return 2;
    }
}
