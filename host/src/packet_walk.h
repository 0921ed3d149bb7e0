// SPDX-License-Identifier: MIT
// The walk over one packet for the checks. Lengths are those on the wire; octets that were not captured are not read.
#pragma once

#include <cstdint>
#include <span>
#include <string_view>
#include <vector>

#include "netfloor-host/checks.h"

namespace netfloor {

class PacketWalk {
public:
    PacketWalk(std::span<const std::uint8_t> octets, std::vector<Fault> &faults) : octets_(octets), faults_(faults) {}

    // From an IP header to the end of the innermost layer.
    void ip(std::size_t at, std::size_t end);

private:
    // What a network layer carries.
    struct Payload {
        std::size_t at = 0;
        std::size_t end = 0;
        std::uint8_t protocol = 0;
        bool isFragment = false;
        bool isIpv6 = false;
        bool hasAddresses = true;      // the addresses that its checksum covers are known
        std::uint64_t addresses = 0;   // their sum
        std::uint64_t otherSource = 0; // the sum with the address of a home address option, or 0
    };

    void ipv4(std::size_t at, std::size_t end);
    void ipv4Options(std::size_t at, std::size_t end);
    void ipv6(std::size_t at, std::size_t end);
    void extensionHeaders(Payload payload, std::size_t first);
    void ipv6Options(std::size_t at, std::size_t end, Payload &payload, std::size_t header);
    void routingHeader(std::size_t at, std::size_t end, Payload &payload, std::size_t header);
    void payload(const Payload &payload);
    void tcp(const Payload &payload);
    void tcpOptions(std::size_t at, std::size_t end);
    void udp(Payload payload);
    void icmp(const Payload &payload);
    void icmpv6(const Payload &payload);
    // The packet in an ICMP error, up to the end of that.
    void quoted(std::size_t at, std::size_t end);
    void multicastRecords(std::size_t at, std::size_t end);
    void neighbourOptions(std::size_t at, std::size_t end);
    void gre(const Payload &payload);
    void sctp(const Payload &payload);
    void sctpChecksum(const Payload &payload);
    void sctpChunk(std::size_t at, std::size_t end);
    // Parameters of INIT, causes of ABORT and ERROR.
    void sctpItems(std::size_t at, std::size_t end, std::string_view tooShort, std::string_view tooLong,
                   bool arePadded);

    // The checksum of the payload with the addresses before it.
    void checksum(const Payload &payload, std::string_view protocol, std::size_t fieldAt);

    [[nodiscard]] bool has(std::size_t at, std::size_t count) const { return at + count <= octets_.size(); }
    // Whether a header fits and was captured.
    [[nodiscard]] bool hasHeader(std::string_view protocol, std::size_t at, std::size_t end, std::size_t count);
    [[nodiscard]] std::uint32_t u8(std::size_t at) const { return octets_[at]; }
    [[nodiscard]] std::uint32_t u16(std::size_t at) const { return u8(at) << 8U | u8(at + 1); }
    [[nodiscard]] std::uint32_t u32(std::size_t at) const { return u16(at) << 16U | u16(at + 2); }
    [[nodiscard]] std::span<const std::uint8_t> part(std::size_t at, std::size_t end) const {
        return octets_.subspan(at, end - at);
    }

    void add(FaultKind kind, std::string_view protocol, std::string_view text, std::size_t octet, std::size_t first = 0,
             std::size_t second = 0) {
        faults_.push_back({isQuoted_ ? FaultKind::note : kind, protocol, text, static_cast<std::uint32_t>(octet),
                           static_cast<std::uint32_t>(first), static_cast<std::uint32_t>(second), isQuoted_});
    }
    void damage(std::string_view protocol, std::string_view text, std::size_t octet, std::size_t first = 0,
                std::size_t second = 0) {
        add(FaultKind::damage, protocol, text, octet, first, second);
    }
    void note(std::string_view protocol, std::string_view text, std::size_t octet, std::size_t first = 0) {
        add(FaultKind::note, protocol, text, octet, first);
    }

    static constexpr std::uint32_t mostLayers = 16;

    std::span<const std::uint8_t> octets_;
    std::vector<Fault> &faults_;
    std::uint32_t layers_ = 0;
    bool isQuoted_ = false;
};

} // namespace netfloor
