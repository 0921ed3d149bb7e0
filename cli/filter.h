// SPDX-License-Identifier: MIT
// libpcap's filter language over packets of any link type.
#pragma once

#include <map>
#include <memory>
#include <string>

#include <pcap/pcap.h>

#include "capture/capture.h"

namespace netfloor::cli {

class Filter {
public:
    // An empty expression lets all packets pass.
    explicit Filter(std::string expression);

    // Throws UsageError when the expression has no meaning on the packet's link type.
    [[nodiscard]] bool passes(const CapturedPacket &packet);

private:
    struct FreeProgram {
        void operator()(bpf_program *program) const;
    };
    using Program = std::unique_ptr<bpf_program, FreeProgram>;

    [[nodiscard]] Program compile(int linkType) const;

    std::string expression_;
    std::map<int, Program> programs_; // by link type
};

} // namespace netfloor::cli
