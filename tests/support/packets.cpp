// SPDX-License-Identifier: MIT
#include "support/packets.h"

#include <algorithm>
#include <charconv>
#include <stdexcept>
#include <string>

namespace netfloor::test {
namespace {

std::string_view nextWord(std::string_view &text) {
    for (;;) {
        const auto start = text.find_first_not_of(" \t\n");
        text.remove_prefix(start == std::string_view::npos ? text.size() : start);
        if (!text.starts_with('#')) {
            break;
        }
        text.remove_prefix(std::min(text.find('\n'), text.size()));
    }
    const std::string_view word = text.substr(0, text.find_first_of(" \t\n#"));
    text.remove_prefix(word.size());
    return word;
}

unsigned number(std::string_view digits, int base, std::string_view word) {
    unsigned value = 0;
    const auto [end, error] = std::from_chars(digits.data(), digits.data() + digits.size(), value, base);
    if (error != std::errc() || end != digits.data() + digits.size()) {
        throw std::invalid_argument("no octets: \"" + std::string(word) + "\"");
    }
    return value;
}

void put16(Octets &octets, std::size_t at, std::size_t value) {
    octets.at(at) = static_cast<std::uint8_t>(value >> 8);
    octets.at(at + 1) = static_cast<std::uint8_t>(value);
}

} // namespace

Octets hex(std::string_view text) {
    Octets octets;
    for (std::string_view word = nextWord(text); !word.empty(); word = nextWord(text)) {
        const auto star = word.find('*');
        const std::string_view digits = word.substr(0, star);
        if (digits.size() % 2 != 0) {
            throw std::invalid_argument("half an octet: \"" + std::string(word) + "\"");
        }
        Octets part;
        for (std::size_t at = 0; at < digits.size(); at += 2) {
            part.push_back(static_cast<std::uint8_t>(number(digits.substr(at, 2), 16, word)));
        }
        unsigned times = star == std::string_view::npos ? 1 : number(word.substr(star + 1), 10, word);
        for (; times > 0; --times) {
            octets.insert(octets.end(), part.begin(), part.end());
        }
    }
    return octets;
}

std::string hexText(std::span<const std::uint8_t> octets) {
    constexpr std::string_view digits = "0123456789abcdef";
    std::string text;
    for (const std::uint8_t octet : octets) {
        text += text.empty() ? "" : " ";
        text += digits[octet >> 4];
        text += digits[octet & 15];
    }
    return text;
}

Octets operator+(Octets front, const Octets &back) {
    front.insert(front.end(), back.begin(), back.end());
    return front;
}

Octets be16(std::uint32_t value) {
    return {static_cast<std::uint8_t>(value >> 8), static_cast<std::uint8_t>(value)};
}

Octets be32(std::uint32_t value) {
    return be16(value >> 16) + be16(value);
}

Octets ipv4(const Ipv4 &header) {
    const std::size_t headerOctets = 20 + header.options.size();
    const auto words = header.headerWords.value_or(static_cast<std::uint8_t>(headerOctets / 4));
    const std::size_t length = header.totalLength.value_or(headerOctets + header.payload.size());
    return Octets{static_cast<std::uint8_t>(0x40 | words), header.typeOfService} +
           be16(static_cast<std::uint32_t>(length)) + be16(header.identification) + be16(header.fragment) +
           Octets{header.timeToLive, header.protocol} + be16(0) + be32(header.source) + be32(header.destination) +
           header.options + header.payload;
}

Octets ipv6(const Ipv6 &header) {
    const std::size_t length = header.payloadLength.value_or(header.payload.size());
    return be32(0x60000000u | static_cast<std::uint32_t>(header.trafficClass) << 20 | header.flowLabel) +
           be16(static_cast<std::uint32_t>(length)) + Octets{header.nextHeader, header.hopLimit} +
           Octets(header.source.begin(), header.source.end()) +
           Octets(header.destination.begin(), header.destination.end()) + header.payload;
}

Octets udp(std::uint16_t sourcePort, std::uint16_t destinationPort, const Octets &payload) {
    return be16(sourcePort) + be16(destinationPort) + be16(static_cast<std::uint32_t>(8 + payload.size())) + be16(0) +
           payload;
}

Octets shortened(const Octets &packet, std::size_t octets) {
    Octets cut(packet.begin(), packet.begin() + static_cast<std::ptrdiff_t>(octets));
    const int version = cut.empty() ? 0 : cut[0] >> 4;
    if (version == 4 && octets >= 4) {
        put16(cut, 2, octets);
    }
    if (version == 6 && octets >= 40) {
        put16(cut, 4, octets - 40);
    }
    return cut;
}

// The first bit of an octet is its least significant one, so the bits of the packet move up in each octet.
Octets shifted(const Octets &packet, unsigned shift) {
    Octets moved(packet.size() + 1);
    moved[0] = static_cast<std::uint8_t>((1u << shift) - 1);
    for (std::size_t at = 0; at < packet.size(); ++at) {
        const unsigned window = static_cast<unsigned>(packet[at]) << shift;
        moved[at] = static_cast<std::uint8_t>(moved[at] | window);
        moved[at + 1] = static_cast<std::uint8_t>(window >> 8);
    }
    return moved;
}

} // namespace netfloor::test
