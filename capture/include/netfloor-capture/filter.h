// SPDX-License-Identifier: MIT
// libpcap's filter language for packets of any link type. libpcap is loaded with the first filter: loading it and the
// libraries that it needs takes longer than reading a small capture.
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

    // Throws FilterError when the expression compiles neither for the packet's link type nor for a usual one. Where it
    // does not compile for this link type alone, the packet does not pass, and is counted among the refused.
    [[nodiscard]] bool passes(const CapturedPacket &packet);

    // Packets for whose link type the expression does not compile.
    struct Refused {
        std::string reason; // libpcap's words
        std::uint64_t packets = 0;
    };
    [[nodiscard]] const std::map<int, Refused> &refused() const { return refused_; } // by link type
    // Whether the expression compiled for no packet that came.
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
    int linkType_ = -1;    // of the last packet, with one of:
    Program *program_ = nullptr;
    Refused *refusal_ = nullptr;
};

} // namespace netfloor
