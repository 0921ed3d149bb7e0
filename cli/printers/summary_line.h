// SPDX-License-Identifier: MIT
// What a line of the summary says of a packet with IP: the innermost protocol, its addresses and what matters of it.
#pragma once

#include <array>
#include <cstdint>
#include <map>
#include <string>
#include <string_view>
#include <vector>

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

    // Takes so many blanks out of the line that was written last, as far as it has them beside its addresses. Its
    // columns are no longer valid.
    void shorten(std::size_t excess);

private:
    // An address with its port.
    struct Endpoint {
        std::array<char, 64> text;
        std::size_t size = 0;
        [[nodiscard]] std::string_view view() const { return {text.data(), size}; }
    };
    using Names = std::vector<std::string>; // by value
    struct Blanks {
        Output::Mark start = 0;
        std::size_t count = 0;
    };

    [[nodiscard]] const Layer *find(LayerKind kind) const; // in the innermost IP layer
    [[nodiscard]] const Layer *transport() const;
    [[nodiscard]] Endpoint endpoint(const Layer &ip, LayerField address, std::optional<std::uint32_t> port) const;
    void writeProtocol(std::optional<std::uint32_t> protocol, const Layer *carried);
    Columns writeEndpoints(const Layer &ip, const Layer *carried);
    void writeTunnels(const Layer &innermost);
    void writeFragment(const Layer &ip);
    void writeCarried(const Layer &ip, const Layer &carried);
    void writeTcp(const Layer &ip, const Layer &tcp);
    void writeCongestionFlags(const Layer &tcp);
    void writeTcpOptions(const Layer &tcp);
    void writeUnread(std::uint32_t at, std::uint32_t protocol);
    void writeMessage(std::string_view message, std::uint32_t type, const Layer &icmp, LayerField codeField);
    void writeNextHopMtu(const Layer &icmp);
    void writeQuoted(std::uint32_t protocol);
    [[nodiscard]] static std::string_view nameIn(const Names &names, std::uint32_t value);
    [[nodiscard]] std::string_view icmpv6Name(std::uint32_t type) const;
    // The name, or `otherwise` with the number.
    void writeName(std::string_view name, std::string_view otherwise, std::uint32_t number);
    void writeIcmp(const Layer &icmp);
    void writeIcmpv6(const Layer &icmp);
    void writeQuotedIpv6(std::uint32_t at);
    [[nodiscard]] std::uint32_t be16At(std::size_t octet) const {
        return std::uint32_t{view_.packet()[octet]} << 8U | view_.packet()[octet + 1];
    }
    [[nodiscard]] bool hasPorts(std::uint32_t at, std::uint32_t protocol) const;
    void writePorts(std::uint32_t at, std::uint32_t protocol, bool isSource);
    void writeChunks();
    void writeChunk(const Layer &chunk);
    void writeNumber(const Layer &layer, std::string_view label, LayerField field);
    [[nodiscard]] std::string_view ipv6At(std::uint32_t octet, TextRoom &room) const;

    Output &out_;
    LayerView view_;
    Names protocols_;
    Names icmpTypes_;
    Names icmpv6Types_;
    Names chunks_;
    std::map<std::uint32_t, Names> codes_; // by the id of the plug-in's field
    Blanks before_;                        // in front of the addresses of the last line
    Blanks after_;
};

} // namespace netfloor::cli
