// SPDX-License-Identifier: MIT
// What a line of the summary says of a packet with IP: the innermost protocol, its addresses and what matters of it.
#pragma once

#include <array>
#include <cstdint>
#include <string>
#include <string_view>

#include "netfloor-host/layers.h"
#include "output.h"

namespace netfloor::cli {

class SummaryLine {
public:
    SummaryLine(Output &out, Host &host);

    // Where the columns after the protocol begin in the output, blanks and ">" between them. A line without addresses
    // has them all at the place where it goes on after the protocol.
    struct Columns {
        Output::Mark source;
        Output::Mark destination;
        Output::Mark rest;
    };

    Columns write(std::span<const std::uint8_t> packet, const RunOptions &options);

private:
    // An address with its port.
    struct Endpoint {
        std::array<char, 64> text;
        std::size_t size = 0;
        [[nodiscard]] std::string_view view() const { return {text.data(), size}; }
    };
    using Names = std::array<std::string, 256>;

    [[nodiscard]] const Layer *find(LayerKind kind) const; // in the innermost IP layer
    [[nodiscard]] const Layer *transport() const;
    [[nodiscard]] Endpoint endpoint(const Layer &ip, LayerField address, std::optional<std::uint32_t> port) const;
    [[nodiscard]] bool isMisread(const Layer &ip, const Layer &carried) const;
    void writeProtocol(const Layer &ip, const Layer *carried);
    Columns writeEndpoints(const Layer &ip, const Layer *carried);
    void writeTunnels(const Layer &innermost);
    void writeFragment(const Layer &ip);
    void writeCarried(const Layer &ip, const Layer &carried);
    void writeTcp(const Layer &ip, const Layer &tcp);
    void writeTcpOptions(const Layer &tcp);
    void writeIcmp(const Layer &icmp);
    void writeIcmpv6(const Layer &icmp);
    void writeQuotedIpv6(std::uint32_t at);
    void writePorts(std::uint32_t at, std::uint32_t protocol, bool isSource);
    void writeChunks();
    void writeChunk(const Layer &chunk);
    void writeNumber(const Layer &layer, std::string_view label, LayerField field);
    [[nodiscard]] std::string_view ipv6At(std::uint32_t octet, TextRoom &room) const;

    Output &out_;
    LayerView view_;
    Names protocols_;
    Names icmpTypes_;
    Names icmpUnreachable_;
    Names icmpv6Types_;
};

} // namespace netfloor::cli
