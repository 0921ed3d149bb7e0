// SPDX-License-Identifier: MIT
// The second figure: the passes in the reference host, which copies all that is reported, so that most of the time
// is the host's.
//
//     bench_reference_host build/plugin/libnetfloor.so [--benchmark_...]
#include <cstdio>
#include <exception>

#include <netfloor-host/host.h>

#include "figures.h"
#include "packets.h"

namespace {

using namespace netfloor::bench;
using netfloor::Pass;

struct NamedPass {
    const char *name;
    Pass pass;
};

constexpr NamedPass passes[] = {{"MV", Pass::mv}, {"XTR", Pass::xtr}, {"TO", Pass::to}, {"MD", Pass::md}};

void runAndPrint(int argc, char **argv) {
    netfloor::Host host(netfloor::PluginLibrary::open(argv[1]));
    for (const PacketSet &set : packetSets()) {
        for (const NamedPass &named : passes) {
            measure(set.name, named.name, set.packets.size(), [&] {
                for (const Octets &packet : set.packets) {
                    benchmark::DoNotOptimize(host.run(named.pass, packet));
                }
            });
        }
    }
    Figures figures;
    if (!runAll(argc - 1, argv + 1, figures)) {
        return;
    }
    std::printf("%-38s", "ns a packet, reference host");
    for (const NamedPass &named : passes) {
        std::printf("%9s", named.name);
    }
    for (const PacketSet &set : packetSets()) {
        std::printf("\n%-38s", set.name.data());
        for (const NamedPass &named : passes) {
            printFigure(figures.of(set.name, named.name), 0);
        }
    }
    std::printf("\n");
}

} // namespace

int main(int argc, char **argv) {
    if (argc < 2) {
        std::fprintf(stderr, "usage: bench_reference_host PLUGIN [--benchmark_...]\n");
        return 1;
    }
    try {
        runAndPrint(argc, argv);
    } catch (const std::exception &failure) {
        std::fprintf(stderr, "bench_reference_host: %s\n", failure.what());
        return 1;
    }
}
