// SPDX-License-Identifier: MIT
#include "payload_line.h"

#include <algorithm>
#include <charconv>
#include <utility>

#include "ip_numbers.h"
#include "netfloor-host/assigned_names.h"
#include "octets.h"
#include "ports.h"

namespace netfloor {
namespace {

using Name = std::pair<std::uint32_t, std::string_view>;

constexpr std::uint32_t m3uaIdentifier = 3;
constexpr std::size_t messageHead = 8; // of GTP and of M3UA

// TS 29.281.
constexpr std::array userPlane = {Name{1, "echo request"},      Name{2, "echo response"},
                                  Name{26, "error indication"}, Name{31, "supported extension headers"},
                                  Name{254, "end marker"},      Name{255, "G-PDU"}};
// TS 29.060.
constexpr std::array versionOne = {Name{1, "echo request"},
                                   Name{2, "echo response"},
                                   Name{16, "create PDP context request"},
                                   Name{17, "create PDP context response"},
                                   Name{18, "update PDP context request"},
                                   Name{19, "update PDP context response"},
                                   Name{20, "delete PDP context request"},
                                   Name{21, "delete PDP context response"}};
// TS 29.274.
constexpr std::array versionTwo = {Name{1, "echo request"},
                                   Name{2, "echo response"},
                                   Name{32, "create session request"},
                                   Name{33, "create session response"},
                                   Name{34, "modify bearer request"},
                                   Name{35, "modify bearer response"},
                                   Name{36, "delete session request"},
                                   Name{37, "delete session response"},
                                   Name{95, "create bearer request"},
                                   Name{96, "create bearer response"},
                                   Name{170, "release access bearers request"},
                                   Name{171, "release access bearers response"},
                                   Name{176, "downlink data notification"}};
// RFC 4666: class and type.
constexpr std::array m3uaMessages = {
    Name{0x0000, "ERR"},       Name{0x0001, "NTFY"},      Name{0x0101, "DATA"},     Name{0x0201, "DUNA"},
    Name{0x0202, "DAVA"},      Name{0x0203, "DAUD"},      Name{0x0204, "SCON"},     Name{0x0205, "DUPU"},
    Name{0x0206, "DRST"},      Name{0x0301, "ASPUP"},     Name{0x0302, "ASPDN"},    Name{0x0303, "BEAT"},
    Name{0x0304, "ASPUP ACK"}, Name{0x0305, "ASPDN ACK"}, Name{0x0306, "BEAT ACK"}, Name{0x0401, "ASPAC"},
    Name{0x0402, "ASPIA"},     Name{0x0403, "ASPAC ACK"}, Name{0x0404, "ASPIA ACK"}};

std::string_view nameIn(std::span<const Name> names, std::uint32_t number) {
    const auto found = std::ranges::find(names, number, &Name::first);
    return found == names.end() ? std::string_view() : found->second;
}

} // namespace

PayloadLine PayloadLine::ofUdp(std::span<const std::uint8_t> header, std::span<const std::uint8_t> payload) {
    PayloadLine line;
    if (header.size() != udpOctets || payload.size() < messageHead) {
        return line;
    }
    const std::uint32_t source = be16(header, 0);
    const std::uint32_t destination = be16(header, 2);
    if (isGtpPort(source) || isGtpPort(destination)) {
        line.gtp(payload, source == gtpUPort || destination == gtpUPort);
    }
    return line;
}

PayloadLine PayloadLine::ofSctp(std::uint32_t identifier, std::span<const std::uint8_t> payload) {
    PayloadLine line;
    const std::string_view name = payloadProtocolName(identifier);
    if (name.empty()) {
        return line;
    }
    line.start(name);
    if (identifier == m3uaIdentifier && payload.size() >= messageHead) {
        line.m3ua(payload);
    } else {
        line.append(static_cast<std::uint32_t>(payload.size()));
        line.append(" octets");
    }
    return line;
}

void PayloadLine::gtp(std::span<const std::uint8_t> message, bool isUserPlane) {
    const std::uint32_t version = message[0] >> 5U;
    if (version != 1 && (version != 2 || isUserPlane)) {
        return;
    }
    start(isUserPlane ? "GTP-U" : "GTP-C");
    const auto names = isUserPlane    ? std::span<const Name>(userPlane)
                       : version == 1 ? std::span<const Name>(versionOne)
                                      : std::span<const Name>(versionTwo);
    const std::string_view name = nameIn(names, message[1]);
    append(name.empty() ? "message " : name);
    if (name.empty()) {
        append(message[1]);
    }
    append(", ");
    append(be16(message, 2));
    append(" octets");
    const bool hasEndpoint = version == 1 || (message[0] & 0x08U) != 0;
    if (hasEndpoint) {
        append(", TEID 0x");
        append(be32(message, 4), 16);
    }
}

void PayloadLine::m3ua(std::span<const std::uint8_t> message) {
    const std::string_view name = nameIn(m3uaMessages, be16(message, 2));
    if (name.empty()) {
        append("class ");
        append(message[2]);
        append(" type ");
        append(message[3]);
    }
    append(name);
    append(", ");
    append(be32(message, 4));
    append(" octets");
}

void PayloadLine::start(std::string_view name) {
    name_ = name;
    append(name);
    append(": ");
}

void PayloadLine::append(std::uint32_t number, int base) {
    size_ = static_cast<std::size_t>(
        std::to_chars(text_.data() + size_, text_.data() + text_.size(), number, base).ptr - text_.data());
}

} // namespace netfloor
