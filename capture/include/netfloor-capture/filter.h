// SPDX-License-Identifier: MIT
// libpcap's filter language over packets of any link type. libpcap is loaded when a filter is made, and not before: it
// and the libraries it brings along cost a program more to start than a small capture costs to read.
#pragma once

#include <cstdint>
#include <map>
#include <memory>
#include <string>

#include "netfloor-capture/errors.h"
#include "netfloor-capture/packet.h"

namespace netfloor {

class PacketFilter {
public:
    // Throws FilterError when libpcap is not installed.
    explicit PacketFilter(std::string expression);
    ~PacketFilter();
    PacketFilter(const PacketFilter &) = delete;
    PacketFilter &operator=(const PacketFilter &) = delete;

    // Throws FilterError when the expression has a meaning neither on the packet's link type nor on a usual one.
    // Where only this link type is the reason, the packet does not pass, and is counted among the refused.
    [[nodiscard]] bool passes(const CapturedPacket &packet);

    // Packets on whose link type the expression has no meaning.
    struct Refused {
        std::string reason; // libpcap's words
        std::uint64_t packets = 0;
    };
    [[nodiscard]] const std::map<int, Refused> &refused() const { return refused_; } // by link type
    // Whether the expression had no meaning on any packet that came.
    [[nodiscard]] bool refusedAll() const { return programs_.empty() && !refused_.empty(); }

private:
    struct Program;
    struct Compiled;

    [[nodiscard]] Compiled compile(int linkType) const;
    void add(int linkType);

    std::string expression_;
    std::map<int, std::unique_ptr<Program>> programs_; // by link type
    std::map<int, Refused> refused_;
    bool isSound_ = false; // it has been compiled for one link type
    int linkType_ = -1;    // of the packet before, with one of:
    Program *program_ = nullptr;
    Refused *refusal_ = nullptr;
};

} // namespace netfloor
