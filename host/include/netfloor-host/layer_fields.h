// SPDX-License-Identifier: MIT
// The fields that have a name of their own beside the plug-in's, such as "tcp.source_port". One name stands for all
// fields of the plug-in that mean the same, which has one for each kind of carriage. This is the one table of these
// names: columns, the view of layers and all that is to come use it.
#pragma once

#include <array>
#include <cstdint>
#include <optional>
#include <span>
#include <string>
#include <string_view>
#include <vector>

#include "netfloor-host/field_knowledge.h"
#include "netfloor-host/field_tables.h"

namespace netfloor {

// What a layer is. A chunk of SCTP and a header that ICMP quotes are layers of their own.
enum class LayerKind : std::uint8_t {
    ip, // IPv4, IPv6, and the header of minimal encapsulation
    gre,
    icmp,
    icmpv6,
    quoted,
    tcp,
    udp,
    sctp,
    chunk,
    security, // ESP and AH
    payload,  // what an owner in the host named
};
inline constexpr std::size_t layerKinds = 11;

enum class LayerValue : std::uint8_t {
    number,       // in the unit of the plug-in
    packetNumber, // as the packet has it, as the plug-in reads its octets in another order
    ipv4Address,
    ipv6Address,
    octets, // the place in the packet
};

// One field of the plug-in and its name here.
struct LayerFieldSource {
    LayerKind kind = LayerKind::ip;
    std::string_view name;
    FieldName field; // as the plug-in names it
    LayerValue value = LayerValue::number;
    bool opensLayer = false; // a layer starts with it
};

// The place of a name: among the names of its kind.
struct LayerField {
    LayerKind kind = LayerKind::ip;
    std::uint8_t place = 0;

