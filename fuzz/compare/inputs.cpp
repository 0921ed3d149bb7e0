// SPDX-License-Identifier: MIT
#include "inputs.h"

#include <algorithm>
#include <filesystem>
#include <set>

#include "netfloor-capture/capture_file.h"
#include "netfloor-capture/link_layer.h"
#include "support/corpus.h"

namespace netfloor::compare {
namespace {

using test::Octets;

// Beginnings up to here are all run; further on there is mostly payload.
constexpr std::size_t mostCutOctets = 160;

void readCapture(const std::filesystem::path &path, std::vector<Octets> &packets) {
    try {
        CaptureFile capture(path);
        for (CapturedPacket packet; capture.next(packet);) {
            const auto part = findNetworkPart(packet.linkType, packet.octets);
            if (part.isIp()) {
                packets.emplace_back(part.octets.begin(), part.octets.end());
            }
        }
    } catch (const CaptureDamage &) {
        return; // what came before is good
    }
}

void change(Octets &packet, const Octets &other, Random &random) {
    if (packet.empty()) {
        return;
    }
    // Mostly in the headers.
    const std::size_t at = random.below(random.oneIn(3) ? packet.size() : std::min<std::size_t>(packet.size(), 64));
    std::uint8_t &octet = packet[at];
    switch (random.below(6)) {
    case 0: octet ^= static_cast<std::uint8_t>(1u << random.below(8)); break;
    case 1: octet = random.octet(); break;
    case 2: octet = random.pick<std::uint8_t>({0, 1, 0x7f, 0x80, 0xff}); break;
    case 3: octet = static_cast<std::uint8_t>(octet + random.pick({1, -1, 4, -4})); break;
    case 4: // the rest comes from another packet
        packet.resize(at);
        packet.insert(packet.end(), other.begin() + random.below(other.size() + 1), other.end());
        break;
    default: { // some octets out, or twice
        const auto from = packet.begin() + static_cast<std::ptrdiff_t>(at);
        const auto to = from + random.below(std::min<std::size_t>(packet.size() - at, 40) + 1);
        const Octets piece(from, to);
        random.oneIn(2) ? packet.erase(from, to) : packet.insert(from, piece.begin(), piece.end());
        break;
    }
    }
}

// Each of its oddities comes alone as well as with others.
Plan drawnPlan(Random &random, Octets &packet) {
    Plan plan{.seed = random.next() >> 8};
    if (random.oneIn(2)) {
        return plan;
    }
    if (random.oneIn(3)) {
        plan.blockCapacity = random.from(1, 5);
        plan.limitCapacity = random.from(1, 3);
        plan.layerCapacity = random.from(1, 2);
        plan.rangeCapacity = random.from(1, 40);
        plan.layerInfoCapacity = random.from(0, 1);
        plan.refusedGrowth = random.oneIn(2) ? random.from(1, 8) : 0;
    }
    plan.oddOwners = random.oneIn(2);
    if (random.oneIn(12)) {
        plan.keyStatus = random.pick({-1, 0, 5});
    }
    if (random.oneIn(10)) {
        plan.byteAreaSize = static_cast<std::uint16_t>(random.below(18));
    }
    if (random.oneIn(6)) {
        const std::uint32_t shift = random.below(8);
        const std::uint32_t before = random.below(4);
        packet = shift == 0 ? packet : test::shifted(packet, shift);
        packet.insert(packet.begin(), before, random.octet());
        plan.cursor = 1 + before * 8 + shift;
        plan.layerIndex = random.below(3);
    }
    plan.missingBits = random.oneIn(6) ? random.below(8) : 0;
    plan.outerBits = random.oneIn(6) ? random.below(80) : 0;
    plan.flags = random.oneIn(6) ? random.pick({2u, 8u, 16u, 0x100u, 0x80000000u}) : 0;
    plan.sourceMask = random.oneIn(6) ? random.octet() : std::uint8_t{0};
    return plan;
}

} // namespace

Inputs::Inputs(const std::vector<std::string> &folders, std::uint64_t seed)
    : seed_(seed), packets_(test::packetsOfAllFields()) {
    variedPackets_ = packets_.size();
    for (const std::string &folder : folders) {
        const std::filesystem::directory_iterator listed(folder);
        for (const auto &file : std::set<std::filesystem::path>(begin(listed), end(listed))) {
            if (file.extension() != ".md") {
                readCapture(file, packets_);
            }
        }
    }
    for (std::uint32_t packet = 0; packet < packets_.size(); ++packet) {
        const std::size_t most = std::min(packets_[packet].size(), mostCutOctets);
        for (std::uint32_t octets = 0; octets < most; ++octets) {
            beginnings_.push_back({packet, octets});
        }
    }
    // Any first part of them is a sample of all.
    Random random(seed);
    for (std::size_t i = beginnings_.size(); i > 1; --i) {
        std::swap(beginnings_[i - 1], beginnings_[random.below(i)]);
    }
}

Input Inputs::input(std::uint64_t number) const {
    const std::uint64_t turn = number / 2;
    const bool drawn = number % 2 == 1;
    if (!drawn && turn < packets_.size()) {
        return {packets_[turn], {}, "as captured"};
    }
    if (!drawn && turn - packets_.size() < beginnings_.size()) {
        const Beginning cut = beginnings_[turn - packets_.size()];
        const Octets &packet = packets_[cut.packet];
        return {{packet.begin(), packet.begin() + cut.octets}, {}, "beginning"};
    }
    Random random(Random(seed_).next() ^ Random(number).next());
    Input input;
    input.packet = drawnPacket(random, input.origin);
    input.plan = drawnPlan(random, input.packet);
    return input;
}

Octets Inputs::drawnPacket(Random &random, const char *&origin) const {
    const bool generated = random.oneIn(2);
    origin = generated ? "generated" : "changed";
    const auto captured = [&]() -> const Octets & {
        // The first ones are of many kinds; of the others many are alike.
        return packets_[random.below(random.oneIn(3) ? variedPackets_ : packets_.size())];
    };
    Octets packet = generated ? generatedPacket(random) : captured();
    if (packet.size() > 400 && !random.oneIn(8)) {
        packet.resize(random.from(100, 400));
    }
    for (std::uint32_t changes = generated ? random.pick({0u, 0u, 1u}) : random.below(4); changes > 0; --changes) {
        change(packet, captured(), random);
    }
    if (random.oneIn(4)) {
        packet.resize(random.below(packet.size() + 1));
        if (random.oneIn(2)) {
            packet = test::shortened(packet, packet.size());
        }
    }
    return packet;
}

} // namespace netfloor::compare
