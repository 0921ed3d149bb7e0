// SPDX-License-Identifier: MIT
// JSON lines, as an existing validator and a user of jq meet them.
#include <string>

#include <gtest/gtest.h>

#include "cli/command.h"

using namespace netfloor::test;

namespace {

TEST(Json, ofAllCapturesFitsItsSchema) {
    const Outcome schema =
        shell("netfloor json --schema | cmp - $C/../../docs/packet.schema.json || echo write it anew");
    EXPECT_EQ(schema.out, "") << schema.err;
    const Outcome all =
        shell("validate() { $C/../cli/validate_json.py $C/../../docs/packet.schema.json; }\n"
              "netfloor json --fields $C/*.pcap* 2>/dev/null | validate\n"
              "netfloor summary $C/*.pcap* 2>/dev/null | sed -n 's/^\\([0-9]*\\) packets.*/\\1 valid/p' | "
              "tail -n 1");
    const std::size_t half = all.out.size() / 2; // as many objects as packets
    EXPECT_GT(half, 6U);
    EXPECT_EQ(all.out.substr(0, half), all.out.substr(half)) << all.err;
}

TEST(Json, holdsWhateverPacketsHold) {
    // INIT with a host name of octets that are no text; then more chunks than fit into the output's buffer.
    const Octets name = hex("22 5c 0a 00 ff c3 a9 3c 2f 00*3");
    const Octets init =
        hex("0b59 0b5a 00000000 00000000 01 00 0024 00000001 00000002 0003 0004 00000005 000b 0010") + name;
    Octets chunks = hex("0b59 0b5a 00000000 00000000");
    const Octets cookieAck = hex("0b 00 0004");
    for (int i = 0; i < 5000; ++i) {
        chunks.insert(chunks.end(), cookieAck.begin(), cookieAck.end());
    }
    const Octets data = ipv4({.payload = hex("61*1400")});
    writeFile("hostile.pcapng",
              pcapngSection() + pcapngInterface(228, hex("0002 0004 ff 22 0a 41  0009 0001 09 00*3 0000 0000")) +
                  pcapngPacket(0, 1'700'000'000'123'456'789, ipv4({.protocol = 132, .payload = init})) +
                  pcapngPacket(0, 1, ipv4({.protocol = 132, .payload = chunks})) +
                  pcapngPacket(0, 86'399'999'999'999, data));
    const Outcome outcome = shell("netfloor json --fields $T/hostile.pcapng >$T/hostile.json\n"
                                  "$C/../cli/validate_json.py $C/../../docs/packet.schema.json <$T/hostile.json\n"
                                  "jq -c '[.time, .interface.name, (.layers[0].chunks | length)]' $T/hostile.json\n"
                                  "jq -c '.fields[] | select(.name == \"Host Name\") | .value' $T/hostile.json\n"
                                  "jq -c '.fields[] | select(.octets) | [(.octets | length), .bits]' $T/hostile.json");
    EXPECT_EQ(outcome.out, "3 valid\n"
                           "[\"2023-11-14T22:13:20.123456789Z\",\"\uFFFD\\\"\\nA\",1]\n"
                           "[\"1970-01-01T00:00:00.000000001Z\",\"\uFFFD\\\"\\nA\",5000]\n"
                           "[\"1970-01-01T23:59:59.999999999Z\",\"\uFFFD\\\"\\nA\",0]\n"
                           "\"225c0a00ffc3a93c2f000000\"\n"
                           "[2800,[[161,11360]]]\n")
        << outcome.err;
}

TEST(Json, endsInGoodOrder) {
    checkExact({
        {"netfloor json --packet 2 --where icmp $C/icmp-types.pcapng | jq -c '[.packet, .file]'", "[2,null]\n"},
        {"netfloor json --count 1 $C/icmp-types.pcapng $C/tcp-md5-bgp.pcap | jq -c '.file | split(\"/\") | last'",
         "\"icmp-types.pcapng\"\n\"tcp-md5-bgp.pcap\"\n"},
        {"head -c 1000 $C/tcp-md5-bgp.pcap >$T/cut.pcap; netfloor json $T/cut.pcap | jq .packet | tail -n 1; echo "
         "${PIPESTATUS[0]}",
         "8\n4\n"},
        {"netfloor json $C/icmp-types.pcapng >/dev/full; echo $?", "6\n"},
        {"netfloor json --schema | jq .properties.schema.const", "1\n"},
        {"netfloor json; echo $?", "2\n"},
    });
}

} // namespace
