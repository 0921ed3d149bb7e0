// SPDX-License-Identifier: MIT
// Values as text: addresses, flags, key fields.
#include <cstdint>
#include <numeric>
#include <string>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

#include "netfloor-host/testing.h"
#include "support/packets.h"

namespace netfloor::test {
namespace {

Ipv6Octets octetsOf(std::string_view text) {
    Ipv6Octets octets = {};
    const Octets given = hex(text);
    std::copy(given.begin(), given.end(), octets.begin());
    return octets;
}

TEST(Text, showsIpv6AddressesAsRfc5952Asks) {
    const std::pair<std::string_view, std::string_view> cases[] = {
        {"", "::"},
        {"00*15 01", "::1"},
        {"20010db8 00*11 01", "2001:db8::1"},
        {"20010db8 0000 0001 0001 0001 0001 0001", "2001:db8:0:1:1:1:1:1"}, // one group is not shortened
        {"2001 0000 0000 0001 0000 0000 0000 0001", "2001:0:0:1::1"},       // the longest run
        {"20010db8 0000 0000 0001 0000 0000 0001", "2001:db8::1:0:0:1"},    // the first of two runs
        {"2001 0db8 aaaa bbbb cccc dddd eeee 0000", "2001:db8:aaaa:bbbb:cccc:dddd:eeee:0"},
        {"2001 0db8 aaaa bbbb cccc dddd 0000 0000", "2001:db8:aaaa:bbbb:cccc:dddd::"},
        {"0000 0000 0001 0002 0003 0004 0005 0006", "::1:2:3:4:5:6"},
        {"00*10 ffff c0a80001", "::ffff:192.168.0.1"},
        {"ABCDEF01 00*11 0A", "abcd:ef01::a"},
    };
    for (const auto &[octets, text] : cases) {
        EXPECT_EQ(ipv6Text(octetsOf(octets)), text);
    }
    for (std::uint32_t octet = 0; octet < 256; ++octet) {
        const std::string text = std::to_string(octet);
        EXPECT_EQ(ipv4Text(octet << 24 | octet << 16 | 0x6400 | octet), text + "." + text + ".100." + text);
    }
}

// `count` ranges of `bits` bits, one after the other.
FieldReport fieldOf(std::uint32_t firstBit, std::uint32_t count, std::uint32_t bits) {
    FieldReport field;
    for (std::uint32_t i = 0; i < count; ++i) {
        field.ranges.push_back({0, firstBit + i * bits, firstBit + (i + 1) * bits - 1});
    }
    return field;
}

TEST(Text, findsIpv6AddressesByTheirRanges) {
    Octets packet(20);
    std::iota(packet.begin(), packet.end(), std::uint8_t{0});
    const Ipv6Octets wanted = octetsOf("02030405 06070809 0a0b0c0d 0e0f1011");

    for (const auto &[count, bits] : {std::pair{1U, 128U}, {8U, 16U}, {32U, 4U}}) {
        EXPECT_EQ(ipv6Address(fieldOf(17, count, bits), packet), wanted) << count;
    }
    const std::pair<FieldReport, const char *> others[] = {
        {fieldOf(17, 16, 8), "16 octets are a byte string"},
        {fieldOf(17, 1, 32), "too short"},
        {fieldOf(17, 0, 0), "without a range"},
        {fieldOf(20, 1, 128), "off an octet border"},
        {fieldOf(41, 1, 128), "past the packet's end"},
    };
    for (const auto &[field, why] : others) {
        EXPECT_EQ(ipv6Address(field, packet), std::nullopt) << why;
    }
    FieldReport scattered = fieldOf(17, 8, 16);
    scattered.ranges[3].firstBit += 16;
    scattered.ranges[3].lastBit += 16;
    EXPECT_EQ(ipv6Address(scattered, packet), std::nullopt);
}

// The plug-in stores an address in 17 octets.
TEST(Text, showsNoAddressThatDidNotFit) {
    TestRunOptions narrow;
    narrow.byteAreaSize = 16;
    const Report report = Host(PluginLibrary::open(NETFLOOR_PLUGIN)).run(Pass::xtr, ipv6({}), narrow);
    EXPECT_EQ(report.ending, Ending::cutOff);
    EXPECT_EQ(keyText(*report.key("Source IP Address")), "");
    EXPECT_EQ(report.key("Source IP Address")->number >> 31, 1U);
}

TEST(Text, showsKeyFieldsByTheirTypes) {
    // Stored with the nibbles of each octet exchanged.
    const KeyValue address = {"Source IP Address", 97, KeyType::ipv6Address, 0, hex("0210d08b 00*11 10")};
    EXPECT_EQ(keyText(address), "2001:db8::1");
    EXPECT_EQ(keyText({"Source IP Address", 97, KeyType::ipv6Address, 0x80000080, {}}), "") << "did not fit";
    EXPECT_EQ(keyText({"Source Address", 5, KeyType::ipv4Address, 0x0a000001, {}}), "10.0.0.1");
    EXPECT_EQ(keyText({"TSN", 87, KeyType::number32, 0xffffffff, {}}), "4294967295");
}

TEST(Text, namesFlags) {
    using Names = std::vector<std::string>;
    EXPECT_EQ(flagNames(0), Names());
    EXPECT_EQ(flagNames(0x2 | 0x10), (Names{"expectation not met", "bits left over inside a length"}));
    EXPECT_EQ(flagNames(0x80000008), (Names{"length reaches past the bits left", "flag 0x80000000"}));
}

} // namespace
} // namespace netfloor::test
