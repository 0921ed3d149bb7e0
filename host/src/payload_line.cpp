// SPDX-License-Identifier: MIT
#include "payload_line.h"

#include <charconv>

#include "ip_numbers.h"
#include "netfloor-host/assigned_names.h"
#include "number_names.h"
#include "octets.h"
#include "ports.h"

namespace netfloor {
namespace {

constexpr std::uint32_t m3uaIdentifier = 3;
constexpr std::size_t messageHead = 8; // of GTP and of M3UA

// TS 29.281.
constexpr std::array userPlane = {NumberName{1, "echo request"},      NumberName{2, "echo response"},
                                  NumberName{26, "error indication"}, NumberName{31, "supported extension headers"},
                                  NumberName{254, "end marker"},      NumberName{255, "G-PDU"}};
// TS 29.060.
constexpr std::array versionOne = {NumberName{1, "echo request"},
                                   NumberName{2, "echo response"},
                                   NumberName{16, "create PDP context request"},
                                   NumberName{17, "create PDP context response"},
                                   NumberName{18, "update PDP context request"},
                                   NumberName{19, "update PDP context response"},
                                   NumberName{20, "delete PDP context request"},
                                   NumberName{21, "delete PDP context response"}};
// TS 29.274.
constexpr std::array versionTwo = {NumberName{1, "echo request"},
                                   NumberName{2, "echo response"},
                                   NumberName{32, "create session request"},
                                   NumberName{33, "create session response"},
                                   NumberName{34, "modify bearer request"},
                                   NumberName{35, "modify bearer response"},
                                   NumberName{36, "delete session request"},
                                   NumberName{37, "delete session response"},
                                   NumberName{95, "create bearer request"},
                                   NumberName{96, "create bearer response"},
                                   NumberName{170, "release access bearers request"},
                                   NumberName{171, "release access bearers response"},
                                   NumberName{176, "downlink data notification"}};
// RFC 4666: class and type.
constexpr std::array m3uaMessages = {
    NumberName{0x0000, "ERR"},       NumberName{0x0001, "NTFY"},      NumberName{0x0101, "DATA"},
    NumberName{0x0201, "DUNA"},      NumberName{0x0202, "DAVA"},      NumberName{0x0203, "DAUD"},
    NumberName{0x0204, "SCON"},      NumberName{0x0205, "DUPU"},      NumberName{0x0206, "DRST"},
    NumberName{0x0301, "ASPUP"},     NumberName{0x0302, "ASPDN"},     NumberName{0x0303, "BEAT"},
    NumberName{0x0304, "ASPUP ACK"}, NumberName{0x0305, "ASPDN ACK"}, NumberName{0x0306, "BEAT ACK"},
    NumberName{0x0401, "ASPAC"},     NumberName{0x0402, "ASPIA"},     NumberName{0x0403, "ASPAC ACK"},
    NumberName{0x0404, "ASPIA ACK"}};

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
    const auto names = isUserPlane    ? std::span<const NumberName>(userPlane)
                       : version == 1 ? std::span<const NumberName>(versionOne)
                                      : std::span<const NumberName>(versionTwo);
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
