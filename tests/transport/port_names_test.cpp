// SPDX-License-Identifier: MIT
// The names of the ports, which are the same under UDP and TCP.
#include <cstdint>
#include <string>

#include <gtest/gtest.h>

#include "support/runs.h"

namespace netfloor::test {
namespace {

constexpr std::size_t ipv4Fields = 18;

struct PortNames {
    std::string md, to; // of the source port; the destination port has to agree
};

std::string between(const std::string &text, const std::string &front, const std::string &back) {
    EXPECT_TRUE(text.starts_with(front) && text.ends_with(back) && text.size() >= front.size() + back.size()) << text;
    return text.substr(front.size(), text.size() - front.size() - back.size());
}

PortNames portNames(std::uint16_t port) {
    const Octets packet = ipv4({.protocol = 17, .payload = udp(port, port)});
    const Report md = sharedHost().run(Pass::md, packet);
    const Report to = sharedHost().run(Pass::to, packet);
    const std::string number = " (" + std::to_string(port) + ")";
    const std::string name = between(md.fields[ipv4Fields].text, "  UDP Source Port=", number);
    const std::string mnemonic = between(to.displays[ipv4Fields].text, "UDP - ", number);
    EXPECT_EQ(md.fields[ipv4Fields + 1].text, "  UDP Destination Port=" + name + number);
    EXPECT_EQ(to.displays[ipv4Fields + 1].text, "UDP - " + mnemonic + number);
    return {name, mnemonic};
}

// FNV-1a over a line "port|long text|mnemonic" for each port.
class Digest {
public:
    void add(const std::string &line) {
        for (const char letter : line) {
            value_ = (value_ ^ static_cast<std::uint8_t>(letter)) * 0x100000001b3;
        }
    }
    [[nodiscard]] std::uint64_t value() const { return value_; }

private:
    std::uint64_t value_ = 0xcbf29ce484222325;
};

TEST(PortNames, ofAllPorts) {
    Digest digest;
    std::size_t named = 0;
    for (unsigned port = 0; port <= 65535; ++port) {
        const std::string number = std::to_string(port);
        const PortNames names = portNames(static_cast<std::uint16_t>(port));
        named += names.md != number ? 1 : 0;
        digest.add(number + '|' + names.md + '|' + names.to + '\n');
    }
    EXPECT_EQ(named, 291U);
    EXPECT_EQ(digest.value(), 0x59f09ebfbe106403) << "by a list that was not made from the plug-in's";
}

} // namespace
} // namespace netfloor::test
