// SPDX-License-Identifier: MIT
// What the plug-in does with packets, as text that must be the same on every machine: all calls of the host in the four
// passes with everything that the host can see at them, as a digest for each packet and pass. The packets are some that
// hold every field, and generated ones.
//
//   golden           a line a packet: its number and the digests of MD, TO, MV and XTR
//   golden NUMBER    the text of one packet, from which the digests are made
#include <array>
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <exception>
#include <string>
#include <vector>

#include "frame/bare_host.h"
#include "generator.h"
#include "support/corpus.h"
#include "support/runs.h"

namespace netfloor::test {
namespace {

constexpr std::array passes = {Pass::md, Pass::to, Pass::mv, Pass::xtr};
constexpr std::uint64_t generatedPackets = 2000;

std::vector<Octets> allPackets() {
    std::vector<Octets> packets = packetsOfAllFields();
    for (std::uint64_t seed = 0; seed < generatedPackets; ++seed) {
        compare::Random random(seed);
        packets.push_back(compare::generatedPacket(random));
    }
    return packets;
}

std::string listed(const char *name, const auto &...numbers) {
    std::string text = std::string(" ") + name;
    ((text += ' ' + std::to_string(numbers)), ...);
    return text;
}

// What describe() leaves out.
std::string restOf(BareRun &run, Pass pass) {
    const DecodeState &state = run.state();
    std::string text = " starts " + stackText(state.blockStarts) + " limits " + stackText(state.limits) +
                       listed("flags", state.flags) + listed("handed", state.layerHandedOff) +
                       listed("wide", state.fieldRecord.wideStart, state.fieldRecord.wideBits) + " scratch";
    for (const std::uint32_t word : state.scratch) {
        text += ' ' + std::to_string(word);
    }
    for (std::uint32_t i = 0; i <= state.layerIndex; ++i) {
        const LayerFrame &frame = state.layerFrames[i];
        text += listed("frame", frame.firstBit, frame.nextLayerKey, frame.nextLayerProtocol);
    }
    if (pass == Pass::xtr) {
        return text + listed("left", run.xtr.bitsLeft) + listed("area", run.xtr.byteAreaOffset) + '\n';
    }
    const PreDecodeContext &context = run.context();
    text += listed("left", context.bitsLeft) + listed("layer", context.layerNumber, context.decoderId) +
            listed("verdict", context.verdict) + listed("records", context.fieldRecordCount);
    for (std::uint32_t i = 0; i <= context.layerInfoCount && i < run.layerInfo.size(); ++i) {
        const LayerInfoRecord &info = run.layerInfo[i];
        text += listed("info", info.firstBit, info.lastBit, info.decoderId, info.layerNumber);
    }
    return text + '\n';
}

// All calls and the result of one pass.
std::string textOf(const Octets &packet, Pass pass) {
    StateOptions options;
    options.rangeCapacity = 4096; // octets leave flag words as they were, which fresh storage does not define
    BareRun run(packet, options);
    run.xtr.byteAreaOffset = offsetof(KeyRoom, addresses);
    run.xtr.byteAreaSize = 64;
    std::string text;
    run.afterCall = [&] {
        const Seen &call = run.seen.back();
        text += std::to_string(call.id) + " \"" + call.text + '"' + listed("order", call.bitOrder) + ' ' + call.state +
                restOf(run, pass);
    };
    run.nextLayer = [&] {
        text += listed("next layer in mode", run.modes.back()) + ' ' + describe(run.state()) + restOf(run, pass);
        return run.take(run.state().bitsLeft);
    };
    const std::int32_t result = run.enter(pass);
    text += listed("result", result) + ' ' + describe(run.state()) + restOf(run, pass);
    if (pass != Pass::xtr) {
        return text;
    }
    // Numbers are in the byte order of the machine, so their octets are no part of the text.
    return text + hexText(run.keys.addresses) + '\n' + lines(runPass(pass, packet));
}

// FNV-1a.
std::uint64_t digestOf(const std::string &text) {
    std::uint64_t digest = 0xcbf29ce484222325;
    for (const char letter : text) {
        digest = (digest ^ static_cast<std::uint8_t>(letter)) * 0x100000001b3;
    }
    return digest;
}

void showDigests(const std::vector<Octets> &packets) {
    for (std::size_t number = 1; const Octets &packet : packets) {
        std::printf("%u", static_cast<unsigned>(number++));
        for (const Pass pass : passes) {
            const std::uint64_t digest = digestOf(textOf(packet, pass));
            std::printf(" %08x%08x", static_cast<unsigned>(digest >> 32), static_cast<unsigned>(digest));
        }
        std::puts("");
    }
}

} // namespace
} // namespace netfloor::test

int main(int count, char **arguments) {
    using namespace netfloor::test;
    try {
        const std::vector<Octets> packets = allPackets();
        if (count == 1) {
            showDigests(packets);
            return 0;
        }
        for (const netfloor::Pass pass : passes) {
            std::puts(textOf(packets.at(static_cast<std::size_t>(std::atoi(arguments[1])) - 1), pass).c_str());
        }
        return 0;
    } catch (const std::exception &error) {
        std::fprintf(stderr, "golden: %s\n", error.what());
        return 1;
    }
}
