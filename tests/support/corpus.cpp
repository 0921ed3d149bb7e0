// SPDX-License-Identifier: MIT
#include "support/corpus.h"

#include <cstdint>
#include <string_view>
#include <utility>

namespace netfloor::test {
namespace {

// A payload in IPv4 directly, in a tunnel (RFC 2003) and after minimal encapsulation (RFC 2004).
void addCarried(std::vector<Octets> &packets, std::uint8_t protocol, const Octets &payload) {
    packets.push_back(ipv4({.protocol = protocol, .payload = payload}));
    packets.push_back(ipv4({.protocol = 4, .payload = ipv4({.protocol = protocol, .payload = payload})}));
    packets.push_back(ipv4({.protocol = 55, .payload = Octets{protocol} + hex("80 abcd 0a000003 0a000004") + payload}));
}

Octets tcp(const Octets &options, const Octets &payload) {
    return hex("0050 9c40 01020304 05060708") + Octets{static_cast<std::uint8_t>((5 + options.size() / 4) << 4)} +
           hex("12 7210 beef 0007") + options + payload;
}

// The common header and one chunk after it.
Octets sctp(const Octets &chunk) {
    return ipv4({.protocol = 132, .payload = hex("0b59 0b5a 11223344 55667788") + chunk});
}

Octets extended(std::uint8_t nextHeader, std::string_view headers) {
    return ipv6({.nextHeader = nextHeader, .payload = hex(headers), .trafficClass = 0xa5, .flowLabel = 0x12345});
}

void addIpv4(std::vector<Octets> &packets) {
    for (const char *const options : {
             "01 820b 13af 0001 0002 000003 8307040a000001 8907040a000002 0707040a000003 88040007 00 00 00",
             "440c0510 00000001 00000002 440c0d11 0a000001 00000003 00000000",
         }) {
        packets.push_back(ipv4({.options = hex(options), .typeOfService = 0xb5, .fragment = 0xa000}));
    }
    packets.push_back(ipv4({.payload = hex("61 62 63"), .fragment = 0x2007}));
}

void addIcmp(std::vector<Octets> &packets) {
    const Octets quoted =
        ipv4({.protocol = 17, .payload = hex("0102030405060708"), .options = hex("01 01 00 00"), .fragment = 0x6009});
    for (const char *const head : {"03 01 abcd 00000000", "04 00 abcd 00000000", "05 02 abcd 0a000009",
                                   "0b 01 abcd 00000000", "0c 00 abcd 14 000000"}) {
        addCarried(packets, 1, hex(head) + quoted + hex("21 22 23"));
    }
    for (const char *const message : {"08 00 abcd 0007 0009 61 62", "0d 00 abcd 0007 0009 00000001 00000002 00000003",
                                      "0f 00 abcd 0007 0009", "09 00 abcd 01 02 0708 0a000005 80000000",
                                      "0a 00 abcd 00000000", "11 00 abcd 0007 0009 ffffff00", "2a 01 02 03"}) {
        packets.push_back(ipv4({.protocol = 1, .payload = hex(message)}));
    }
    for (const char *const message :
         {"01 04 abcd 00000000 60 00", "02 00 abcd 00000500 60 00", "03 01 abcd 00000000 60 00",
          "04 02 abcd 00000028 60 00", "80 00 abcd 0007 0009 61 62", "81 00 abcd 0007 0009 61 62"}) {
        packets.push_back(ipv6({.nextHeader = 58, .payload = hex(message)}));
    }
}

void addTransports(std::vector<Octets> &packets) {
    addCarried(packets, 17, udp(53, 40000, hex("61 62")));
    addCarried(packets, 6,
               tcp(hex("00 01 020405b4 030307 0402 050a0000000100000002 080a1122334455667788 fe00000000"), {}));
    packets.push_back(ipv4({.protocol = 6, .payload = tcp(hex("1312 00 01*15 01 01"), hex("61 62"))}));
}

void addTunnels(std::vector<Octets> &packets) {
    const Octets gre = hex("b5 15 880b abcd 0003 00000007 00000009 7e 21 22 7e 31 32");
    packets.push_back(ipv4({.protocol = 47, .payload = gre}));
    packets.push_back(
        ipv4({.protocol = 4, .payload = ipv4({.protocol = 47, .payload = gre, .options = hex("01 00 00 00")})}));
}

void addSctp(std::vector<Octets> &packets) {
    for (const char *const chunk : {
             "00 fb 0014 00000001 0002 0003 0000000a 61626364",
             R"(01 07 0064 00000001 00010000 0002 0003 00000004  # INIT
                0005 0008 0a000001  0006 0014 20010db8 00*11 01  0009 0008 00000064  000b 0008 61626364
                000c 0008 0005 0006  8000 0006 0102 c000 0008 01020304 00*6)",
             R"(02 07 0060 00000001 00010000 0002 0003 00000004  # INIT ACK
                0007 0008 01020304  0005 0008 0a000001  0006 0014 20010db8 00*11 01  000b 0008 61626364
                0008 0008 c001 0008 05060708  8000 0006 0102 c000 0006 0304 00*8)",
             "03 07 001c 00000001 00010000 0001 0001 0002 0003 00000005",
             "04 07 000c 0001 0008 01020304",
             "05 07 000c 0001 0008 01020304",
             "07 07 0008 00000001",
             "08 07 0004",
             "0a 07 0008 01020304",
             "0b 07 0004",
             "0c 07 0008 01020304",
             "0d 07 0008 01020304",
             "0e fe 0004",
             "2a 07 0008 01020304",
         }) {
        packets.push_back(sctp(hex(chunk)));
    }
    // The causes of an ABORT; the last ones are in an ERROR.
    for (const char *const cause :
         {"0001 0008 0007 0000", "0002 000a 00000001 0009", "0003 0008 00000005", "0004 0004", "0005 0008 01020304",
          "0006 0008 01020304", "0007 0004", "0008 000c c000 0008 01020304", "0009 0008 00000005", "000a 0004",
          "0063 0008 01020304"}) {
        const Octets octets = hex(cause);
        const Octets length = be16(static_cast<std::uint32_t>(4 + octets.size()));
        for (const char *const head : {"06 ff", "09 07"}) {
            packets.push_back(sctp(hex(head) + length + octets + Octets{0}));
        }
    }
}

void addIpv6(std::vector<Octets> &packets) {
    for (const auto &[nextHeader, headers] : {std::pair<std::uint8_t, const char *>{0, "3b 00 01 04 01020304"}, // PadN
                                              {0, "3b 00 00 00*5"},                                             // Pad1
                                              {60, "3b 00 1e 04 01020304"},                        // skipped
                                              {60, "3b 00 9e 04 01020304"},                        // discarded
                                              {43, "3b 02 00 01 00000000 20010db8 00*11 01"},      // type 0
                                              {43, "3b 00 04 00 01020304 0506"},                   // unknown
                                              {43, "3b 00 04 01 01020304"},                        // segments left
                                              {44, "3b 00 abcd 01020304 61"},                      // fragment
                                              {50, "01020304 00000005 61 62"},                     // security
                                              {51, "3b 02 0000 01020304 00000005 61626364 71"}}) { // authentication
        packets.push_back(extended(nextHeader, headers));
    }
}

} // namespace

std::vector<Octets> packetsOfAllFields() {
    std::vector<Octets> packets;
    addIpv4(packets);
    addIcmp(packets);
    addTransports(packets);
    addTunnels(packets);
    addSctp(packets);
    addIpv6(packets);
    return packets;
}

} // namespace netfloor::test
