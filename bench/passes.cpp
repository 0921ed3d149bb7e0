// SPDX-License-Identifier: MIT
// The benchmark of the plug-in: each pass over each set of packets with a host that does nothing, hand-written
// code for the same work, and libtins, all in one run.
//
//     bench_passes build/plugin/libnetfloor.so [--benchmark_...]
#include <cstdio>
#include <cstdlib>
#include <deque>
#include <vector>

#include <dlfcn.h>

#include "exact_line.h"
#include "figures.h"
#include "hand_written.h"
#include "packet_host.h"
#include "packets.h"
#include "peer.h"

namespace {

using namespace netfloor::bench;

constexpr const char *handWritten = "by hand";
constexpr const char *exactLine = "exact line";

[[noreturn]] void fail(const char *reason, const char *detail) {
    std::fprintf(stderr, "bench_passes: %s%s\n", reason, detail);
    std::exit(1);
}

struct Passes {
    NetfloorPreDecode md;
    NetfloorPreDecode to;
    NetfloorPreDecode mv;
    NetfloorExtract xtr;
};

template <class Entry>
void resolve(void *library, const char *name, Entry &entry) {
    entry = reinterpret_cast<Entry>(dlsym(library, name));
    if (entry == nullptr) {
        fail("the plug-in has no entry ", name);
    }
}

Passes load(const char *path) {
    void *const library = dlopen(path, RTLD_NOW | RTLD_LOCAL);
    if (library == nullptr) {
        fail("cannot load the plug-in: ", dlerror());
    }
    Passes passes = {};
    resolve(library, "vex_PreDecodeMD", passes.md);
    resolve(library, "vex_PreDecodeTO", passes.to);
    resolve(library, "vex_PreDecodeMV", passes.mv);
    resolve(library, "XTR_netfloor", passes.xtr);
    return passes;
}

// One set of packets with a host of its own.
struct Bench {
    PacketHost host;
    std::vector<Octets> packets;
    PeerKeys peerKeys;

    explicit Bench(const PacketSet &set) : packets(set.packets), peerKeys() {}

    void all(NetfloorPreDecode pass) {
        for (Octets &packet : packets) {
            host.run(pass, packet);
        }
    }
    void all(NetfloorExtract pass) {
        for (Octets &packet : packets) {
            host.run(pass, packet);
        }
    }
    void inTurn(const Passes &passes) {
        for (Octets &packet : packets) {
            host.run(passes.mv, packet);
            host.run(passes.xtr, packet);
            host.run(passes.to, packet);
            host.run(passes.md, packet);
        }
    }
    void peer() {
        for (const Octets &packet : packets) {
            readKeys(packet, peerKeys);
        }
    }

    // Checks that the plug-in runs with the null host, and to the end of each packet.
    void check(const Passes &passes, const char *name) {
        for (Octets &packet : packets) {
            if (host.run(passes.xtr, packet) != 1) {
                fail("the XTR pass does not get its keys from the null host: ", name);
            }
            for (NetfloorPreDecode pass : {passes.md, passes.to, passes.mv}) {
                if (host.run(pass, packet) != 1 || host.context().bitsLeft != 0) {
                    fail("a pass does not get to the end of its packet: ", name);
                }
            }
        }
    }
};

void measureSet(const PacketSet &set, Bench &bench, const Passes &passes) {
    const std::size_t count = set.packets.size();
    measure(set.name, "MV", count, [&] { bench.all(passes.mv); });
    measure(set.name, "XTR", count, [&] { bench.all(passes.xtr); });
    measure(set.name, "TO", count, [&] { bench.all(passes.to); });
    measure(set.name, "MD", count, [&] { bench.all(passes.md); });
    measure(set.name, "in turn", count, [&] { bench.inTurn(passes); });
    if (set.peerKnows) {
        measure(set.name, "libtins", count, [&] { bench.peer(); });
    }
}

void printTable(const Figures &figures, Statistic statistic, const char *title) {
    const auto figure = [&](std::string_view set, const char *what) { return figures.of(statistic, set, what); };
    std::printf("%-38s%9s%9s%9s%9s%9s%9s%9s%9s\n", title, "MV", "XTR", "TO", "MD", "in turn", "libtins", "l/MV",
                "l/XTR");
    for (const PacketSet &set : packetSets()) {
        std::printf("%-38s", set.name.data());
        for (const char *what : {"MV", "XTR", "TO", "MD", "in turn", "libtins"}) {
            printFigure(figure(set.name, what), 1);
        }
        const double peer = figure(set.name, "libtins");
        for (const char *what : {"MV", "XTR"}) {
            const double pass = figure(set.name, what);
            printFigure(pass > 0 ? peer / pass : 0, 2);
        }
        std::printf("\n");
    }
    const std::string_view first = packetSets().front().name;
    const double lines = figure(handWritten, "MD");
    const double keys = figure(handWritten, "XTR");
    std::printf("%-38s%9s%9.1f%9s%9.1f\n", "the first row, written by hand", "-", keys, "-", lines);
    std::printf("%-38s%9.1f%9.1f\n", "the same with all that a host sees", figure(exactLine, "MV"),
                figure(exactLine, "XTR"));
    if (lines > 0 && keys > 0) {
        std::printf("MD / the same lines by hand: %.2f    XTR / the same keys by hand: %.2f\n\n",
                    figure(first, "MD") / lines, figure(first, "XTR") / keys);
    }
    if (figure(exactLine, "MV") > 0 && figure(exactLine, "XTR") > 0) {
        std::printf("MV / its exact line: %.2f    XTR / its exact line: %.2f\n\n",
                    figure(first, "MV") / figure(exactLine, "MV"), figure(first, "XTR") / figure(exactLine, "XTR"));
    }
}

} // namespace

int main(int argc, char **argv) {
    if (argc < 2) {
        fail("usage: bench_passes PLUGIN [--benchmark_...]", "");
    }
    const Passes passes = load(argv[1]);
    std::deque<Bench> benches;
    for (const PacketSet &set : packetSets()) {
        Bench &bench = benches.emplace_back(set);
        bench.check(passes, set.name.data());
        measureSet(set, bench, passes);
    }
    PacketHost host;
    Octets packet = plainUdp();
    measure(handWritten, "MD", 1, [&] { reportByHand(host.prepare(packet), packet.data()); });
    measure(handWritten, "XTR", 1, [&] { storeKeysByHand(host.prepareKeys(packet).keyRecord, packet.data()); });
    measure(exactLine, "MV", 1, [&] { decodeByHand(host.prepare(packet)); });
    measure(exactLine, "XTR", 1, [&] { extractByHand(host.prepareKeys(packet)); });
    Figures figures;
    if (!runAll(argc - 1, argv + 1, figures)) {
        return 1;
    }
    printTable(figures, Statistic::median, "ns a packet, median");
    printTable(figures, Statistic::fastest, "ns a packet, fastest repetition");
    std::printf("Greatest spread of the repetitions of one figure: %.0f %%\n", figures.spread() * 100);
}
