// SPDX-License-Identifier: MIT
// The benchmark of the reference host: each pass with a sink that does nothing, and with one that keeps everything.
//
//     bench_reference_host build/plugin/libnetfloor.so [--benchmark_...]
#include <cstdio>
#include <exception>
#include <span>
#include <string>
#include <string_view>

#include <netfloor-host/plugin_host.h>

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

constexpr std::string_view streamed = "nothing kept";
constexpr std::string_view kept = "reports kept";

std::string column(std::string_view how, const NamedPass &named) {
    return std::string(named.name) + ", " + std::string(how);
}

void measureSet(netfloor::Host &host, netfloor::Sink &sink, const PacketSet &set) {
    for (const NamedPass &named : passes) {
        measure(set.name, column(streamed, named), set.packets.size(), [&] {
            for (const Octets &packet : set.packets) {
                host.run(named.pass, packet, sink);
            }
        });
    }
}

void measureKept(netfloor::Host &host, const PacketSet &set) {
    for (const NamedPass &named : passes) {
        measure(set.name, column(kept, named), set.packets.size(), [&] {
            for (const Octets &packet : set.packets) {
                benchmark::DoNotOptimize(host.run(named.pass, packet));
            }
        });
    }
}

void printTable(const Figures &figures, std::span<const PacketSet> sets, std::string_view how, Statistic statistic,
                const char *title) {
    std::printf("%-38s", title);
    for (const NamedPass &named : passes) {
        std::printf("%9s", named.name);
    }
    for (const PacketSet &set : sets) {
        std::printf("\n%-38s", set.name.data());
        for (const NamedPass &named : passes) {
            printFigure(figures.of(statistic, set.name, column(how, named)), 0);
        }
    }
    std::printf("\n\n");
}

void runAndPrint(int argc, char **argv) {
    netfloor::Host host(netfloor::PluginLibrary::open(argv[1]));
    netfloor::Sink sink;
    for (const PacketSet &set : packetSets()) {
        measureSet(host, sink, set);
        measureKept(host, set);
    }
    for (const PacketSet &set : worstPackets()) {
        measureSet(host, sink, set);
    }
    Figures figures;
    if (!runAll(argc - 1, argv + 1, figures)) {
        return;
    }
    printTable(figures, packetSets(), streamed, Statistic::median, "ns a packet, nothing kept, median");
    printTable(figures, packetSets(), streamed, Statistic::fastest, "ns a packet, nothing kept, fastest");
    printTable(figures, packetSets(), kept, Statistic::median, "ns a packet, reports kept, median");
    printTable(figures, worstPackets(), streamed, Statistic::fastest, "ns a packet, the worst, fastest");
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