    friend bool operator==(const LayerField &, const LayerField &) = default;
};

namespace layer_field_rows {

using enum LayerValue;
inline constexpr bool opens = true;

// All rows of a name, and all names of a kind, stand together.
// clang-format off
inline constexpr std::array sources = {
    LayerFieldSource{LayerKind::ip, "ip.version", {"Version", 150}},
    LayerFieldSource{LayerKind::ip, "ip.version", {"Version", 629}, number, opens},
    LayerFieldSource{LayerKind::ip, "ip.header_length", {"Internet Header Length"}, number, opens},
    LayerFieldSource{LayerKind::ip, "ip.header_length", {"Original Internet Header Length"}},
    LayerFieldSource{LayerKind::ip, "ip.total_length", {"Total Length"}},
    LayerFieldSource{LayerKind::ip, "ip.total_length", {"Original IP Total Length"}},
    LayerFieldSource{LayerKind::ip, "ip.payload_length", {"Payload Length", 171}},
    LayerFieldSource{LayerKind::ip, "ip.identification", {"Identification", 156}},
    LayerFieldSource{LayerKind::ip, "ip.identification", {"Original Identification", 632}},
    LayerFieldSource{LayerKind::ip, "ip.traffic_class", {"Traffic Class"}, number, opens},
    LayerFieldSource{LayerKind::ip, "ip.flow_label", {"Flow Label"}},
    LayerFieldSource{LayerKind::ip, "ip.dont_fragment", {"DF"}},
    LayerFieldSource{LayerKind::ip, "ip.more_fragments", {"MF"}},
    LayerFieldSource{LayerKind::ip, "ip.more_fragments", {"M Flag"}},
    LayerFieldSource{LayerKind::ip, "ip.fragment_offset", {"Fragment Offset", 294}},
    LayerFieldSource{LayerKind::ip, "ip.fragment_offset", {"fragment Offset"}},
    LayerFieldSource{LayerKind::ip, "ip.fragment_identification", {"Identification", 201}, packetNumber},
    LayerFieldSource{LayerKind::ip, "ip.ttl", {"Time to Live", 157}},
    LayerFieldSource{LayerKind::ip, "ip.ttl", {"Time to Live", 633}},
    LayerFieldSource{LayerKind::ip, "ip.ttl", {"Hop Limit"}},
    LayerFieldSource{LayerKind::ip, "ip.protocol", {"Protocol"}},
    LayerFieldSource{LayerKind::ip, "ip.protocol", {"Next Header"}},
    LayerFieldSource{LayerKind::ip, "ip.protocol", {"IPinIP Protocol"}},
    LayerFieldSource{LayerKind::ip, "ip.protocol", {"MIPinIP Protocol"}, number, opens},
    LayerFieldSource{LayerKind::ip, "ip.header_checksum", {"Header Checksum", 158}},
    LayerFieldSource{LayerKind::ip, "ip.header_checksum", {"Header Checksum", 635}},
    LayerFieldSource{LayerKind::ip, "ip.header_checksum", {"Header Checksum", 643}},
    LayerFieldSource{LayerKind::ip, "ip.source", {"Source Address"}, ipv4Address},
    LayerFieldSource{LayerKind::ip, "ip.source", {"Original Src Address", 636}, ipv4Address},
    LayerFieldSource{LayerKind::ip, "ip.source", {"Original Src Address", 651}, ipv4Address},
    LayerFieldSource{LayerKind::ip, "ip.source", {"Source IP Address", 956}, ipv6Address},
    LayerFieldSource{LayerKind::ip, "ip.destination", {"Destination Address"}, ipv4Address},
    LayerFieldSource{LayerKind::ip, "ip.destination", {"Original Dest Address", 637}, ipv4Address},
    LayerFieldSource{LayerKind::ip, "ip.destination", {"Original Dest Address", 646}, ipv4Address},
    LayerFieldSource{LayerKind::ip, "ip.destination", {"Destination IP Address", 952}, ipv6Address},
    LayerFieldSource{LayerKind::gre, "gre.checksum_present", {"Checksum Present"}, number, opens},
    LayerFieldSource{LayerKind::gre, "gre.protocol", {"GRE Protocol"}},
    LayerFieldSource{LayerKind::gre, "gre.key", {"GRE Key"}},
    LayerFieldSource{LayerKind::gre, "gre.sequence_number", {"Sequence Number", 711}},
    LayerFieldSource{LayerKind::icmp, "icmp.type", {"ICMP Message Type", 531}, number, opens},
    LayerFieldSource{LayerKind::icmp, "icmp.type", {"ICMP Message Type", 535}, number, opens},
    LayerFieldSource{LayerKind::icmp, "icmp.type", {"ICMP Message Type", 537}, number, opens},
    LayerFieldSource{LayerKind::icmp, "icmp.code", {"Code", 542}},
    LayerFieldSource{LayerKind::icmp, "icmp.code", {"Code", 548}},
    LayerFieldSource{LayerKind::icmp, "icmp.code", {"Code", 556}},
    LayerFieldSource{LayerKind::icmp, "icmp.code", {"Code", 560}},
    LayerFieldSource{LayerKind::icmp, "icmp.code", {"Code", 567}},
    LayerFieldSource{LayerKind::icmp, "icmp.code", {"Code", 571}},
    LayerFieldSource{LayerKind::icmp, "icmp.code", {"Code", 576}},
    LayerFieldSource{LayerKind::icmp, "icmp.code", {"Code", 583}},
    LayerFieldSource{LayerKind::icmp, "icmp.code", {"Code", 587}},
    LayerFieldSource{LayerKind::icmp, "icmp.code", {"Code", 597}},
    LayerFieldSource{LayerKind::icmp, "icmp.code", {"Code", 600}},
    LayerFieldSource{LayerKind::icmp, "icmp.identifier", {"Identifier", 544}},
    LayerFieldSource{LayerKind::icmp, "icmp.identifier", {"Identifier", 578}},
    LayerFieldSource{LayerKind::icmp, "icmp.identifier", {"Identifier", 585}},
    LayerFieldSource{LayerKind::icmp, "icmp.identifier", {"Identifier", 602}},
    LayerFieldSource{LayerKind::icmp, "icmp.sequence_number", {"ICMP Sequence Number", 545}},
    LayerFieldSource{LayerKind::icmp, "icmp.sequence_number", {"ICMP Sequence Number", 579}},
    LayerFieldSource{LayerKind::icmp, "icmp.sequence_number", {"ICMP Sequence Number", 586}},
    LayerFieldSource{LayerKind::icmp, "icmp.sequence_number", {"ICMP Sequence Number", 603}},
    LayerFieldSource{LayerKind::icmp, "icmp.gateway", {"Gateway Internet Address"}, ipv4Address},
    LayerFieldSource{LayerKind::icmp, "icmp.pointer", {"Pointer", 573}},
    LayerFieldSource{LayerKind::icmpv6, "icmpv6.type", {"ICMP Message Type", 247}, number, opens},
    LayerFieldSource{LayerKind::icmpv6, "icmpv6.code", {"Code ", 251}},
    LayerFieldSource{LayerKind::icmpv6, "icmpv6.code", {"Code ", 256}},
    LayerFieldSource{LayerKind::icmpv6, "icmpv6.code", {"Code ", 261}},
    LayerFieldSource{LayerKind::icmpv6, "icmpv6.code", {"Code ", 266}},
    LayerFieldSource{LayerKind::icmpv6, "icmpv6.code", {"Code ", 271}},
    LayerFieldSource{LayerKind::icmpv6, "icmpv6.code", {"Code ", 277}},
    LayerFieldSource{LayerKind::icmpv6, "icmpv6.mtu", {"MTU "}},
    LayerFieldSource{LayerKind::icmpv6, "icmpv6.pointer", {"Pointer ", 268}},
    LayerFieldSource{LayerKind::icmpv6, "icmpv6.identifier", {"Identifier ", 273}},
    LayerFieldSource{LayerKind::icmpv6, "icmpv6.identifier", {"Identifier ", 279}},
    LayerFieldSource{LayerKind::icmpv6, "icmpv6.sequence_number", {"Sequence Number ", 274}},
    LayerFieldSource{LayerKind::icmpv6, "icmpv6.sequence_number", {"Sequence Number ", 280}},
    LayerFieldSource{LayerKind::quoted, "quoted.version", {"Version", 605}, number, opens},
    LayerFieldSource{LayerKind::quoted, "quoted.protocol", {"Embedded IP Protocols", 663}},
    LayerFieldSource{LayerKind::quoted, "quoted.protocol", {"Embedded IP Protocols", 666}},
    LayerFieldSource{LayerKind::quoted, "quoted.protocol", {"Embedded IP Protocols", 669}},
    LayerFieldSource{LayerKind::quoted, "quoted.protocol", {"Embedded IP Protocols", 672}},
    LayerFieldSource{LayerKind::quoted, "quoted.protocol", {"Embedded IP Protocols", 675}},
    LayerFieldSource{LayerKind::quoted, "quoted.protocol", {"Embedded IP Protocols", 679}},
    LayerFieldSource{LayerKind::quoted, "quoted.protocol", {"Embedded IP Protocols", 682}},
    LayerFieldSource{LayerKind::quoted, "quoted.protocol", {"Embedded IP Protocols", 685}},
    LayerFieldSource{LayerKind::quoted, "quoted.protocol", {"Embedded IP Protocols", 688}},
    LayerFieldSource{LayerKind::quoted, "quoted.protocol", {"Embedded IP Protocols", 691}},
    LayerFieldSource{LayerKind::quoted, "quoted.source", {"IP Source Address"}, ipv4Address},
    LayerFieldSource{LayerKind::quoted, "quoted.destination", {"IP Destination Address"}, ipv4Address},
    LayerFieldSource{LayerKind::quoted, "quoted.data", {"64-bit Original Data Datagram", 551}, octets},
    LayerFieldSource{LayerKind::quoted, "quoted.data", {"64-bit Original Data Datagram", 559}, octets},
    LayerFieldSource{LayerKind::quoted, "quoted.data", {"64-bit Original Data Datagram", 566}, octets},
    LayerFieldSource{LayerKind::quoted, "quoted.data", {"64-bit Original Data Datagram", 570}, octets},
    LayerFieldSource{LayerKind::quoted, "quoted.data", {"64-bit Original Data Datagram", 575}, octets},
    LayerFieldSource{LayerKind::tcp, "tcp.source_port", {"TCP Source Port"}, number, opens},
    LayerFieldSource{LayerKind::tcp, "tcp.destination_port", {"TCP Destination Port", 387}},
    LayerFieldSource{LayerKind::tcp, "tcp.destination_port", {"TCP Destination Port", 391}},
    LayerFieldSource{LayerKind::tcp, "tcp.destination_port", {"TCP Destination Port", 393}},
    LayerFieldSource{LayerKind::tcp, "tcp.sequence_number", {"Sequence Number", 394}},
    LayerFieldSource{LayerKind::tcp, "tcp.acknowledgement_number", {"Acknowledgement Number"}},
    LayerFieldSource{LayerKind::tcp, "tcp.data_offset", {"Data Offset"}},
    LayerFieldSource{LayerKind::tcp, "tcp.urg", {"URG"}},
    LayerFieldSource{LayerKind::tcp, "tcp.ack", {"ACK"}},
    LayerFieldSource{LayerKind::tcp, "tcp.psh", {"PSH"}},
    LayerFieldSource{LayerKind::tcp, "tcp.rst", {"RST"}},
    LayerFieldSource{LayerKind::tcp, "tcp.syn", {"SYN"}},
    LayerFieldSource{LayerKind::tcp, "tcp.fin", {"FIN"}},
    LayerFieldSource{LayerKind::tcp, "tcp.window", {"Window Size"}},
    LayerFieldSource{LayerKind::tcp, "tcp.checksum", {"Checksum", 407}},
    LayerFieldSource{LayerKind::tcp, "tcp.urgent_pointer", {"Urgent Pointer"}},
    LayerFieldSource{LayerKind::tcp, "tcp.maximum_segment_size", {"max seg size"}},
    LayerFieldSource{LayerKind::tcp, "tcp.window_scale", {"shift count"}},
    LayerFieldSource{LayerKind::tcp, "tcp.sack_permitted", {"TCP Option Kind", 457}},
    LayerFieldSource{LayerKind::tcp, "tcp.sack_left_edge", {"Left Edge of Block"}},
    LayerFieldSource{LayerKind::tcp, "tcp.sack_right_edge", {"Right Edge of Block"}},
    LayerFieldSource{LayerKind::tcp, "tcp.timestamp", {"TS value"}, packetNumber},
    LayerFieldSource{LayerKind::tcp, "tcp.timestamp_echo", {"TS Echo Reply"}, packetNumber},
    LayerFieldSource{LayerKind::tcp, "tcp.md5", {"MD5 digest"}, octets},
    LayerFieldSource{LayerKind::udp, "udp.source_port", {"UDP Source Port"}, number, opens},
    LayerFieldSource{LayerKind::udp, "udp.destination_port", {"UDP Destination Port", 482}},
    LayerFieldSource{LayerKind::udp, "udp.destination_port", {"UDP Destination Port", 486}},
    LayerFieldSource{LayerKind::udp, "udp.destination_port", {"UDP Destination Port", 488}},
    LayerFieldSource{LayerKind::udp, "udp.length", {"UDP Length"}},
    LayerFieldSource{LayerKind::udp, "udp.checksum", {"Checksum", 490}},
    LayerFieldSource{LayerKind::sctp, "sctp.source_port", {"SCTP Source Port Number"}, number, opens},
    LayerFieldSource{LayerKind::sctp, "sctp.destination_port", {"SCTP Destination Port Number"}},
    LayerFieldSource{LayerKind::sctp, "sctp.verification_tag", {"Verification Tag"}},
    LayerFieldSource{LayerKind::sctp, "sctp.checksum", {"Checksum", 798}},
    LayerFieldSource{LayerKind::chunk, "sctp.chunk_type", {"SCTP Chunk Type"}, number, opens},
    LayerFieldSource{LayerKind::chunk, "sctp.chunk_type", {"SCTP  Chunk Type"}, number, opens},
    LayerFieldSource{LayerKind::chunk, "sctp.chunk_length", {"Chunk Length", 808}},
    LayerFieldSource{LayerKind::chunk, "sctp.chunk_length", {"Length", 824}},
    LayerFieldSource{LayerKind::chunk, "sctp.chunk_length", {"Length", 836}},
    LayerFieldSource{LayerKind::chunk, "sctp.chunk_length", {"Length", 874}},
    LayerFieldSource{LayerKind::chunk, "sctp.chunk_length", {"Chunk Length", 946}},
    LayerFieldSource{LayerKind::chunk, "sctp.chunk_length", {"Length", 885}},
    LayerFieldSource{LayerKind::chunk, "sctp.chunk_length", {"Length", 888}},
    LayerFieldSource{LayerKind::chunk, "sctp.chunk_length", {"Chunk Length", 910}},
    LayerFieldSource{LayerKind::chunk, "sctp.chunk_length", {"Length", 891}},
    LayerFieldSource{LayerKind::chunk, "sctp.tsn", {"TSN"}},
    LayerFieldSource{LayerKind::chunk, "sctp.stream", {"Stream Indetifier S"}},
    LayerFieldSource{LayerKind::chunk, "sctp.stream_sequence_number", {"Stream Sequence Number n"}},
    LayerFieldSource{LayerKind::chunk, "sctp.payload_protocol", {"Payload Protocol Identifier"}},
    LayerFieldSource{LayerKind::chunk, "sctp.unordered", {"Unordered Data Chunk(U) Bit"}},
    LayerFieldSource{LayerKind::chunk, "sctp.begin_end", {"BE bits"}},
    LayerFieldSource{LayerKind::chunk, "sctp.initiate_tag", {"Initiate Tag", 825}},
    LayerFieldSource{LayerKind::chunk, "sctp.initiate_tag", {"Initiate Tag", 837}},
    LayerFieldSource{LayerKind::chunk, "sctp.receiver_window", {"Advertised Receiver Window Credit (a_rwnd)", 826}},
    LayerFieldSource{LayerKind::chunk, "sctp.receiver_window", {"Advertised Receiver Window Credit (a_rwnd)", 838}},
    LayerFieldSource{LayerKind::chunk, "sctp.receiver_window", {"Advertised Receiver Window Credit (a_rwnd)", 876}},
    LayerFieldSource{LayerKind::chunk, "sctp.outbound_streams", {"Number of Outbound Streams", 827}},
    LayerFieldSource{LayerKind::chunk, "sctp.outbound_streams", {"Number of Outbound Streams", 839}},
    LayerFieldSource{LayerKind::chunk, "sctp.inbound_streams", {"Number of Inbound Streams", 828}},
    LayerFieldSource{LayerKind::chunk, "sctp.inbound_streams", {"Number of Inbound Streams", 840}},
    LayerFieldSource{LayerKind::chunk, "sctp.initial_tsn", {"Initial Transmission Sequence Number(I_TSN)", 829}},
    LayerFieldSource{LayerKind::chunk, "sctp.initial_tsn", {"Initial Transmission Sequence Number(I_TSN)", 841}},
    LayerFieldSource{LayerKind::chunk, "sctp.cumulative_tsn", {"Cumulative TSN Ack", 875}},
    LayerFieldSource{LayerKind::chunk, "sctp.cumulative_tsn", {"Cumulative TSN Ack", 886}},
    LayerFieldSource{LayerKind::chunk, "sctp.gap_blocks", {"Number of Gap Ack Blocks"}},
    LayerFieldSource{LayerKind::chunk, "sctp.duplicate_tsns", {"Number of Duplicate TSNs"}},
    LayerFieldSource{LayerKind::chunk, "sctp.cause", {"Cause Code"}},
    LayerFieldSource{LayerKind::security, "security.spi", {"SPI", 215}, packetNumber, opens},
    LayerFieldSource{LayerKind::security, "security.spi", {"SPI", 208}, packetNumber, opens},
    LayerFieldSource{LayerKind::security, "security.sequence_number", {"Sequence Number", 216}, packetNumber},
    LayerFieldSource{LayerKind::security, "security.sequence_number", {"Sequency Number"}, packetNumber},
};
// clang-format on

} // namespace layer_field_rows

[[nodiscard]] constexpr std::span<const LayerFieldSource> layerFieldSources() {
    return layer_field_rows::sources;
}

// The place of a name of the table, or nothing.
[[nodiscard]] constexpr std::optional<LayerField> findLayerField(std::string_view name) {
    LayerField field;
    std::string_view before;
    for (const LayerFieldSource &row : layerFieldSources()) {
        if (!before.empty() && row.name != before) {
            field.place = row.kind == field.kind ? static_cast<std::uint8_t>(field.place + 1) : 0;
        }
        field.kind = row.kind;
        before = row.name;
        if (row.name == name) {
            return field;
        }
    }
    return std::nullopt;
}

// The same for a name in the source text: a wrong one does not compile.
[[nodiscard]] consteval LayerField layerField(std::string_view name) {
    return findLayerField(name).value();
}

// A name that stands for several fields, of which any may be meant. The rest of `fields` repeats the last one.
struct JointField {
    std::string_view name;
    std::array<LayerField, 3> fields;
};
inline constexpr std::array jointFields = {
    JointField{"source_port",
               {layerField("tcp.source_port"), layerField("udp.source_port"), layerField("sctp.source_port")}},
    JointField{
        "destination_port",
        {layerField("tcp.destination_port"), layerField("udp.destination_port"), layerField("sctp.destination_port")}},
    JointField{"ip.address", {layerField("ip.source"), layerField("ip.destination"), layerField("ip.destination")}},
    JointField{"tcp.port",
               {layerField("tcp.source_port"), layerField("tcp.destination_port"), layerField("tcp.destination_port")}},
    JointField{"udp.port",
               {layerField("udp.source_port"), layerField("udp.destination_port"), layerField("udp.destination_port")}},
    JointField{
        "sctp.port",
        {layerField("sctp.source_port"), layerField("sctp.destination_port"), layerField("sctp.destination_port")}},
};

// How many names a kind has.
[[nodiscard]] constexpr std::uint32_t layerFieldCount(LayerKind kind) {
    std::uint32_t count = 0;
    std::string_view before;
    for (const LayerFieldSource &row : layerFieldSources()) {
        count += row.kind == kind && row.name != before ? 1 : 0;
        before = row.name;
    }
    return count;
}

// The rows by the ids of one plug-in.
class LayerFieldMap {
public:
    struct Entry {
        LayerField field;
        LayerValue value = LayerValue::number;
        bool isKnown = false;
        bool opensLayer = false;
    };

    explicit LayerFieldMap(std::span<const FieldDescription> fields);

    [[nodiscard]] const Entry &find(std::uint32_t id) const { return entries_[id < entries_.size() ? id : 0]; }

    // An element for each id, 0 for those that are unknown: see Sink::wantedFields.
    [[nodiscard]] std::span<const std::uint8_t> known() const { return known_; }

    // A sentence for each row that does not name one field of the plug-in.
    [[nodiscard]] const std::vector<std::string> &mismatches() const { return mismatches_; }

private:
    std::vector<Entry> entries_; // by id; the first stands for all unknown ones
    std::vector<std::uint8_t> known_;
    std::vector<std::string> mismatches_;
};

} // namespace netfloor
