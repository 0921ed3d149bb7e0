// SPDX-License-Identifier: MIT
// What the plug-ins are run on: for each number the same packet and the same host, given the same seed and captures.
#pragma once

#include <string>
#include <vector>

#include "host.h"
#include "random.h"

namespace netfloor::compare {

// A packet that follows the grammar, with lengths that are mostly right.
[[nodiscard]] test::Octets generatedPacket(Random &random);

// A piece of one: an option, a chunk, a parameter, a header that IP carries.
[[nodiscard]] test::Octets generatedPart(Random &random);

// What a plug-in keeps from one packet to the next is part of what is compared. So that a difference can be found again
// soon, it starts as loaded after so many packets.
inline constexpr std::uint64_t packetsTogether = 64;

class Inputs {
public:
    // Captures in all of these folders, and packets that hold every field.
    Inputs(const std::vector<std::string> &folders, std::uint64_t seed);

    // Those of the captures and those that hold every field, as they are; the latter first.
    [[nodiscard]] const std::vector<test::Octets> &packets() const { return packets_; }
    [[nodiscard]] std::size_t variedPackets() const { return variedPackets_; }

    // Even numbers go through all packets of the captures and then through all their beginnings; odd ones are drawn.
    [[nodiscard]] Input input(std::uint64_t number) const;

private:
    struct Beginning {
        std::uint32_t packet;
        std::uint32_t octets;
    };
    [[nodiscard]] test::Octets drawnPacket(Random &random, const char *&origin) const;

    std::uint64_t seed_;
    std::vector<test::Octets> packets_;
    std::size_t variedPackets_ = 0; // those that hold every field stand in front
    std::vector<Beginning> beginnings_;
};

} // namespace netfloor::compare
