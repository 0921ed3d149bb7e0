// SPDX-License-Identifier: MIT
#include "filter.h"

#include <utility>

#include "exit_code.h"
#include "link_layer.h"

namespace netfloor::cli {

namespace {

constexpr int snapOctets = 262144;

} // namespace

void Filter::FreeProgram::operator()(bpf_program *program) const {
    pcap_freecode(program);
    delete program;
}

Filter::Filter(std::string expression) : expression_(std::move(expression)) {}

Filter::Program Filter::compile(int linkType) const {
    const std::unique_ptr<pcap_t, decltype(&pcap_close)> handle(pcap_open_dead(linkType, snapOctets), pcap_close);
    Program program(new bpf_program{});
    if (pcap_compile(handle.get(), program.get(), expression_.c_str(), 1, PCAP_NETMASK_UNKNOWN) != 0) {
        throw UsageError("--filter '" + expression_ + "' on " + linkTypeName(linkType) + ": " +
                         pcap_geterr(handle.get()) + ". The language is that of 'man pcap-filter'.");
    }
    return program;
}

bool Filter::passes(const CapturedPacket &packet) {
    if (expression_.empty()) {
        return true;
    }
    auto found = programs_.find(packet.linkType);
    if (found == programs_.end()) {
        found = programs_.emplace(packet.linkType, compile(packet.linkType)).first;
    }
    pcap_pkthdr header = {};
    header.caplen = static_cast<bpf_u_int32>(packet.octets.size());
    header.len = packet.wireOctets;
    return pcap_offline_filter(found->second.get(), &header, packet.octets.data()) != 0;
}

} // namespace netfloor::cli
