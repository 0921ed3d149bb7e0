// SPDX-License-Identifier: MIT
// Checks that the hand-written code does the work that it is compared with: the same calls with the same texts,
// names, ids, values and bit ranges as the MD pass, the same key record as the XTR pass, and of the exact lines
// everything that a host can see of the MV and XTR passes, at the hand-off and at the end.
//
//     bench_floor_check build/plugin/libnetfloor.so
#include <algorithm>
#include <cstdio>
#include <cstring>
#include <initializer_list>
#include <string>
#include <vector>

#include <dlfcn.h>
#include <netfloor/host.h>

#include "exact_line.h"
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
    std::vector<std::string> ofPlugin = taken();
    ofPlugin.pop_back(); // the hand-off
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

// What a host sees, as words.
class Words {
public:
    explicit Words(const DecodeState &state) {
        words(&state.totalBits, 5);
        stack(state.blockStarts);
        stack(state.limits);
        number(state.condition).number(static_cast<std::uint32_t>(state.advance)).text(state.blockName);
        words(state.scratch, std::size(state.scratch));
        const FieldRecord &record = state.fieldRecord;
        text(record.fieldName).text(record.valueText).number(record.fieldId).number(record.value);
        number(record.rangeCount).number(record.outputRangeCount).number(record.rawFlag);
        words(record.ranges, record.rangeCount * sizeof(BitRange) / sizeof(std::uint32_t));
        number(state.layerHandedOff).number(state.layerIndex);
        words(state.layerFrames + state.layerIndex, sizeof(LayerFrame) / sizeof(std::uint32_t));
    }

    Words &number(std::uint32_t value) {
        text_ += std::to_string(value) + ' ';
        return *this;
    }

    [[nodiscard]] const std::string &text() const { return text_; }

private:
    void words(const void *from, std::size_t count) {
        for (std::size_t i = 0; i < count; ++i) {
            std::uint32_t word = 0;
            std::memcpy(&word, static_cast<const char *>(from) + i * sizeof word, sizeof word);
            number(word);
        }
    }
    void stack(const BitStack &stack) {
        number(stack.count);
        words(stack.base, static_cast<std::size_t>(stack.top - stack.base) + 1);
    }
    Words &text(const char *text) {
        text_ += std::string(text) + ' ';
        return *this;
    }

    std::string text_;
};

std::string wordsOf(const PreDecodeContext &context) {
    Words words(*context.decodeState);
    words.number(context.bitsLeft).number(context.layerNumber).number(context.decoderId);
    return words.number(static_cast<std::uint32_t>(context.verdict)).text();
}

std::string wordsOf(const XtrContext &context) {
    Words words(*context.decodeState);
    return words.number(context.bitsLeft).text() + std::string(context.keyRecord, context.keyRecord + keyRecordOctets);
}

// Owners of the next layer leave so many bits.
std::uint32_t bitsThatOwnersLeave = 0;

// A plain packet with other values in single octets.
struct Change {
    std::size_t octet;
    std::uint8_t value;
};

bool seesTheSame(NetfloorPreDecode mv, NetfloorExtract xtr, std::initializer_list<Change> changes) {
    Octets packet = plainUdp();
    for (const Change &change : changes) {
        packet[change.octet] = change.value;
    }
    PacketHost hosts[4];
    PreDecodeContext &ofMv = hosts[0].prepare(packet);
    PreDecodeContext &mvByHand = hosts[1].prepare(packet);
    bool same = mv(&ofMv) == 1;
    const std::vector<std::string> handOffs = taken();
    same = same && decodeByHand(mvByHand) && taken() == handOffs && wordsOf(ofMv) == wordsOf(mvByHand);
    XtrContext &ofXtr = hosts[2].prepareKeys(packet);
    XtrContext &xtrByHand = hosts[3].prepareKeys(packet);
    return same && xtr(&ofXtr) == 1 && extractByHand(xtrByHand) && wordsOf(ofXtr) == wordsOf(xtrByHand);
}

bool exactLinesAgree(NetfloorPreDecode mv, NetfloorExtract xtr) {
    bool same = true;
    for (const std::uint32_t bitsLeft : {0U, 8U}) {
        bitsThatOwnersLeave = bitsLeft;
        same = same && seesTheSame(mv, xtr, {});
        same = same && seesTheSame(mv, xtr, {{20, 0}, {21, 53}});                        // a well-known source port
        same = same && seesTheSame(mv, xtr, {{22, 0x08}, {23, 0x68}});                   // a server's destination port
        same = same && seesTheSame(mv, xtr, {{20, 0x07}, {21, 0x14}});                   // RADIUS
        same = same && seesTheSame(mv, xtr, {{20, 0x0d}, {21, 0x7c}});                   // signalling
        same = same && seesTheSame(mv, xtr, {{1, 0xff}, {6, 0x5f}, {7, 0xff}, {26, 9}}); // DF with an offset
        same = same && seesTheSame(mv, xtr, {{3, 60}});                                  // octets after the datagram
    }
    bitsThatOwnersLeave = 0;
    return same;
}

// Where a guard does not hold, nothing is done.
bool guardsHold() {
    for (const Change change : {Change{0, 0x46}, Change{3, 31}, Change{7, 1}, Change{9, 6}, Change{2, 1}}) {
        Octets packet = plainUdp();
        packet[change.octet] = change.value;
        PacketHost host;
        if (decodeByHand(host.prepare(packet)) || extractByHand(host.prepareKeys(packet))) {
            return false;
        }
    }
    return taken().empty();
}

} // namespace

std::int32_t hd_PreDecode(PreDecodeContext *context, std::uint32_t) {
    DecodeState &state = *context->decodeState;
    calls.push_back(wordsOf(*context));
    const std::uint32_t taking = state.bitsLeft - bitsThatOwnersLeave;
    state.cursor += taking;
    state.bitsLeft -= taking;
    return 0;
}

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
    const auto mv =
        library == nullptr ? nullptr : reinterpret_cast<NetfloorPreDecode>(dlsym(library, "vex_PreDecodeMV"));
    const auto xtr = library == nullptr ? nullptr : reinterpret_cast<NetfloorExtract>(dlsym(library, "XTR_netfloor"));
    if (md == nullptr || mv == nullptr || xtr == nullptr) {
        std::printf("usage: bench_floor_check PLUGIN\n");
        return 2;
    }
    const bool calledAlike = sameCalls(md);
    const bool storedAlike = sameKeys(xtr);
    const bool linesAgree = exactLinesAgree(mv, xtr) && guardsHold();
    std::printf("the lines %s, the keys %s, the exact lines %s\n", calledAlike ? "agree" : "differ",
                storedAlike ? "agree" : "differ", linesAgree ? "agree" : "differ");
    return calledAlike && storedAlike && linesAgree ? 0 : 1;
}
