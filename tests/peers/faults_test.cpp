// SPDX-License-Identifier: MIT
// The faults of single packets, as the checks and as tshark and tcpdump name them: in real captures, and in packets of
// them that are damaged octet by octet.
//
// Captures of another folder are compared with
//     NETFLOOR_PEER_CAPTURES=FOLDER build/tests/test_peers --gtest_filter='Faults.*'
#include <algorithm>
#include <cstdlib>
#include <map>
#include <set>
#include <string>
#include <string_view>
#include <vector>

#include <gtest/gtest.h>

#include "netfloor-capture/capture_file.h"
#include "netfloor-capture/link_layer.h"
#include "netfloor-host/checks.h"
#include "netfloor-host/plugin_host.h"
#include "peers/complaints.h"
#include "peers/known_faults.h"
#include "peers/peer_output.h"
#include "support/captures.h"
#include "support/packets.h"

namespace netfloor::test {
namespace {

constexpr std::uint32_t linkTypeRaw = 101;
constexpr std::size_t headers = 100; // octets of a packet that hold its headers

// "IPv6 extension" is IP, "SCTP chunk" is SCTP.
std::string_view familyOf(const Fault &fault) {
    const std::string_view name = fault.protocol.substr(0, fault.protocol.find(' '));
    return name.starts_with("IP") ? "IP" : name;
}

bool isOfChecksum(const Fault &fault) {
    return fault.text.find("checksum") != std::string_view::npos;
}

// A wrong checksum is no name for another fault. A fault of a quoted packet is one of the message, too.
bool isNamed(const Complaint &complaint, std::span<const Fault> faults) {
    return std::ranges::any_of(faults, [&](const Fault &fault) {
        const bool isOfProtocol = familyOf(fault).starts_with(complaint.protocol) ||
                                  (fault.isQuoted && complaint.protocol.starts_with("ICMP"));
        return isOfProtocol && (complaint.isChecksum || !isOfChecksum(fault));
    });
}

// After a wrong length each program reads on from another place.
bool isBroken(const Fault &fault) {
    return fault.kind == FaultKind::damage && !isOfChecksum(fault);
}

bool isKnown(const Complaint &complaint, std::span<const std::uint8_t> packet, bool isCut) {
    return std::ranges::any_of(knownComplaints,
                               [&](const KnownComplaint &row) { return row.applies(complaint, packet, isCut); });
}

bool isKnown(const Fault &fault) {
    return std::ranges::any_of(knownDamage, [&](std::string_view text) { return fault.text.starts_with(text); });
}

// One packet of each kind of difference.
using Differences = std::map<std::string, std::string>;

void compare(const std::vector<Complaint> &complaints, std::span<const Fault> faults, const PcapPacket &packet,
             Differences &found) {
    const std::string place = hexText(std::span(packet.octets).first(std::min(packet.octets.size(), headers)));
    const bool isCut = packet.wireOctets > packet.octets.size();
    for (const Complaint &complaint : complaints) {
        if (!isNamed(complaint, faults) && !std::ranges::any_of(faults, isBroken) &&
            !isKnown(complaint, packet.octets, isCut)) {
            found.emplace("not named: " + complaint.text, place);
        }
    }
    for (const Fault &fault : faults) {
        if (fault.kind == FaultKind::damage && complaints.empty() && !isKnown(fault)) {
            found.emplace("called damaged: " + std::string(fault.text), place);
        }
    }
}

// All packets with IP, and copies of those that have a field which no packet before had.
class Packets {
public:
    void addCapture(const std::string &file) {
        CaptureFile capture(file);
        for (CapturedPacket captured; capture.next(captured);) {
            const NetworkPart network = findNetworkPart(captured.linkType, captured.octets);
            if (!network.isIp()) {
                continue;
            }
            const Octets octets(network.octets.begin(), network.octets.end());
            const std::size_t rest = captured.wireOctets - captured.octets.size();
            all.push_back({octets, static_cast<std::uint32_t>(octets.size() + rest)});
            if (rest == 0 && hasNewField(octets)) {
                samples.push_back(octets);
            }
        }
    }

    std::vector<PcapPacket> all;
    std::vector<Octets> samples;

private:
    [[nodiscard]] bool hasNewField(const Octets &packet) {
        const std::size_t before = fields_.size();
        for (const FieldReport &field : host_.run(Pass::md, packet).fields) {
            fields_.insert(field.id);
        }
        return fields_.size() != before;
    }

    Host host_{PluginLibrary::open(NETFLOOR_PLUGIN)};
    std::set<std::uint32_t> fields_;
};

// Each octet of the headers with other values, and the packet ended before it: in the network, by its own length, and
// by the snap length.
void addDamaged(const Octets &packet, std::vector<PcapPacket> &all) {
    for (std::size_t at = 0; at < std::min(packet.size(), headers); ++at) {
        for (const int value : {0, 0xff, packet[at] + 1, packet[at] ^ 0x10}) {
            all.push_back({packet});
            all.back().octets[at] = static_cast<std::uint8_t>(value);
        }
        if (at != 0) {
            const Octets front(packet.begin(), packet.begin() + static_cast<std::ptrdiff_t>(at));
            all.push_back({front});
            all.push_back({shortened(packet, at)});
            all.push_back({front, static_cast<std::uint32_t>(packet.size())});
        }
    }
}

TEST(Faults, areThoseThatOthersName) {
    if (!isInstalled("tshark") || !isInstalled("tcpdump")) {
        GTEST_SKIP() << "tshark or tcpdump is not installed";
    }
    const char *const other = std::getenv("NETFLOOR_PEER_CAPTURES");
    Packets packets;
    for (const std::string &file : other == nullptr ? testCaptures() : testCaptures(other)) {
        packets.addCapture(file);
    }
    ASSERT_FALSE(packets.samples.empty());
    for (const Octets &packet : packets.samples) {
        addDamaged(packet, packets.all);
    }
    // One file, as tshark takes longer to start than to read most captures.
    const std::string file = writeFile("faults.pcap", pcapFile(linkTypeRaw, packets.all));
    Complaints complaints;
    addTsharkComplaints(file, complaints);
    addTcpdumpComplaints(file, complaints);
    Differences found;
    PacketChecks checks;
    std::size_t faults = 0;
    std::size_t said = 0;
    for (std::size_t i = 0; i < packets.all.size(); ++i) {
        const PcapPacket &packet = packets.all[i];
        const auto ours = checks.check(packet.octets, packet.wireOctets);
        faults += ours.size();
        said += complaints[i + 1].size();
        compare(complaints[i + 1], ours, packet, found);
    }
    EXPECT_EQ(found, Differences()) << packets.all.size() << " packets";
    EXPECT_GT(said, packets.samples.size()); // the others said something, and so did the checks
    EXPECT_GT(faults, packets.samples.size());
}

} // namespace
} // namespace netfloor::test
