// SPDX-License-Identifier: MIT
// Which of our fields are compared with which of tshark's.
#pragma once

#include <array>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace netfloor::test {

// The form of a value, so that both sides can be written in the same way.
enum class Form : std::uint8_t {
    number,
    words,     // ours counts 4 octets, tshark's one
    eighths,   // ours counts one octet, tshark's 8
    backwards, // a number of 32 bits that the grammar reads from the last octet on
    ipv4,
    ipv6,
};

// A field of tshark's and the ids under which its values are reported. Either side has as many values as the packet has
// such fields: headers in tunnels and quotations, options, chunks.
struct Pair {
    std::string_view peer;
    std::vector<std::uint32_t> ids;
    Form form = Form::number;
    // Only in IPv6 headers of this protocol number: "Next Header" and its length have one id for all of them.
    std::optional<std::uint32_t> header = {};
};

inline const std::vector<Pair> pairs = {
    // IPv4, an IPv4 header inside it, and one that an ICMP message quotes.
    {"ip.hdr_len", {152, 630, 606}, Form::words},
    {"ip.tos.precedence", {286, 607}},
    {"ip.tos.delay", {287, 608}},
    {"ip.tos.throughput", {288, 609}},
    {"ip.tos.reliability", {289, 610}},
    {"ip.len", {153, 631, 612}},
    {"ip.id", {156, 632, 615}},
    {"ip.flags.df", {292, 617}},
    {"ip.flags.mf", {293, 618}},
    {"ip.frag_offset", {294, 619}, Form::eighths},
    {"ip.ttl", {157, 633, 620}},
    {"ip.proto", {295, 634, 663, 666, 669, 672, 675, 679, 682, 685, 688, 691}},
    {"ip.checksum", {158, 635, 621}},
    {"ip.src", {159, 636, 624}, Form::ipv4},
    {"ip.dst", {160, 637, 625}, Form::ipv4},
    {"ip.opt.type", {318, 321, 329, 339, 348, 357, 362, 381}},
    // ICMP.
    {"icmp.type", {531, 535, 537}},
    {"icmp.code", {542, 548, 556, 560, 567, 571, 576, 583, 587, 597, 600}},
    {"icmp.checksum", {543, 549, 557, 561, 568, 572, 577, 584, 588, 598, 601}},
    {"icmp.ident", {544, 578, 585, 602}},
    {"icmp.seq", {545, 579, 586, 603}},
    {"icmp.redir_gw", {564}, Form::ipv4},
    {"icmp.num_addrs", {589}},
    {"icmp.addr_entry_size", {590}},
    {"icmp.lifetime", {591}},
    {"icmp.address_mask", {604}, Form::ipv4},
    // GRE.
    {"gre.flags.checksum", {692}},
    {"gre.flags.key", {694}},
    {"gre.flags.sequence_number", {695}},
    {"gre.flags.version", {697}},
    {"gre.proto", {698}},
    {"gre.checksum", {702}},
    {"gre.key", {707}},
    {"gre.sequence_number", {711}},
    // UDP and TCP; the ports have an id for each tunnel.
    {"udp.srcport", {479}},
    {"udp.dstport", {482, 486, 488}},
    {"udp.length", {489}},
    {"udp.checksum", {490}},
    {"tcp.srcport", {384}},
    {"tcp.dstport", {387, 391, 393}},
    {"tcp.seq_raw", {394}},
    {"tcp.ack_raw", {395}},
    {"tcp.hdr_len", {398}, Form::words},
    {"tcp.flags.urg", {400}},
    {"tcp.flags.ack", {401}},
    {"tcp.flags.push", {402}},
    {"tcp.flags.reset", {403}},
    {"tcp.flags.syn", {404}},
    {"tcp.flags.fin", {405}},
    {"tcp.window_size_value", {406}},
    {"tcp.checksum", {407}},
    {"tcp.urgent_pointer", {408}},
    {"tcp.option_kind", {441, 444, 447, 452, 457, 461, 468, 474}},
    {"tcp.options.mss_val", {451}},
    {"tcp.options.wscale.shift", {456}},
    {"tcp.options.timestamp.tsval", {472}, Form::backwards},
    {"tcp.options.timestamp.tsecr", {473}, Form::backwards},
    // IPv6 and its extension headers.
    {"ipv6.tclass", {166}},
    {"ipv6.flow", {167}},
    {"ipv6.plen", {168}},
    {"ipv6.nxt", {220}, Form::number, 41},
    {"ipv6.hlim", {172}},
    {"ipv6.src", {956}, Form::ipv6},
    {"ipv6.dst", {952}, Form::ipv6},
    {"ipv6.hopopts.nxt", {220}, Form::number, 0},
    {"ipv6.hopopts.len", {222}, Form::number, 0},
    {"ipv6.dstopts.nxt", {220}, Form::number, 60},
    {"ipv6.dstopts.len", {222}, Form::number, 60},
    {"ipv6.opt.type", {232, 226, 238, 243}},
    {"ipv6.opt.length", {227, 239}},
    {"ipv6.routing.nxt", {220}, Form::number, 43},
    {"ipv6.routing.len", {222}, Form::number, 43},
    {"ipv6.routing.type", {177}},
    {"ipv6.routing.segleft", {181, 188}},
    {"ipv6.routing.src.addr", {948}, Form::ipv6},
    {"ipv6.fraghdr.nxt", {220}, Form::number, 44},
    {"ipv6.fraghdr.offset", {198}},
    {"ipv6.fraghdr.more", {200}},
    {"ipv6.fraghdr.ident", {201}, Form::backwards},
    {"ah.next_header", {220}, Form::number, 51},
    {"ah.length", {206}},
    {"ah.spi", {208}, Form::backwards},
    {"ah.sequence", {209}, Form::backwards},
    {"esp.spi", {215}, Form::backwards},
    {"esp.sequence", {216}, Form::backwards},
    // ICMPv6.
    {"icmpv6.type", {247}},
    {"icmpv6.code", {251, 256, 261, 266, 271, 277}},
    {"icmpv6.mtu", {258}},
    {"icmpv6.pointer", {268}},
    {"icmpv6.echo.identifier", {273, 279}},
    {"icmpv6.echo.sequence_number", {274, 280}},
    // SCTP.
    {"sctp.srcport", {795}},
    {"sctp.dstport", {796}},
    {"sctp.verification_tag", {797}},
    {"sctp.checksum", {798}},
    {"sctp.chunk_type", {802, 805}},
    {"sctp.chunk_length", {808, 824, 836, 874, 885, 888, 910, 891, 946}},
    {"sctp.data_tsn_raw", {817}},
    {"sctp.data_sid", {818}},
    {"sctp.data_ssn", {819}},
    {"sctp.data_payload_proto_id", {820}},
    {"sctp.init_initiate_tag", {825}},
    {"sctp.init_credit", {826}},
    {"sctp.init_nr_out_streams", {827}},
    {"sctp.init_nr_in_streams", {828}},
    {"sctp.init_initial_tsn", {829}},
    {"sctp.initack_initiate_tag", {837}},
    {"sctp.initack_credit", {838}},
    {"sctp.initack_nr_out_streams", {839}},
    {"sctp.initack_nr_in_streams", {840}},
    {"sctp.initack_initial_tsn", {841}},
    {"sctp.parameter_type", {847, 851, 863, 941}},
    {"sctp.sack_cumulative_tsn_ack_raw", {875}},
    {"sctp.sack_a_rwnd", {876}},
    {"sctp.sack_number_of_gap_blocks", {877}},
    {"sctp.sack_number_of_duplicated_tsns", {878}},
    {"sctp.shutdown_cumulative_tsn_ack", {886}},
};

} // namespace netfloor::test
