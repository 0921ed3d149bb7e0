// SPDX-License-Identifier: MIT
// The key-field table, its set-up, and the stores into the key record.
#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <limits>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

#include "frame/bare_host.h"
#include "frame/example.h"

namespace netfloor::test {
namespace {

// The names of the rows, in the order in which a host finds them, each with a bar after it. Rows of new fields follow,
// and a last one without a name.
constexpr std::string_view names =
    "Version|Total Length|Identification|Time to Live|Protocol|Source Address|Destination Address|DF|MF|"
    "Fragment Offset|IP Address|ICMP Message Type|ICMP Message Type|ICMP Message Type|Code|ICMP Sequence Number|"
    "Code|ICMP Sequence Number|Code|Code|Code|Code|Code|Code|ICMP Sequence Number|Code|ICMP Sequence Number|Code|"
    "ICMP Sequence Number|Code|ICMP Sequence Number|Code|Code|Code|ICMP Sequence Number|Address Mask|Code|"
    "ICMP Sequence Number|Address Mask|Embedded IP Protocols|Embedded IP Protocols|Embedded IP Protocols|"
    "Embedded IP Protocols|Embedded IP Protocols|Embedded IP Protocols|Embedded IP Protocols|"
    "Embedded IP Protocols|Embedded IP Protocols|Embedded IP Protocols|TCP Source Port|TCP Destination Port|"
    "TCP Destination Port|TCP Destination Port|Sequence Number|Acknowledgement Number|Data Offset|RST|SYN|FIN|"
    "UDP Source Port|UDP Destination Port|UDP Destination Port|UDP Destination Port|"
    "Original Internet Header Length|Original IP Total Length|IPinIP Protocol|Original Src Address|"
    "Original Dest Address|MIPinIP Protocol|Original Dest Address|Original Src Address|Checksum Present|"
    "Key Present|Sequence Number Present|GRE Protocol|GRE Key|Sequence Number|ICMP Message Type|Code |Code |"
    "Code |Code |Code |Code |SCTP Source Port Number|SCTP Destination Port Number|SCTP Chunk Type|TSN|"
    "Stream Indetifier S|Stream Sequence Number n|Payload Protocol Identifier|"
    "Initial Transmission Sequence Number(I_TSN)|Initial Transmission Sequence Number(I_TSN)|Cumulative TSN Ack|"
    "Cumulative TSN Ack|Payload Length|Payload Length|Source IP Address|Destination IP Address|Next Header|"
    "IP Address|fragment Offset|M Flag|SPI|Sequence Number|SPI|Sequency Number|Header Extention length|"
    "Option Type|Option Type|Option Type|Opt Data Length|";

// Octets of the example's key fields, numbers in the order of a little-endian host.
constexpr const char *exampleKeys = "0=04\n1=28 00\n2=ab 00\n3=40\n4=11\n5=01 00 00 0a\n6=02 00 a8 c0\n7=01\n8=01\n"
                                    "9=c8 05\n59=35 00\n62=40 9c\n";

TEST(KeyTable, isHandedToTheHost) {
    BarePlugin plugin;
    BareRun run(examplePacket(), {}, plugin);
    EXPECT_EQ(run.enter(Pass::xtr), 1);
    std::string found;
    for (const KeyFieldRow &entry : plugin.tableAtLoad) {
        found.append(entry.fieldName).append("|");
        EXPECT_STREQ(entry.protocolName, "netfloor");
        EXPECT_EQ(entry.presenceOffset | entry.valueOffset | entry.presenceMask, 0u);
        EXPECT_EQ(entry.zero[0] | entry.zero[1] | entry.zero[2], 0u);
    }
    EXPECT_TRUE(found.starts_with(names)) << found;
    EXPECT_TRUE(found.ends_with("||") && found.find("||") == found.size() - 2) << found;
}

// A value takes the octets of its field's width and no more; other marks in a presence octet stay.
TEST(KeyRecord, holdsTheFieldsOfAPacket) {
    BareRun run(examplePacket());
    EXPECT_EQ(run.enter(Pass::xtr), 1);
    EXPECT_EQ(run.keyText(), exampleKeys);
    EXPECT_TRUE(run.modes.empty() && run.seen.empty());
    EXPECT_EQ(run.xtr.byteAreaOffset, 0u);
}

TEST(KeyRecord, isFilledAsFarAsThePacketGoes) {
    const std::string all = exampleKeys;
    struct Case {
        std::size_t octets;
        const char *nextRow; // the first that is not there
    };
    for (const Case &cut : {Case{0, "0="}, Case{1, "1="}, Case{3, "1="}, Case{4, "2="}, Case{39, "2="}}) {
        BareRun run(Octets(examplePacket().begin(), examplePacket().begin() + static_cast<std::ptrdiff_t>(cut.octets)));
        EXPECT_EQ(run.enter(Pass::xtr), 1);
        EXPECT_EQ(run.keyText(), all.substr(0, all.find(cut.nextRow))) << cut.octets;
    }
}

struct SmallAreaCase {
    std::uint16_t size;
    const char *area; // the first 17 octets; ee: not written
};

// An address is stored from its last nibble on, and turned round when it is whole. An area that is too small keeps what
// fits, less one nibble.
TEST(KeyRecord, addressInAnAreaThatIsTooSmall) {
    const Octets packet = ipv6({.source = {0x20, 0x01, 0x0d, 0xb8, 1, 2, 3, 4, 5, 6, 7, 8, 9, 0xab, 0xcd, 0xef}});
    const std::vector<SmallAreaCase> cases = {
        {0, "ee*17"},
        {1, "0e ee*16"},
        {3, "fe dc 0a ee*14"},
        {16, "fe dc ba 90 80 70 60 50 40 30 20 10 8b d0 10 02 ee"},
        {17, "02 10 d0 8b 10 20 30 40 50 60 70 80 90 ba dc fe 02"},
    };
    for (const SmallAreaCase &one : cases) {
        BareRun run(packet);
        run.keys.addresses.fill(KeyRoom::poison);
        run.xtr.byteAreaOffset = offsetof(KeyRoom, addresses);
        run.xtr.byteAreaSize = one.size;
        EXPECT_EQ(run.enter(Pass::xtr), one.size == 17 ? 1 : 0);
        EXPECT_EQ(hexText({run.keys.addresses.data(), 17}), hexText(hex(one.area))) << one.size;
        EXPECT_EQ(run.xtr.byteAreaOffset, offsetof(KeyRoom, addresses) + (one.size == 17 ? 32 : 0));
        std::uint32_t value = 0; // of row 97, the source address
        std::memcpy(&value, run.keys.values[97].data(), sizeof value);
        EXPECT_EQ(value >> 31, one.size == 17 ? 0 : 1);
    }
}

// The IPv6 packet with the most addresses: all that its length leaves room for are in routing headers.
Octets packetOfMostAddresses() {
    constexpr std::size_t mostInOneHeader = 127;
    constexpr std::size_t mostPayload = 65535;
    const Octets address = hex("21*16");
    Octets payload;
    for (std::size_t room = mostPayload; room >= 8 + address.size(); room = mostPayload - payload.size()) {
        const std::size_t count = std::min((room - 8) / address.size(), mostInOneHeader);
        payload = std::move(payload) + hex("2b") + Octets{static_cast<std::uint8_t>(2 * count)} + hex("00*6");
        for (std::size_t i = 0; i < count; ++i) {
            payload.insert(payload.end(), address.begin(), address.end());
        }
    }
    return ipv6({.nextHeader = 43, .payload = payload});
}

// How far one packet writes into the area of a host that sets no end to it.
TEST(KeyRecord, reachOfTheAddressesOfAPacket) {
    const Octets packet = packetOfMostAddresses();
    const struct {
        std::uint16_t start, end;
        std::size_t written; // octets from the key record on
    } cases[] = {
        {0, 65296, 65296}, {255, 15, 65551}, // the offset wraps after 65535
    };
    for (const auto &[start, end, written] : cases) {
        std::vector<std::uint8_t> record(std::size_t{1} << 17, KeyRoom::poison);
        BareRun run(packet);
        run.xtr.keyRecord = record.data();
        run.xtr.byteAreaOffset = start;
        run.xtr.byteAreaSize = 17;
        EXPECT_EQ(run.enter(Pass::xtr), 1);
        EXPECT_EQ(run.xtr.byteAreaOffset, end);
        const auto last =
            std::find_if(record.rbegin(), record.rend(), [](auto octet) { return octet != KeyRoom::poison; });
        EXPECT_EQ(static_cast<std::size_t>(record.rend() - last), written);
    }
}

constexpr std::uint16_t lastRow = 0xffff;

struct SetUpCase {
    std::vector<std::int32_t> answers; // of the host, in turn
    std::uint16_t presenceRow;
    std::vector<std::int32_t> results;    // of one entry after another
    std::vector<std::uint32_t> callsThen; // of the set-up, after each entry
    std::string present;                  // in the record of a packet without fields
};

// Refused once is refused for good, and so is ready; not ready is asked again.
TEST(KeyTable, isSetUpUntilItIsDone) {
    constexpr std::int32_t lowest = std::numeric_limits<std::int32_t>::min();
    const std::vector<SetUpCase> cases = {
        {{1}, 7, {1, 1, 1}, {1, 1, 1}, ""},
        {{0, 0, 0, 1}, 7, {1, 1, 1, 1, 1}, {1, 2, 3, 4, 4}, ""},
        {{-5, 1}, 7, {-5, -5, -5}, {1, 1, 1}, ""},
        {{lowest, 1}, 7, {lowest, lowest}, {1, 1}, ""},
        {{0, -7, 1}, 7, {1, -7, -7}, {1, 2, 2}, ""},
        {{2, -1}, 7, {1, 1, 1}, {1, 1, 1}, "7=\n"},
        {{0, 300, -1}, 0, {1, 1, 1}, {1, 2, 2}, "0=\n"},
        {{2}, lastRow, {1, 1}, {1, 1}, ""}, // the row of no field
    };
    for (const SetUpCase &setUp : cases) {
        BarePlugin plugin(setUp.answers, setUp.presenceRow);
        for (std::size_t entry = 0; entry < setUp.results.size(); ++entry) {
            SCOPED_TRACE("first answer " + std::to_string(setUp.answers[0]) + ", entry " + std::to_string(entry));
            BareRun run(examplePacket(), {}, plugin);
            EXPECT_EQ(run.enter(Pass::xtr), setUp.results[entry]);
            EXPECT_EQ(plugin.calls, setUp.callsThen[entry]);
            if (setUp.results[entry] < 0) {
                EXPECT_EQ(run.keyText(), "");
                EXPECT_EQ(run.state().cursor, 1u);
                EXPECT_EQ(run.state().layerHandedOff, 1u);
                EXPECT_EQ(run.state().blockName, std::string());
                EXPECT_EQ(run.xtr.bitsLeft, 0xeeeeeeeeu);
                continue;
            }
            const std::string ofLastRow =
                setUp.presenceRow == lastRow ? std::to_string(plugin.rowCount - 1) + "=\n" : "";
            EXPECT_EQ(run.keyText(), exampleKeys + ofLastRow);
            if (plugin.calls < setUp.callsThen.back()) {
                continue;
            }
            BareRun empty({}, {}, plugin);
            EXPECT_EQ(empty.enter(Pass::xtr), 1);
            EXPECT_EQ(empty.keyText(), setUp.present + ofLastRow);
        }
        BareRun other(examplePacket(), {}, plugin); // only the XTR pass asks
        EXPECT_EQ(other.enter(Pass::md), 1);
        EXPECT_EQ(plugin.calls, setUp.callsThen.back());
    }
}

} // namespace
} // namespace netfloor::test
