// SPDX-License-Identifier: MIT
// What the plug-in does with packets, as text that must be the same on every machine: all calls of the host in the four
// passes with everything that the host can see at them, as a digest for each packet and pass.
//
//   golden PACKETS           a line a packet: its number and the digests of MD, TO, MV and XTR
//   golden PACKETS NUMBER    the text of one packet, from which the digests are made
//
// PACKETS is a file of packets, each after its number of octets in four octets, the first the highest. Packets that
// hold every field come after those of the file.
#include <array>
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <exception>
#include <fstream>
#include <iterator>
#include <stdexcept>
#include <string>
#include <vector>

#include "frame/bare_host.h"
#include "support/corpus.h"
#include "support/runs.h"

namespace netfloor::test {
namespace {

constexpr std::array passes = {Pass::md, Pass::to, Pass::mv, Pass::xtr};

std::vector<Octets> readPackets(const char *path) {
    std::ifstream file(path, std::ios::binary);
    const std::string content((std::istreambuf_iterator<char>(file)), std::istreambuf_iterator<char>());
    const Octets octets(content.begin(), content.end());
    std::vector<Octets> packets;
    std::size_t at = 0;
    while (octets.size() - at >= 4) {
        const std::size_t size = std::size_t{octets[at]} << 24 | std::size_t{octets[at + 1]} << 16 |
                                 std::size_t{octets[at + 2]} << 8 | octets[at + 3];
        at += 4;
        if (size > octets.size() - at) {
            break;
        }
        const auto from = octets.begin() + static_cast<std::ptrdiff_t>(at);
        packets.emplace_back(from, from + static_cast<std::ptrdiff_t>(size));
        at += size;
    }
    if (packets.empty() || at != octets.size()) {
        throw std::runtime_error(std::string(path) + " is no file of packets");
    }
    return packets;
}

std::string words(const char *name, const std::uint32_t *first, std::size_t count) {
    std::string text = std::string(" ") + name;
    for (std::size_t i = 0; i < count; ++i) {
        text += ' ' + std::to_string(first[i]);
    }
    return text;
}

// What describe() leaves out.
std::string restOf(BareRun &run, Pass pass) {
    const DecodeState &state = run.state();
    std::string text = " flags " + std::to_string(state.flags) + " starts " + stackText(state.blockStarts) +
                       " limits " + stackText(state.limits) + words("scratch", state.scratch, 32) + " wide " +
                       std::to_string(state.fieldRecord.wideStart) + ' ' + std::to_string(state.fieldRecord.wideBits) +
                       " handed " + std::to_string(state.layerHandedOff);
    for (std::uint32_t i = 0; i <= state.layerIndex; ++i) {
        const LayerFrame &frame = state.layerFrames[i];
        text += " frame " + std::to_string(frame.firstBit) + ' ' + std::to_string(frame.nextLayerKey) + ' ' +
                std::to_string(frame.nextLayerProtocol);
    }
    if (pass == Pass::xtr) {
        return text + " left " + std::to_string(run.xtr.bitsLeft) + " area " + std::to_string(run.xtr.byteAreaOffset) +
               '\n';
    }
    const PreDecodeContext &context = run.context();
    text += " left " + std::to_string(context.bitsLeft) + " layer " + std::to_string(context.layerNumber) +
            " decoder " + std::to_string(context.decoderId) + " verdict " + std::to_string(context.verdict) +
            " records " + std::to_string(context.fieldRecordCount);
    for (std::uint32_t i = 0; i <= context.layerInfoCount && i < run.layerInfo.size(); ++i) {
        const LayerInfoRecord &info = run.layerInfo[i];
        text += " info " + std::to_string(info.firstBit) + ' ' + std::to_string(info.lastBit) + ' ' +
                std::to_string(info.decoderId) + ' ' + std::to_string(info.layerNumber);
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
        text += std::to_string(call.id) + " \"" + call.text + "\" order " + std::to_string(call.bitOrder) + ' ' +
                call.state + restOf(run, pass);
    };
    run.nextLayer = [&] {
        text +=
            "next layer in mode " + std::to_string(run.modes.back()) + ' ' + describe(run.state()) + restOf(run, pass);
        return run.take(run.state().bitsLeft);
    };
    const std::int32_t result = run.enter(pass);
    text += "result " + std::to_string(result) + ' ' + describe(run.state()) + restOf(run, pass);
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

std::string digits(std::uint64_t number) {
    std::string text;
    for (int shift = 60; shift >= 0; shift -= 4) {
        text += "0123456789abcdef"[number >> shift & 0xf];
    }
    return text;
}

void show(const std::vector<Octets> &packets) {
    for (std::size_t number = 1; const Octets &packet : packets) {
        std::string line = std::to_string(number++);
        for (const Pass pass : passes) {
            line += ' ' + digits(digestOf(textOf(packet, pass)));
        }
        std::puts(line.c_str());
    }
}

} // namespace
} // namespace netfloor::test

int main(int count, char **arguments) {
    using namespace netfloor::test;
    try {
        if (count < 2) {
            throw std::runtime_error("usage: golden PACKETS [NUMBER]");
        }
        std::vector<Octets> packets = readPackets(arguments[1]);
        for (const Octets &packet : packetsOfAllFields()) {
            packets.push_back(packet);
        }
        if (count == 2) {
            show(packets);
            return 0;
        }
        const Octets &packet = packets.at(static_cast<std::size_t>(std::atoi(arguments[2])) - 1);
        for (const netfloor::Pass pass : passes) {
            std::puts(textOf(packet, pass).c_str());
        }
        return 0;
    } catch (const std::exception &error) {
        std::fprintf(stderr, "golden: %s\n", error.what());
        return 1;
    }
}
