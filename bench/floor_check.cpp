// SPDX-License-Identifier: MIT
// Checks that the hand-written code does the work that it is compared with: the same calls with the same texts,
// names, ids, values and bit ranges as the MD pass, and the same key record as the XTR pass.
//
//     bench_floor_check build/plugin/libnetfloor.so
#include <algorithm>
#include <cstdio>
#include <string>
#include <vector>

#include <dlfcn.h>
#include <netfloor/host.h>

#include "hand_written.h"
#include "packet_host.h"
#include "packets.h"

namespace {

using namespace netfloor::bench;

std::vector<std::string> calls;

std::vector<std::string> taken() {
    std::vector<std::string> result;
    result.swap(calls);
    return result;
}

bool sameCalls(NetfloorPreDecode md) {
    PacketHost host;
    Octets packet = plainUdp();
    if (md(&host.prepare(packet)) != 1) {
        return false;
    }
    const std::vector<std::string> ofPlugin = taken();
    reportByHand(host.prepare(packet), packet.data());
    const std::vector<std::string> byHand = taken();
    for (std::size_t i = 0; i < std::max(ofPlugin.size(), byHand.size()); ++i) {
        const std::string plugin = i < ofPlugin.size() ? ofPlugin[i] : "nothing";
        const std::string hand = i < byHand.size() ? byHand[i] : "nothing";
        if (plugin != hand) {
            std::printf("call %zu\n  plug-in: %s\n  by hand: %s\n", i, plugin.c_str(), hand.c_str());
        }
    }
    return ofPlugin.size() == 22 && ofPlugin == byHand;
}

bool sameKeys(NetfloorExtract xtr) {
    PacketHost host;
    Octets packet = plainUdp();
    const auto record = [&](XtrContext &context) {
        return Octets(context.keyRecord, context.keyRecord + keyRecordOctets);
    };
    XtrContext &context = host.prepareKeys(packet);
    if (xtr(&context) != 1) {
        return false;
    }
    const Octets ofPlugin = record(context);
    PacketHost other;
    XtrContext &otherContext = other.prepareKeys(packet);
    storeKeysByHand(otherContext.keyRecord, packet.data());
    return record(otherContext) == ofPlugin;
}

} // namespace

// This host keeps each call. Its other operations are those of the null host.
std::int32_t hs_AddDecodedFieldsData(PreDecodeContext *context, std::uint32_t outputRangeCount, const BitRange *ranges,
                                     const char *display, std::uint32_t, const char *fieldName, std::uint32_t fieldId,
                                     std::uint32_t, std::uint32_t bitOrder) {
    const FieldRecord &record = context->decodeState->fieldRecord;
    std::string call = std::to_string(fieldId) + " \"" + fieldName + "\" \"" + display + "\" order " +
                       std::to_string(bitOrder) + " value " + std::to_string(record.value) + " id " +
                       std::to_string(record.fieldId) + " ranges";
    for (std::uint32_t i = 0; i < outputRangeCount; ++i) {
        call += " " + std::to_string(ranges[i].firstBit) + "-" + std::to_string(ranges[i].lastBit) + "=" +
                std::to_string(ranges[i].value);
    }
    calls.push_back(call);
    return 0;
}

int main(int argc, char **argv) {
    void *const library = argc == 2 ? dlopen(argv[1], RTLD_NOW | RTLD_LOCAL) : nullptr;
    const auto md =
        library == nullptr ? nullptr : reinterpret_cast<NetfloorPreDecode>(dlsym(library, "vex_PreDecodeMD"));
    const auto xtr = library == nullptr ? nullptr : reinterpret_cast<NetfloorExtract>(dlsym(library, "XTR_netfloor"));
    if (md == nullptr || xtr == nullptr) {
        std::printf("usage: bench_floor_check PLUGIN\n");
        return 2;
    }
    const bool calledAlike = sameCalls(md);
    const bool storedAlike = sameKeys(xtr);
    std::printf("the lines %s, the keys %s\n", calledAlike ? "agree" : "differ", storedAlike ? "agree" : "differ");
    return calledAlike && storedAlike ? 0 : 1;
}
