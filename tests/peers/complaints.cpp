// SPDX-License-Identifier: MIT
#include "peers/complaints.h"

#include <array>
#include <cstdio>
#include <string_view>

#include "peers/peer_output.h"

namespace netfloor::test {

namespace {

struct Row {
    std::string_view text; // tshark's field, or what tcpdump writes
    std::string_view protocol;
    bool isChecksum = false;
};

constexpr std::array expertFields = {
    Row{"ip.bogus_ip_version", "IP"},
    Row{"ip.bogus_header_length", "IP"},
    Row{"ip.bogus_ip_length", "IP"},
    Row{"ip.checksum_bad.expert", "IP", true},
    Row{"ip.opt.len.invalid", "IP"},
    Row{"ip.opt.ptr.before_address", "IP"},
    Row{"ip.opt.ptr.middle_address", "IP"},
    Row{"ip.subopt_too_long", "IP"},
    Row{"ip.cipso.malformed", "IP"},
    Row{"ipv6.bogus_ipv6_version", "IP"},
    Row{"ipv6.invalid_header", "IP"},
    Row{"ipv6.plen_exceeds_framing", "IP"},
    Row{"ipv6.plen_zero", "IP"},
    Row{"ipv6.opt.invalid_len", "IP"},
    Row{"ipv6.opt.header_mismatch", "IP"},
    Row{"ipv6.opt.jumbo.missing", "IP"},
    Row{"ipv6.opt.jumbo.prohibited", "IP"},
    Row{"ipv6.opt.jumbo.truncated", "IP"},
    Row{"ipv6.opt.jumbo.fragment", "IP"},
    Row{"icmp.checksum_bad", "ICMP", true},
    Row{"icmp.ext.checksum_bad", "ICMP", true},
    Row{"icmpv6.checksum_bad.expert", "ICMPv6", true},
    Row{"icmpv6.invalid_option_length", "ICMPv6"},
    Row{"tcp.bogus_header_length", "TCP"},
    Row{"tcp.short_segment", "TCP"},
    Row{"tcp.checksum_bad.expert", "TCP", true},
    Row{"tcp.checksum.ffff", "TCP", true},
    Row{"tcp.option.len.invalid", "TCP"},
    Row{"tcp.suboption_malformed", "TCP"},
    Row{"tcp.options.wscale.shift.invalid", "TCP"},
    Row{"tcp.non_zero_bytes_after_eol", "TCP"},
    Row{"tcp.ack.nonzero", "TCP"},
    Row{"tcp.urgent_pointer.non_zero", "TCP"},
    Row{"udp.length.bad", "UDP"},
    Row{"udp.length.bad_zero", "UDP"},
    Row{"udp.checksum.zero", "UDP", true},
    Row{"udp.checksum.bad", "UDP", true},
    Row{"sctp.checksum_bad.expert", "SCTP", true},
    Row{"sctp.chunk_length.bad", "SCTP"},
    Row{"sctp.parameter_length.bad", "SCTP"},
    Row{"sctp.sack_gap_block_malformed", "SCTP"},
    Row{"sctp.sack_gap_block_out_of_order", "SCTP"},
    Row{"gre.checksum.incorrect", "GRE", true},
};

// "[Malformed Packet: TCP]", in which tshark ran out of octets.
constexpr std::array malformedNames = {
    Row{"IPv4]", "IP"}, Row{"IPv6", "IP"},   Row{"ICMP]", "ICMP"}, Row{"ICMPv6", "ICMPv6"}, Row{"TCP", "TCP"},
    Row{"UDP", "UDP"},  Row{"SCTP", "SCTP"}, Row{"GRE", "GRE"},    Row{"AH]", "IP"},
};

constexpr std::array tcpdumpTexts = {
    Row{"bad cksum", "IP", true},
    Row{"unknown ip ", "IP"},
    Row{"bad-hlen", "IP"},
    Row{"bad-len", "IP"},
    Row{"truncated-ip", "IP"},
    Row{"[bad length", "IP"},
    Row{"[bad ptr", "IP"},
    Row{"[truncated-option]", "IP"},
    Row{"[|ip", "IP"},
    Row{"[|hbhopt]", "IP"},
    Row{"[|dstopt]", "IP"},
    Row{"[|srcrt]", "IP"},
    Row{"[|frag]", "IP"},
    Row{"(rtalert: invalid len", "IP"},
    Row{"(homeaddr: invalid len", "IP"},
    Row{"(jumbo: invalid len", "IP"},
    Row{"[|tcp]", "TCP"},
    Row{"[bad hdr length", "TCP"},
    Row{"[bad opt]", "TCP"},
    Row{"(incorrect", "TCP", true},
    Row{"[|udp]", "UDP"},
    Row{"truncated-udp", "UDP"},
    Row{"bad udp cksum", "UDP", true},
    Row{"wrong icmp cksum", "ICMP", true},
    Row{"[|icmp]", "ICMP"},
    Row{"[bad icmp6 cksum", "ICMPv6", true},
    Row{"[|icmp6]", "ICMPv6"},
    Row{"[|gre]", "GRE"},
    Row{"[|sctp]", "SCTP"},
    Row{"truncated-sctp", "SCTP"},
    Row{"bogus chunk length", "SCTP"},
    Row{"[Bad chunk length", "SCTP"},
    Row{"[chunk descriptor cut off", "SCTP"},
};

void add(Complaints &complaints, std::uint64_t packet, const Row &row, std::string_view text) {
    complaints[packet].push_back({std::string(row.protocol), row.isChecksum, std::string(text)});
}

} // namespace

void addTsharkComplaints(const std::string &capture, Complaints &complaints) {
    std::string command = "tshark -n -r '" + capture + "' -T fields -E separator=/t -e frame.number -e _ws.malformed";
    for (const char *const off : {"ip.defragment", "ipv6.defragment", "ip.tso_support", "tcp.desegment_tcp_streams",
                                  "tcp.analyze_sequence_numbers", "sctp.reassembly"}) {
        command += std::string(" -o ") + off + ":FALSE";
    }
    command += " -o ip.check_checksum:TRUE -o tcp.check_checksum:TRUE -o udp.check_checksum:TRUE"
               " -o 'sctp.checksum:CRC 32c'";
    for (const Row &row : expertFields) {
        command += " -e " + std::string(row.text);
    }
    for (const std::string &line : linesOf(command + " 2>/dev/null")) {
        const std::vector<std::string> cells = split(line, '\t');
        const std::uint64_t packet = std::stoull(cells.at(0));
        for (std::size_t i = 0; i < expertFields.size(); ++i) {
            if (!cells.at(i + 2).empty()) {
                add(complaints, packet, expertFields[i], "tshark " + std::string(expertFields[i].text));
            }
        }
        for (const Row &row : malformedNames) {
            if (cells[1].find("[Malformed Packet: " + std::string(row.text)) != std::string::npos) {
                add(complaints, packet, row, "tshark malformed " + std::string(row.text));
            }
        }
    }
}

// A packet begins with a line of its number and its time.
void addTcpdumpComplaints(const std::string &capture, Complaints &complaints) {
    unsigned long long packet = 0;
    for (const std::string &line : linesOf("TZ=UTC tcpdump -vv -n -# -r '" + capture + "' 2>/dev/null")) {
        unsigned long long number = 0;
        unsigned seconds = 0;
        if (std::sscanf(line.c_str(), "%llu %*2u:%*2u:%2u.", &number, &seconds) == 2) {
            packet = number;
        }
        for (const Row &row : tcpdumpTexts) {
            if (line.find(row.text) != std::string::npos) {
                add(complaints, packet, row, "tcpdump " + std::string(row.text));
            }
        }
    }
}

} // namespace netfloor::test
