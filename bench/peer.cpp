// SPDX-License-Identifier: MIT
#include "peer.h"

#include <algorithm>
#include <cstring>

#include <tins/ip.h>
#include <tins/ipv6.h>
#include <tins/tcp.h>
#include <tins/udp.h>

namespace netfloor::bench {
namespace {

void readTransport(const Tins::PDU &header, PeerKeys &keys) {
    if (const auto *udp = header.find_pdu<Tins::UDP>()) {
        keys.sourcePort = udp->sport();
        keys.destinationPort = udp->dport();
    } else if (const auto *tcp = header.find_pdu<Tins::TCP>()) {
        keys.sourcePort = tcp->sport();
        keys.destinationPort = tcp->dport();
        keys.sequence = tcp->seq();
        keys.acknowledgement = tcp->ack_seq();
        keys.dataOffset = tcp->data_offset();
        keys.reset = tcp->get_flag(Tins::TCP::RST) != 0;
        keys.synchronize = tcp->get_flag(Tins::TCP::SYN) != 0;
        keys.finish = tcp->get_flag(Tins::TCP::FIN) != 0;
    }
}

void readIpv4(std::span<const std::uint8_t> packet, PeerKeys &keys) {
    const Tins::IP ip(packet.data(), static_cast<std::uint32_t>(packet.size()));
    keys.version = ip.version();
    keys.totalLength = ip.tot_len();
    keys.identification = ip.id();
    keys.timeToLive = ip.ttl();
    keys.protocol = ip.protocol();
    keys.dontFragment = (ip.flags() & Tins::IP::DONT_FRAGMENT) != 0;
    keys.moreFragments = (ip.flags() & Tins::IP::MORE_FRAGMENTS) != 0;
    keys.fragmentOffset = static_cast<std::uint16_t>(ip.fragment_offset() * 8);
    const std::uint32_t source = ip.src_addr();
    const std::uint32_t destination = ip.dst_addr();
    std::memcpy(keys.source.data(), &source, sizeof source);
    std::memcpy(keys.destination.data(), &destination, sizeof destination);
    readTransport(ip, keys);
}

void readIpv6(std::span<const std::uint8_t> packet, PeerKeys &keys) {
    const Tins::IPv6 ip(packet.data(), static_cast<std::uint32_t>(packet.size()));
    keys.version = ip.version();
    keys.totalLength = ip.payload_length();
    keys.protocol = ip.next_header();
    const Tins::IPv6Address source = ip.src_addr();
    const Tins::IPv6Address destination = ip.dst_addr();
    std::copy_n(source.begin(), keys.source.size(), keys.source.begin());
    std::copy_n(destination.begin(), keys.destination.size(), keys.destination.begin());
    for (const Tins::IPv6::ext_header &header : ip.headers()) {
        ++keys.extensionHeaders;
        keys.extensionOctets = static_cast<std::uint16_t>(keys.extensionOctets + header.data_size());
    }
    readTransport(ip, keys);
}

} // namespace

void readKeys(std::span<const std::uint8_t> packet, PeerKeys &keys) {
    keys.extensionHeaders = 0;
    keys.extensionOctets = 0;
    if (packet[0] >> 4 == 6) {
        readIpv6(packet, keys);
    } else {
        readIpv4(packet, keys);
    }
}

} // namespace netfloor::bench
