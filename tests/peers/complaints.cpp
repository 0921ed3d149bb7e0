// SPDX-License-Identifier: MIT
#include "peers/complaints.h"

#include <cstdio>
#include <string_view>

#include "peers/peer_output.h"

namespace netfloor::test {

namespace {

using Texts = std::map<std::string, std::vector<std::string_view>>; // by protocol

const Texts expertFields = {
    {"IP",
     {"ip.bogus_ip_version", "ip.bogus_header_length", "ip.bogus_ip_length", "ip.checksum_bad.expert",
      "ip.opt.len.invalid", "ip.opt.ptr.before_address", "ip.opt.ptr.middle_address", "ip.subopt_too_long",
      "ip.cipso.malformed", "ipv6.bogus_ipv6_version", "ipv6.invalid_header", "ipv6.plen_exceeds_framing",
      "ipv6.plen_zero", "ipv6.opt.invalid_len", "ipv6.opt.header_mismatch", "ipv6.opt.jumbo.missing",
      "ipv6.opt.jumbo.prohibited", "ipv6.opt.jumbo.truncated", "ipv6.opt.jumbo.fragment"}},
    {"ICMP", {"icmp.checksum_bad", "icmp.ext.checksum_bad"}},
    {"ICMPv6", {"icmpv6.checksum_bad.expert", "icmpv6.invalid_option_length"}},
    {"TCP",
     {"tcp.bogus_header_length", "tcp.short_segment", "tcp.checksum_bad.expert", "tcp.checksum.ffff",
      "tcp.option.len.invalid", "tcp.suboption_malformed", "tcp.options.wscale.shift.invalid",
      "tcp.non_zero_bytes_after_eol", "tcp.ack.nonzero", "tcp.urgent_pointer.non_zero"}},
    {"UDP", {"udp.length.bad", "udp.length.bad_zero", "udp.checksum.zero", "udp.checksum.bad"}},
    {"SCTP",
     {"sctp.checksum_bad.expert", "sctp.chunk_length.bad", "sctp.parameter_length.bad", "sctp.sack_gap_block_malformed",
      "sctp.sack_gap_block_out_of_order"}},
    {"GRE", {"gre.checksum.incorrect"}}};

// "[Malformed Packet: TCP]", in which tshark ran out of octets.
const Texts malformedNames = {{"IP", {"IPv4]", "IPv6", "AH]"}},
                              {"ICMP", {"ICMP]"}},
                              {"ICMPv6", {"ICMPv6"}},
                              {"TCP", {"TCP"}},
                              {"UDP", {"UDP"}},
                              {"SCTP", {"SCTP"}},
                              {"GRE", {"GRE"}}};

const Texts tcpdumpTexts = {
    {"IP",
     {"bad cksum", "unknown ip ", "bad-hlen", "bad-len", "truncated-ip", "[bad length", "[bad ptr",
      "[truncated-option]", "[|ip", "[|hbhopt]", "[|dstopt]", "[|srcrt]", "[|frag]", "(rtalert: invalid len",
      "(homeaddr: invalid len", "(jumbo: invalid len"}},
    {"TCP", {"[|tcp]", "[bad hdr length", "[bad opt]", "(incorrect"}},
    {"UDP", {"[|udp]", "truncated-udp", "bad udp cksum"}},
    {"ICMP", {"wrong icmp cksum", "[|icmp]"}},
    {"ICMPv6", {"[bad icmp6 cksum", "[|icmp6]"}},
    {"GRE", {"[|gre]"}},
    {"SCTP", {"[|sctp]", "truncated-sctp", "bogus chunk length", "[Bad chunk length", "[chunk descriptor cut off"}}};

// Those of the texts of which the test holds.
template <class Test>
void addTexts(std::vector<Complaint> &complaints, const std::string &program, const Texts &texts, Test holds) {
    for (const auto &[protocol, ofProtocol] : texts) {
        for (const std::string_view text : ofProtocol) {
            if (holds(text)) {
                const bool isChecksum =
                    text.find("checksum") != text.npos || text.find("cksum") != text.npos || text == "(incorrect";
                complaints.push_back({protocol, isChecksum, program + ' ' + std::string(text)});
            }
        }
    }
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
    for (const auto &[protocol, fields] : expertFields) {
        for (const std::string_view field : fields) {
            command.append(" -e ").append(field);
        }
    }
    for (const std::string &line : linesOf(command + " 2>/dev/null")) {
        const std::vector<std::string> cells = split(line, '\t');
        std::vector<Complaint> &ofPacket = complaints[std::stoull(cells.at(0))];
        std::size_t cell = 2;
        addTexts(ofPacket, "tshark", expertFields, [&](std::string_view) { return !cells.at(cell++).empty(); });
        addTexts(ofPacket, "tshark malformed", malformedNames, [&](std::string_view name) {
            return cells[1].find("[Malformed Packet: " + std::string(name)) != std::string::npos;
        });
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
        addTexts(complaints[packet], "tcpdump", tcpdumpTexts,
                 [&](std::string_view text) { return line.find(text) != std::string::npos; });
    }
}

} // namespace netfloor::test
