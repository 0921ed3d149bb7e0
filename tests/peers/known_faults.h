// SPDX-License-Identifier: MIT
// Where the checks say something else of a packet than tshark and tcpdump, and why.
#pragma once

#include <algorithm>
#include <array>
#include <span>
#include <string_view>

#include "netfloor-host/checks.h"
#include "peers/complaints.h"

namespace netfloor::test {

// A complaint that the checks do not share.
struct KnownComplaint {
    std::string_view why;
    bool (*applies)(const Complaint &, std::span<const std::uint8_t> packet, bool isCut);
};

inline bool isVersion(std::span<const std::uint8_t> packet, unsigned version) {
    return !packet.empty() && packet[0] >> 4U == version;
}

// Of an IPv4 packet without options: whether it is an ICMP error.
inline bool quotes(std::span<const std::uint8_t> packet) {
    constexpr std::size_t header = 20;
    constexpr std::array<std::uint8_t, 5> errors = {3, 4, 5, 11, 12};
    return isVersion(packet, 4) && packet.size() > header && packet[9] == 1 &&
           std::ranges::find(errors, packet[header]) != errors.end();
}

inline constexpr std::array knownComplaints = {
    KnownComplaint{"the snap length has cut the packet",
                   [](const Complaint &complaint, std::span<const std::uint8_t>, bool isCut) {
                       return isCut && (complaint.text.find("[|") != std::string::npos ||
                                        complaint.text.find("[truncated-option]") != std::string::npos);
                   }},
    KnownComplaint{"tshark reads extension headers of IPv6 after IPv4",
                   [](const Complaint &complaint, std::span<const std::uint8_t> packet, bool) {
                       const bool isInIpv6 = isVersion(packet, 6) && packet.size() > 6 && packet[6] == 4;
                       return (isVersion(packet, 4) || isInIpv6) && complaint.text.find("tshark") == 0 &&
                              (complaint.text.find("ipv6.opt") != std::string::npos ||
                               complaint.text.find("malformed IPv6") != std::string::npos);
                   }},
    KnownComplaint{"tshark sums the part of a segment that an ICMP error quotes; 8 octets of TCP are a whole quote",
                   [](const Complaint &complaint, std::span<const std::uint8_t> packet, bool) {
                       return quotes(packet) && complaint.protocol == "TCP" &&
                              (complaint.isChecksum || complaint.text.find("[|tcp]") != std::string::npos);
                   }},
    KnownComplaint{"tcpdump leaves out the home address of a sender on the move",
                   [](const Complaint &complaint, std::span<const std::uint8_t> packet, bool) {
                       constexpr std::uint8_t option = 201;
                       return isVersion(packet, 6) && std::ranges::find(packet, option) != packet.end() &&
                              complaint.text == "tcpdump bad udp cksum";
                   }},
    KnownComplaint{"the fields of rare ICMPv6 messages are not checked",
                   [](const Complaint &complaint, std::span<const std::uint8_t> packet, bool) {
                       constexpr std::size_t type = 40;
                       constexpr std::uint8_t lastUsual = 137; // redirect
                       return complaint.protocol == "ICMPv6" && !complaint.isChecksum && packet.size() > type &&
                              packet[6] == 58 && packet[type] > lastUsual;
                   }},
    KnownComplaint{"tcpdump knows which option of multipath TCP comes with which flags",
                   [](const Complaint &complaint, std::span<const std::uint8_t> packet, bool) {
                       return complaint.text == "tcpdump [bad opt]" &&
                              std::ranges::find(packet, std::uint8_t{30}) != packet.end();
                   }},
};

// Damage of which neither tshark nor tcpdump says anything.
inline constexpr std::array<std::string_view, 5> knownDamage = {
    "a fragment with others after it",              // must be whole units of 8 octets
    "the authentication header has",                // shown as octets
    "a hop-by-hop header is not the first one",     // read wherever it stands
    "the routing header has # segments left and #", // not compared
    "the header ends # octets short of #",          // after such a hop-by-hop header
};

} // namespace netfloor::test
