// SPDX-License-Identifier: MIT
// The one table of columns. Fields of protocols have the names of netfloor-host/layer_fields.h; a field without a
// column, and a column of a protocol without a field, do not compile (rows.cpp).
#pragma once

#include <array>
#include <span>

#include "netfloor-analysis/columns.h"

namespace netfloor::column_table {

using enum ColumnType;
inline constexpr bool required = true;
inline constexpr bool repeated = true;

// Columns of one group stand together.
// clang-format off
inline constexpr std::array packets = {
    Column{"packet", u64, "number of the packet in its capture, from 1", required},
    Column{"time", time, "when it was captured, nanoseconds since 1970 UTC; none where the capture has none, or before 1678 or after 2261"},
    Column{"interface.number", u32, "number of the interface in its section of the capture, from 0", required},
    Column{"interface.name", text, "name of the interface, where the capture has one"},
    Column{"link_type", u32, "link layer, as www.tcpdump.org/linktypes.html numbers it", required},
    Column{"length", u32, "octets of the packet on the wire", required},
    Column{"captured_length", u32, "octets of the packet in the capture", required},
    Column{"ip_offset", u32, "octet of the captured packet at which its first IP header begins"},
    Column{"no_ip", text, "what a packet without IP is, such as ARP"},
    Column{"ip_layers", u8, "number of IP headers, one in the other; 16 at most are read", required},
    Column{"note", text, "why layers are missing"},
    Column{"checks.damaged", boolean, "whether a length, a header or a checksum is wrong; none without IP"},
    Column{"checks.damage", text, "what is wrong, with the octet from the first IP header on; sentences with '; ' between them"},
    Column{"checks.notes", text, "what says nothing against the packet, such as a checksum that the network card fills in"},
};

inline constexpr std::array layers = {
    Column{"packet", u64, "number of the packet in its capture, from 1", required, repeated},
    Column{"time", time, "of the packet", false, repeated},
    Column{"layer", u8, "number of the IP header in its packet, from 1", required},
    Column{"octet", u32, "octet at which the header begins, from the first IP header on", required},
    Column{"tunnel", text, "how it came into the layer before: IP, minimal, GRE, GTP-U or VXLAN"},
    Column{"tunnel_id", u32, "TEID of GTP-U, network identifier of VXLAN, key of GRE"},
    Column{"source_port", u16, "of TCP, UDP or SCTP", false, false, true},
    Column{"destination_port", u16, "of TCP, UDP or SCTP", false, false, true},
    Column{"ip.version", u8, "4 or 6; none in the header of minimal encapsulation"},
    Column{"ip.header_length", u8, "words of 4 octets in the IPv4 header"},
    Column{"ip.total_length", u16, "octets of the IPv4 packet with its header"},
    Column{"ip.payload_length", u16, "octets after the IPv6 header"},
    Column{"ip.identification", u16, "of IPv4, the same in all fragments of a packet"},
    Column{"ip.traffic_class", u8, "of IPv6"},
    Column{"ip.flow_label", u32, "of IPv6"},
    Column{"ip.dont_fragment", boolean, "of IPv4"},
    Column{"ip.more_fragments", boolean, "more fragments follow; of IPv4, or of IPv6 with a fragment header"},
    Column{"ip.fragment_offset", u16, "units of 8 octets; of IPv4, or of IPv6 with a fragment header"},
    Column{"ip.fragment_identification", u32, "of the fragment header of IPv6"},
    Column{"ip.ttl", u8, "time to live, hop limit of IPv6"},
    Column{"ip.protocol", u8, "number of what the header carries; of IPv6 the last header of the chain"},
    Column{"ip.header_checksum", u16, "of IPv4 and of minimal encapsulation"},
    Column{"ip.source", address, "source address"},
    Column{"ip.destination", address, "destination address"},
    Column{"gre.checksum_present", boolean, "bit of the GRE header"},
    Column{"gre.protocol", u16, "EtherType of what GRE carries"},
    Column{"gre.key", u32, "key of GRE"},
    Column{"gre.sequence_number", u32, "of GRE"},
    Column{"icmp.type", u8, "type of the ICMP message"},
    Column{"icmp.code", u8, "code of the ICMP message"},
    Column{"icmp.identifier", u16, "of echo, timestamp and information messages"},
    Column{"icmp.sequence_number", u16, "of echo, timestamp and information messages"},
    Column{"icmp.gateway", address, "router that a redirect names"},
    Column{"icmp.pointer", u8, "octet with the fault, of a parameter problem"},
    Column{"icmpv6.type", u8, "type of the ICMPv6 message"},
    Column{"icmpv6.code", u8, "code of the ICMPv6 message"},
    Column{"icmpv6.mtu", u32, "octets, of packet too big"},
    Column{"icmpv6.pointer", u32, "octet with the fault, of a parameter problem"},
    Column{"icmpv6.identifier", u16, "of echo messages"},
    Column{"icmpv6.sequence_number", u16, "of echo messages"},
    Column{"quoted.version", u8, "of the packet that an ICMP error quotes"},
    Column{"quoted.protocol", u8, "of the packet that an ICMP error quotes"},
    Column{"quoted.source", address, "of the packet that an ICMP error quotes"},
    Column{"quoted.destination", address, "of the packet that an ICMP error quotes"},
    Column{"quoted.data", octets, "the 8 octets after the quoted IP header, or as many as there are"},
    Column{"tcp.source_port", u16, "source port of TCP"},
    Column{"tcp.destination_port", u16, "destination port of TCP"},
    Column{"tcp.sequence_number", u32, "as in the header, not from the start of the connection"},
    Column{"tcp.acknowledgement_number", u32, "as in the header, not from the start of the connection"},
    Column{"tcp.data_offset", u8, "words of 4 octets in the TCP header"},
    Column{"tcp.urg", boolean, "flag of TCP"},
    Column{"tcp.ack", boolean, "flag of TCP"},
    Column{"tcp.psh", boolean, "flag of TCP"},
    Column{"tcp.rst", boolean, "flag of TCP"},
    Column{"tcp.syn", boolean, "flag of TCP"},
    Column{"tcp.fin", boolean, "flag of TCP"},
    Column{"tcp.window", u16, "window as in the header, not scaled"},
    Column{"tcp.checksum", u16, "checksum of TCP"},
    Column{"tcp.urgent_pointer", u16, "octets from the sequence number on"},
    Column{"tcp.maximum_segment_size", u16, "octets; option"},
    Column{"tcp.window_scale", u8, "shift count; option"},
    Column{"tcp.sack_permitted", boolean, "true where the option is there"},
    Column{"tcp.sack_left_edge", u32, "of the last SACK block; option"},
    Column{"tcp.sack_right_edge", u32, "of the last SACK block; option"},
    Column{"tcp.timestamp", u32, "TS value; option"},
    Column{"tcp.timestamp_echo", u32, "TS echo reply; option"},
    Column{"tcp.md5", octets, "MD5 digest of RFC 2385; option"},
    Column{"udp.source_port", u16, "source port of UDP"},
    Column{"udp.destination_port", u16, "destination port of UDP"},
    Column{"udp.length", u16, "octets of the UDP header and its payload"},
    Column{"udp.checksum", u16, "checksum of UDP"},
    Column{"sctp.source_port", u16, "source port of SCTP"},
    Column{"sctp.destination_port", u16, "destination port of SCTP"},
    Column{"sctp.verification_tag", u32, "of the common header"},
    Column{"sctp.checksum", u32, "as in the common header"},
    Column{"security.spi", u32, "security parameters index of the first AH or ESP header"},
    Column{"security.sequence_number", u32, "of the first AH or ESP header"},
};

inline constexpr std::array chunks = {
    Column{"packet", u64, "number of the packet in its capture, from 1", required, repeated},
    Column{"time", time, "of the packet", false, repeated},
    Column{"layer", u8, "number of the IP header that carries it", required, repeated},
    Column{"ip.source", address, "source address", false, repeated},
    Column{"ip.destination", address, "destination address", false, repeated},
    Column{"sctp.source_port", u16, "source port of SCTP", false, repeated},
    Column{"sctp.destination_port", u16, "destination port of SCTP", false, repeated},
    Column{"sctp.verification_tag", u32, "of the common header", false, repeated},
    Column{"chunk", u32, "number of the chunk under its IP header, from 1", required},
    Column{"octet", u32, "octet at which the chunk begins, from the first IP header on", required},
    Column{"sctp.chunk_type", u8, "type of the chunk", required},
    Column{"sctp.chunk_length", u16, "octets of the chunk with its head, without padding"},
    Column{"sctp.tsn", u32, "transmission sequence number of DATA"},
    Column{"sctp.stream", u16, "stream identifier of DATA"},
    Column{"sctp.stream_sequence_number", u16, "of DATA"},
    Column{"sctp.payload_protocol", u32, "payload protocol identifier of DATA"},
    Column{"sctp.unordered", boolean, "U bit of DATA"},
    Column{"sctp.begin_end", u8, "B and E bits of DATA: 3 is a whole message, 2 its first piece, 0 a middle one, 1 the last"},
    Column{"sctp.initiate_tag", u32, "of INIT and INIT ACK"},
    Column{"sctp.receiver_window", u32, "octets that the receiver takes; of INIT, INIT ACK and SACK"},
    Column{"sctp.outbound_streams", u16, "of INIT and INIT ACK"},
    Column{"sctp.inbound_streams", u16, "of INIT and INIT ACK"},
    Column{"sctp.initial_tsn", u32, "of INIT and INIT ACK"},
    Column{"sctp.cumulative_tsn", u32, "last TSN before a gap; of SACK and SHUTDOWN"},
    Column{"sctp.gap_blocks", u16, "number of gap ack blocks of SACK"},
    Column{"sctp.duplicate_tsns", u16, "number of duplicate TSNs of SACK"},
    Column{"sctp.cause", u16, "code of the last error cause of ABORT and ERROR; table causes has all"},
};

inline constexpr std::array causes = {
    Column{"packet", u64, "number of the packet in its capture, from 1", required, repeated},
    Column{"time", time, "of the packet", false, repeated},
    Column{"layer", u8, "number of the IP header that carries it", required, repeated},
    Column{"chunk", u32, "number of the chunk under its IP header", required, repeated},
    Column{"cause", u32, "number of the cause in its chunk, from 1", required},
    Column{"octet", u32, "octet at which the cause begins, from the first IP header on", required},
    Column{"cause_code", u16, "code of the error cause", required},
    Column{"cause_length", u16, "octets of the cause with its head, without padding", required},
    Column{"cause_value", octets, "octets after the head of the cause, as far as they were captured", required},
};
// clang-format on

[[nodiscard]] constexpr std::span<const Column> of(RowKind kind) {
    switch (kind) {
    case RowKind::packet: return packets;
    case RowKind::layer: return layers;
    case RowKind::chunk: return chunks;
    case RowKind::cause: break;
    }
    return causes;
}

} // namespace netfloor::column_table
