// SPDX-License-Identifier: MIT
// What tshark and tcpdump say against single packets, at the layers that netfloor decodes.
#pragma once

#include <cstdint>
#include <map>
#include <string>
#include <vector>

namespace netfloor::test {

struct Complaint {
    std::string protocol; // "IP" for both versions
    bool isChecksum = false;
    std::string text;
};

using Complaints = std::map<std::uint64_t, std::vector<Complaint>>; // by number of the packet

// What they infer from other packets is left out, and what they only remark: a low time to live, a SYN without options.
void addTsharkComplaints(const std::string &capture, Complaints &complaints);
void addTcpdumpComplaints(const std::string &capture, Complaints &complaints);

} // namespace netfloor::test
