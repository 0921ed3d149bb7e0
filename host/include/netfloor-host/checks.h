// SPDX-License-Identifier: MIT
// Checks of a packet against the RFCs, without a plug-in: lengths against each other and against what was captured,
// options and chunks, checksums. They walk over the octets by themselves, so that they find what a grammar overlooks.
//
//     netfloor::PacketChecks checks;
//     for (const netfloor::Fault &fault : checks.check(packet)) {
//         std::cout << netfloor::faultText(fault) << '\n';
//     }
#pragma once

#include <cstdint>
#include <span>
#include <string>
#include <string_view>
#include <vector>

namespace netfloor {

enum class FaultKind : std::uint8_t {
    note,    // says nothing against the packet: a checksum that a network card fills in, a field without meaning
    misread, // nothing against the packet; the plug-in reads on from a wrong place after it (docs/reading.md)
    damage,
};

struct Fault {
    FaultKind kind = FaultKind::damage;
    std::string_view protocol; // "TCP"
    std::string_view text;     // '#' stands for the first number, then for the second
    std::uint32_t octet = 0;   // of the packet, where the field or header begins
    std::uint32_t first = 0;
    std::uint32_t second = 0;
    bool isQuoted = false; // in the packet that an ICMP error quotes, which routers may have changed: always a note
};

// "TCP: the data offset is 16 octets, and 20 is the least, at octet 32"
[[nodiscard]] std::string faultText(const Fault &fault);
// The same into a text whose room is kept.
void appendFaultText(std::string &text, const Fault &fault);

class PacketChecks {
public:
    // A packet from its IP header on, and its length on the wire where the capture holds less of it. What it gives is
    // valid until the next call. Nothing is allocated unless a packet has more faults than any before.
    [[nodiscard]] std::span<const Fault> check(std::span<const std::uint8_t> packet, std::size_t wireOctets = 0);

private:
    std::vector<Fault> faults_;
};

} // namespace netfloor
