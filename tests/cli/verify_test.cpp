// SPDX-License-Identifier: MIT
// The damaged packets of the captures, and no others. tcpdump or tshark name all of them but three, which say why.
#include <gtest/gtest.h>

#include "cli/command.h"

namespace netfloor::test {
namespace {

TEST(Verify, callsDamagedWhatIsDamaged) {
    checkExact({
        {"for f in $C/*.pcap*; do bad=$(netfloor verify --bad $f | awk '/ DAMAGED / { printf \" %s\", $1 }'); "
         "[ -z \"$bad\" ] || echo ${f##*/}$bad; done",
         "ip4-header-length-invalid.pcap 1\n"
         "ip6-malformed-fragments.pcap 11\n" // a fragment of no whole units, which tshark lets pass
         "ip6-next-header-malformed.pcap 1\n"
         "ip6-zero-length-ah.pcap 5\n" // octets where tshark shows an authentication header without a word on it
         "malformed-too-small.pcap 1 2 3 4 5 6 7 8\n"
         "malformed-truncated-header.pcap 1\n"
         "sctp-over-ipv6.pcap 1\n" // a checksum that a test wrote; tshark does not check it unless asked
         "sctp-too-small.pcap 1\n"
         "tcp-urgent-loopback.pcap 8 11 23 35 36 56 59\n"},
    });
}

} // namespace
} // namespace netfloor::test
