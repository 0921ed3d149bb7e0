// SPDX-License-Identifier: MIT
// Runs each pass over each packet of the benchmarks under callgrind, which counts the instructions of each run by
// itself; or writes the packets into a capture.
//
//     run_passes PLUGIN
//     run_passes --capture FILE
#include <algorithm>
#include <cstdio>
#include <fstream>
#include <stdexcept>
#include <string>
#include <vector>

#include <valgrind/callgrind.h>

#include "host.h"
#include "packets.h"
#include "support/captures.h"

namespace netfloor::bench {
namespace {

constexpr std::size_t mostOctets = 65'575; // of a datagram; more than that no host hands over

std::vector<PacketSet> allSets() {
    std::vector<PacketSet> sets(packetSets().begin(), packetSets().end());
    for (const PacketSet &set : worstPackets()) {
        if (set.packets.front().size() <= mostOctets) {
            sets.push_back(set);
        }
    }
    return sets;
}

// The entries of the plug-in, and in their places functions that count what each takes.
compare::Plugin *plugin = nullptr;
std::string title;

template <class Entry, class Context>
auto countedCall(Entry entry, Context *context) {
    CALLGRIND_START_INSTRUMENTATION;
    CALLGRIND_ZERO_STATS;
    const auto result = entry(context);
    CALLGRIND_DUMP_STATS_AT(title.c_str());
    CALLGRIND_STOP_INSTRUMENTATION;
    return result;
}

NetfloorPreDecode preDecode;
NetfloorExtract extract;

std::uint8_t countedPreDecode(PreDecodeContext *context) {
    return countedCall(preDecode, context);
}

std::int32_t countedExtract(XtrContext *context) {
    return countedCall(extract, context);
}

// The second run is counted: the first one sets the plug-in up.
void count(compare::Pass pass, const char *passName, const PacketSet &set) {
    compare::Plugin counted = *plugin;
    preDecode = plugin->passes[static_cast<std::size_t>(pass) % plugin->passes.size()];
    extract = plugin->extract;
    counted.passes.fill(countedPreDecode);
    counted.extract = countedExtract;
    title = std::string(set.name) + '\t' + passName;
    for (const Octets &packet : set.packets) {
        const compare::Input input{packet, {}, "cost"};
        compare::Trace none(compare::Trace::Keeps::nothing);
        run(*plugin, pass, input, none);
        run(counted, pass, input, none);
    }
}

void countAll(const char *path) {
    compare::Plugin loaded(path);
    plugin = &loaded;
    for (const PacketSet &set : allSets()) {
        count(compare::Pass::md, "MD", set);
        count(compare::Pass::to, "TO", set);
        count(compare::Pass::mv, "MV", set);
        count(compare::Pass::xtr, "XTR", set);
    }
}

// What a short snap length leaves of them, so that counting takes seconds.
void writeCapture(const char *path) {
    constexpr std::uint32_t linkTypeRaw = 101;
    constexpr std::size_t snapOctets = 2000;
    std::vector<test::PcapPacket> packets;
    for (const PacketSet &set : allSets()) {
        for (const Octets &packet : set.packets) {
            const auto end = packet.begin() + static_cast<std::ptrdiff_t>(std::min(packet.size(), snapOctets));
            packets.push_back({{packet.begin(), end}, static_cast<std::uint32_t>(packet.size())});
        }
    }
    const Octets octets = test::pcapFile(linkTypeRaw, packets);
    std::ofstream file(path, std::ios::binary);
    file.write(reinterpret_cast<const char *>(octets.data()), static_cast<std::streamsize>(octets.size()));
    if (!file.flush()) {
        throw std::runtime_error(std::string(path) + " cannot be written");
    }
}

} // namespace
} // namespace netfloor::bench

int main(int count, char **arguments) {
    try {
        if (count == 2) {
            netfloor::bench::countAll(arguments[1]);
        } else if (count == 3) {
            netfloor::bench::writeCapture(arguments[2]);
        } else {
            throw std::runtime_error("usage: run_passes PLUGIN | --capture FILE");
        }
        return 0;
    } catch (const std::exception &error) {
        std::fprintf(stderr, "run_passes: %s\n", error.what());
        return 2;
    }
}
