// SPDX-License-Identifier: MIT
#include "netfloor-capture/filter.h"

#include <array>
#include <utility>

#include "libpcap.h"
#include "netfloor-capture/link_layer.h"

namespace netfloor {

namespace {

constexpr int snapOctets = 262144;

// Usual link types. An expression that compiles for none of them is wrong, and not only unsuitable for one link type.
constexpr std::array usualLinkTypes = {DLT_EN10MB, DLT_RAW, DLT_LINUX_SLL, DLT_IEEE802_11_RADIO, DLT_PPP};

} // namespace

struct PacketFilter::Program {
    Program() = default;
    ~Program() { libpcap()->freeCode(&code); }
    Program(const Program &) = delete;
    Program &operator=(const Program &) = delete;

    bpf_program code = {};
};

// One of the two.
struct PacketFilter::Compiled {
    std::unique_ptr<Program> program;
    std::string reason;
};

PacketFilter::PacketFilter(std::string expression) : expression_(std::move(expression)) {
    if (libpcap() == nullptr) {
        throw FilterError("A filter needs libpcap, which is not installed (Debian: apt-get install libpcap0.8). "
                          "Install it, or leave the filter out.");
    }
}

PacketFilter::~PacketFilter() = default;

PacketFilter::Compiled PacketFilter::compile(int linkType) const {
    const Libpcap &pcap = *libpcap();
    const std::unique_ptr<pcap_t, decltype(pcap.close)> handle(pcap.openDead(libpcapLinkType(linkType), snapOctets),
                                                               pcap.close);
    if (handle == nullptr) {
        return {nullptr, "out of memory"};
    }
    auto program = std::make_unique<Program>();
    if (pcap.compile(handle.get(), &program->code, expression_.c_str(), 1, PCAP_NETMASK_UNKNOWN) != 0) {
        return {nullptr, pcap.error(handle.get())};
    }
    return {std::move(program), {}};
}

void PacketFilter::add(int linkType) {
    Compiled compiled = compile(linkType);
    if (compiled.program != nullptr) {
        isSound_ = true;
        programs_.emplace(linkType, std::move(compiled.program));
        return;
    }
    for (const int usual : usualLinkTypes) {
        isSound_ = isSound_ || compile(usual).program != nullptr;
    }
    if (!isSound_) {
        throw FilterError("The filter '" + expression_ + "' has no meaning on " + linkTypeName(linkType) + ": " +
                          compiled.reason + ". The language is that of 'man pcap-filter'.");
    }
    refused_.emplace(linkType, Refused{std::move(compiled.reason), 0});
}

bool PacketFilter::passes(const CapturedPacket &packet) {
    if (packet.linkType != linkType_) {
        if (!programs_.contains(packet.linkType) && !refused_.contains(packet.linkType)) {
            add(packet.linkType);
        }
        linkType_ = packet.linkType;
        const auto program = programs_.find(linkType_);
        program_ = program == programs_.end() ? nullptr : program->second.get();
        refusal_ = program_ == nullptr ? &refused_.at(linkType_) : nullptr;
    }
    if (program_ == nullptr) {
        ++refusal_->packets;
        return false;
    }
    pcap_pkthdr header = {};
    header.caplen = static_cast<bpf_u_int32>(packet.octets.size());
    header.len = packet.wireOctets;
    return libpcap()->matches(&program_->code, &header, packet.octets.data()) != 0;
}

} // namespace netfloor
