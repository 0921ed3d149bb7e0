// SPDX-License-Identifier: MIT
// The walk over one packet for the checks. Lengths are those on the wire; octets that were not captured are not read.
#pragma once

#include <cstdint>
#include <optional>
#include <span>
#include <string_view>
#include <vector>

#include "netfloor-host/checks.h"
#include "netfloor-host/inner_packets.h"
#include "octets.h"

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
        bool isJumbo = false;
        bool hasAddresses = true;      // the addresses that its checksum covers are known
        std::uint64_t addresses = 0;   // their sum
        std::uint64_t otherSource = 0; // the sum with the address of a home address option, or 0
    };

    void ipv4(std::size_t at, std::size_t end);
    void ipv4Options(std::size_t at, std::size_t end);
    void ipv4Entries(std::uint32_t type, std::uint32_t leastPointer, std::size_t at, std::size_t end);
    void cipsoTags(std::size_t at, std::size_t end);
    void ipv6(std::size_t at, std::size_t end);
    void extensionHeaders(Payload payload, std::size_t first);
    void ipv6Options(std::size_t at, std::size_t end, Payload &payload, std::size_t header);
    void ipv6Option(std::size_t at, std::size_t end, Payload &payload, std::size_t header);
    void routingHeader(std::size_t at, std::size_t end, Payload &payload, std::size_t header);
    void payload(const Payload &payload);
    void tcp(const Payload &payload);
    void tcpOptions(std::size_t at, std::size_t end);
    void udp(Payload payload);
    void icmp(const Payload &payload);
    void icmpv6(const Payload &payload);
    // The packet in an ICMP error, with its length field in units of so many octets, and the extension after it.
    void quoteAndExtension(std::string_view protocol, const Payload &payload, std::size_t lengthAt, std::size_t unit);
    void quoted(std::string_view protocol, std::size_t at, std::size_t end);
    void icmpExtension(std::string_view protocol, std::size_t at, std::size_t end);
    void multicastQuery(std::size_t at, std::size_t end);
    void multicastRecords(std::size_t at, std::size_t end);
    void neighbourOptions(std::size_t at, std::size_t end);
    void gre(const Payload &payload);
    // A packet inside, whose place is counted from there.
    void inner(std::size_t at, const std::optional<InnerPacket> &found);
    void sctp(const Payload &payload);
    void sctpChecksum(const Payload &payload);
    void sctpChunk(std::size_t at, std::size_t end);
    void sctpSack(std::size_t at, std::size_t end);
    enum class ParameterPlace : std::uint8_t { init, chunk, parameter }; // of INIT, of other chunks, in another one
    void sctpParameters(std::size_t at, std::size_t end, ParameterPlace place);
    void sctpCauses(std::size_t at, std::size_t end);

    // The checksum of the payload with the addresses before it.
    void checksum(const Payload &payload, std::string_view protocol, std::size_t fieldAt);

    [[nodiscard]] bool has(std::size_t at, std::size_t count) const { return at + count <= octets_.size(); }
    // Whether a header fits and was captured.
    [[nodiscard]] bool hasHeader(std::string_view protocol, std::size_t at, std::size_t end, std::size_t count);
    [[nodiscard]] std::uint32_t u8(std::size_t at) const { return octets_[at]; }
    [[nodiscard]] std::uint32_t u16(std::size_t at) const { return be16(octets_, at); }
    [[nodiscard]] std::uint32_t u32(std::size_t at) const { return be32(octets_, at); }
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
    void note(std::string_view protocol, std::string_view text, std::size_t octet, std::size_t first = 0,
              std::size_t second = 0) {
        add(FaultKind::note, protocol, text, octet, first, second);
    }

    static constexpr std::uint32_t mostLayers = 16;
    static constexpr std::size_t mostPayload = 65535;

    std::span<const std::uint8_t> octets_;
    std::vector<Fault> &faults_;
    std::uint32_t layers_ = 0;
    bool isQuoted_ = false;
};

} // namespace netfloor
