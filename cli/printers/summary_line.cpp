// SPDX-License-Identifier: MIT
#include "printers/summary_line.h"

#include <algorithm>
#include <charconv>
#include <utility>

namespace netfloor::cli {

namespace {

constexpr std::size_t protocolWidth = 7;

using Name = std::pair<std::uint32_t, std::string_view>;

constexpr std::array chunkNames = {Name{0, "DATA"},  Name{1, "INIT"},          Name{2, "INIT ACK"},
                                   Name{3, "SACK"},  Name{4, "HEARTBEAT"},     Name{5, "HEARTBEAT ACK"},
                                   Name{6, "ABORT"}, Name{7, "SHUTDOWN"},      Name{8, "SHUTDOWN ACK"},
                                   Name{9, "ERROR"}, Name{10, "COOKIE ECHO"},  Name{11, "COOKIE ACK"},
                                   Name{12, "ECNE"}, Name{13, "CWR"},          Name{14, "SHUTDOWN COMPLETE"},
                                   Name{15, "AUTH"}, Name{128, "ASCONF ACK"},  Name{130, "RE-CONFIG"},
                                   Name{132, "PAD"}, Name{192, "FORWARD TSN"}, Name{193, "ASCONF"}};

// Payload protocol identifiers, as assigned for SCTP.
constexpr std::array payloadNames = {Name{1, "IUA"},
                                     Name{2, "M2UA"},
                                     Name{3, "M3UA"},
                                     Name{4, "SUA"},
                                     Name{5, "M2PA"},
                                     Name{18, "S1AP"},
                                     Name{19, "RUA"},
                                     Name{20, "HNBAP"},
                                     Name{27, "X2AP"},
                                     Name{46, "Diameter"},
                                     Name{50, "WebRTC control"},
                                     Name{60, "NGAP"},
                                     Name{61, "XnAP"}};

// The messages that the plug-in has no names for.
constexpr std::array icmpv6Names = {Name{130, "multicast listener query"},    Name{131, "multicast listener report"},
                                    Name{132, "multicast listener done"},     Name{133, "router solicitation"},
                                    Name{134, "router advertisement"},        Name{135, "neighbor solicitation"},
                                    Name{136, "neighbor advertisement"},      Name{137, "redirect"},
                                    Name{143, "multicast listener report v2"}};

constexpr std::uint32_t neighborSolicitation = 135;
constexpr std::uint32_t neighborAdvertisement = 136;
constexpr std::uint32_t mostIcmpv6Error = 127;
constexpr std::uint32_t icmpUnreachable = 3;

// A width for IPv4 and one for most of IPv6. A line knows no other line: they may be written in parts, each by its own.
constexpr std::size_t endpointWidth(std::size_t wanted) {
    constexpr std::size_t ipv4 = 21;
    constexpr std::size_t ipv6 = 32;
    return wanted <= ipv4 ? ipv4 : ipv6;
}

constexpr bool isTransport(LayerKind kind) {
    return kind == LayerKind::tcp || kind == LayerKind::udp || kind == LayerKind::sctp || kind == LayerKind::icmp ||
           kind == LayerKind::icmpv6 || kind == LayerKind::gre || kind == LayerKind::security;
}

// Whether the plug-in reads the header of an IP protocol: ICMP, TCP, UDP, GRE, ICMPv6 or SCTP.
constexpr bool isCarried(std::uint32_t protocol) {
    constexpr std::array<std::uint32_t, 6> protocols = {1, 6, 17, 47, 58, 132};
    return std::ranges::find(protocols, protocol) != protocols.end();
}

// "ICMP Router Solicitation Message" without what all have.
std::string withoutMessage(std::string name) {
    constexpr std::string_view front = "ICMP ";
    constexpr std::string_view back = " Message";
    if (name.starts_with(front)) {
        name.erase(0, front.size());
    }
    if (name.ends_with(back)) {
        name.erase(name.size() - back.size());
    }
    return name;
}

std::array<std::string, 256> namesOf(const FieldTables &tables, const FieldName &name) {
    std::array<std::string, 256> names;
    const auto &fields = tables.fields();
    const auto field = std::ranges::find_if(fields, [&](const FieldDescription &row) { return name.fits(row); });
    for (std::uint32_t value = 0; field != fields.end() && value < names.size(); ++value) {
        const NamedValue *const row = field->findValue(value);
        if (row != nullptr && !row->isDefault()) {
            names[value] = withoutMessage(field->valueName(value));
        }
    }
    return names;
}

// The first field of the plug-in that has this name in the table of layers.
FieldName fieldOf(std::string_view name) {
    const auto rows = layerFieldSources();
    return std::ranges::find(rows, name, &LayerFieldSource::name)->field;
}

} // namespace

SummaryLine::SummaryLine(Output &out, Host &host) : out_(out), view_(host) {
    const FieldTables tables(host.library());
    constexpr std::uint32_t icmpv6Protocol = 58;
    constexpr FieldName unreachableCode{"Code", 548}; // each message has a code of its own
    protocols_ = namesOf(tables, fieldOf("ip.protocol"));
    protocols_[icmpv6Protocol] = "ICMPv6";
    icmpTypes_ = namesOf(tables, fieldOf("icmp.type"));
    icmpUnreachable_ = namesOf(tables, unreachableCode);
    icmpv6Types_ = namesOf(tables, fieldOf("icmpv6.type"));
    for (const auto &[type, name] : icmpv6Names) {
        icmpv6Types_[type] = name;
    }
}

SummaryLine::Columns SummaryLine::write(std::span<const std::uint8_t> packet, const RunOptions &options) {
    view_.read(packet, options);
    const Layer *const ip = find(LayerKind::ip);
    if (ip == nullptr) {
        const Output::Mark start = out_.mark();
        out_.styled(Style::warning, "no whole IP header");
        return {start, start, start};
    }
    const Layer *carried = transport();
    const bool isWrong = carried != nullptr && isMisread(*ip, *carried);
    if (isWrong) {
        carried = nullptr;
    }
    writeProtocol(*ip, carried);
    if (!view_.has(*ip, layerField("ip.destination"))) {
        const Output::Mark start = out_.mark();
        out_ << "the header ends before the addresses, or its length is wrong";
        return {start, start, start};
    }
    const Columns columns = writeEndpoints(*ip, carried);
    writeTunnels(*ip);
    writeFragment(*ip);
    if (carried != nullptr) {
        writeCarried(*ip, *carried);
    } else if (isWrong) {
        out_ << " several IPv6 options: what follows them is not read";
    } else if (const auto protocol = view_.number(*ip, layerField("ip.protocol")); protocol && isCarried(*protocol)) {
        out_ << (view_.number(*ip, layerField("ip.fragment_offset")).value_or(0) == 0 ? " its header is cut short"
                                                                                      : "");
    }
    if (!view_.limit().empty()) {
        out_ << "  [" << view_.limit() << ']';
    }
    if (view_.isCutOff()) {
        out_ << "  [the pass was cut off]";
    }
    return columns;
}

const Layer *SummaryLine::find(LayerKind kind) const {
    for (const Layer &layer : view_.layers()) {
        if (layer.kind == kind && layer.ipLayer == view_.ipLayers()) {
            return &layer;
        }
    }
    return nullptr;
}

const Layer *SummaryLine::transport() const {
    const Layer *last = nullptr;
    for (const Layer &layer : view_.layers()) {
        if (layer.ipLayer == view_.ipLayers() && isTransport(layer.kind)) {
            last = &layer;
        }
    }
    return last;
}

// After an IPv6 options header of several options the plug-in takes the second one for the next header.
bool SummaryLine::isMisread(const Layer &ip, const Layer &carried) const {
    if (view_.number(ip, layerField("ip.version")) != 6U || ip.packet != carried.packet) {
        return false;
    }
    const auto expected = upperLayerOctet(view_.packet().subspan(ip.firstOctet));
    return expected && carried.kind != LayerKind::security && ip.firstOctet + *expected != carried.firstOctet;
}

void SummaryLine::writeProtocol(const Layer &ip, const Layer *carried) {
    std::string_view name = "IP";
    if (carried != nullptr && carried->kind == LayerKind::icmpv6) {
        name = "ICMPv6";
    } else if (const auto protocol = view_.number(ip, layerField("ip.protocol")); protocol && *protocol < 256) {
        name = protocols_[*protocol].empty() ? "IP" : std::string_view(protocols_[*protocol]);
    }
    const Layer *const payload = find(LayerKind::payload);
    if (payload != nullptr && view_.name(*payload) != "data") {
        name = view_.name(*payload);
    }
    out_ << name;
    out_.blanks(name.size() < protocolWidth ? protocolWidth - name.size() : 0);
    out_ << ' ';
}

SummaryLine::Endpoint SummaryLine::endpoint(const Layer &ip, LayerField address,
                                            std::optional<std::uint32_t> port) const {
    Endpoint endpoint;
    char *to = endpoint.text.data();
    TextRoom room;
    std::string_view text = view_.address(ip, address, room);
    if (text.empty()) {
        text = "?";
    }
    const bool inBrackets = port && view_.number(ip, layerField("ip.version")) == 6U;
    if (inBrackets) {
        *to++ = '[';
    }
    to = std::copy(text.begin(), text.end(), to);
    if (inBrackets) {
        *to++ = ']';
    }
    if (port) {
        *to++ = ':';
        to = std::to_chars(to, endpoint.text.data() + endpoint.text.size(), *port).ptr;
    }
    endpoint.size = static_cast<std::size_t>(to - endpoint.text.data());
    return endpoint;
}

SummaryLine::Columns SummaryLine::writeEndpoints(const Layer &ip, const Layer *carried) {
    std::optional<std::uint32_t> source;
    std::optional<std::uint32_t> destination;
    if (carried != nullptr && carried->kind == LayerKind::tcp) {
        source = view_.number(*carried, layerField("tcp.source_port"));
        destination = view_.number(*carried, layerField("tcp.destination_port"));
    } else if (carried != nullptr && carried->kind == LayerKind::udp) {
        source = view_.number(*carried, layerField("udp.source_port"));
        destination = view_.number(*carried, layerField("udp.destination_port"));
    } else if (carried != nullptr && carried->kind == LayerKind::sctp) {
        source = view_.number(*carried, layerField("sctp.source_port"));
        destination = view_.number(*carried, layerField("sctp.destination_port"));
    }
    const Endpoint from = endpoint(ip, layerField("ip.source"), source);
    const Endpoint to = endpoint(ip, layerField("ip.destination"), destination);
    const std::size_t width = endpointWidth(std::max(from.size, to.size));
    Columns columns = {};
    columns.source = out_.mark();
    out_.rightAligned(from.view(), width);
    out_ << " > ";
    columns.destination = out_.mark();
    out_ << to.view();
    out_.blanks(to.size < width ? width - to.size : 0);
    out_ << ' ';
    columns.rest = out_.mark();
    return columns;
}

// The outer addresses, the innermost tunnel first.
void SummaryLine::writeTunnels(const Layer &innermost) {
    const Layer *inner = &innermost;
    for (std::size_t at = view_.layers().size(); at-- > 0;) {
        const Layer &outer = view_.layers()[at];
        if (outer.kind != LayerKind::ip || outer.ipLayer >= inner->ipLayer) {
            continue;
        }
        const InnerPacket &packet = view_.packets()[inner->packet];
        const bool isOpened = inner->packet != outer.packet;
        out_ << " in " << (isOpened ? tunnelName(packet.tunnel) : "IP");
        if (isOpened && packet.id) {
            out_ << " 0x" << Hex{*packet.id};
        }
        out_ << ' ' << endpoint(outer, layerField("ip.source"), {}).view() << " > "
             << endpoint(outer, layerField("ip.destination"), {}).view();
        inner = &outer;
    }
    out_ << (inner == &innermost ? "" : ":");
}

void SummaryLine::writeFragment(const Layer &ip) {
    const auto offset = view_.number(ip, layerField("ip.fragment_offset")).value_or(0);
    const auto more = view_.number(ip, layerField("ip.more_fragments")).value_or(0);
    if (offset == 0 && more == 0) {
        return;
    }
    constexpr std::uint32_t ipv6Unit = 8; // the plug-in gives the offset of IPv4 in octets
    const bool isIpv6 = view_.number(ip, layerField("ip.version")) == 6U;
    out_ << (offset == 0 ? " first fragment"
             : more == 0 ? " last fragment"
                         : " fragment")
         << " at " << offset * (isIpv6 ? ipv6Unit : 1U) << " id 0x"
         << Hex{view_.number(ip, isIpv6 ? layerField("ip.fragment_identification") : layerField("ip.identification"))
                    .value_or(0)};
}

void SummaryLine::writeNumber(const Layer &layer, std::string_view label, LayerField field) {
    if (const auto number = view_.number(layer, field)) {
        out_ << label << *number;
    }
}

void SummaryLine::writeCarried(const Layer &ip, const Layer &carried) {
    switch (carried.kind) {
    case LayerKind::tcp: return writeTcp(ip, carried);
    case LayerKind::udp: {
        constexpr std::uint32_t headOctets = 8;
        const auto length = view_.number(carried, layerField("udp.length"));
        if (length && *length >= headOctets) {
            out_ << " len " << *length - headOctets;
        }
        const Layer *const payload = find(LayerKind::payload);
        if (payload != nullptr && view_.name(*payload) != "data") {
            out_ << ' ';
            out_.untrusted(view_.text(*payload));
        }
        return;
    }
    case LayerKind::sctp: return writeChunks();
    case LayerKind::icmp: return writeIcmp(carried);
    case LayerKind::icmpv6: return writeIcmpv6(carried);
    case LayerKind::gre:
        if (const auto type = view_.number(carried, layerField("gre.protocol"))) {
            out_ << " protocol 0x" << Hex{*type};
        }
        writeNumber(carried, " key ", layerField("gre.key"));
        return writeNumber(carried, " seq ", layerField("gre.sequence_number"));
    case LayerKind::security:
        if (const auto spi = view_.number(carried, layerField("security.spi"))) {
            out_ << " spi 0x" << Hex{*spi};
        }
        return writeNumber(carried, " seq ", layerField("security.sequence_number"));
    default: return;
    }
}

void SummaryLine::writeTcp(const Layer &ip, const Layer &tcp) {
    constexpr std::array flags = {std::pair{layerField("tcp.syn"), 'S'}, std::pair{layerField("tcp.fin"), 'F'},
                                  std::pair{layerField("tcp.rst"), 'R'}, std::pair{layerField("tcp.psh"), 'P'},
                                  std::pair{layerField("tcp.urg"), 'U'}, std::pair{layerField("tcp.ack"), '.'}};
    out_ << " [";
    for (const auto &[flag, letter] : flags) {
        if (view_.number(tcp, flag).value_or(0) != 0) {
            out_ << letter;
        }
    }
    out_ << ']';
    writeNumber(tcp, " seq ", layerField("tcp.sequence_number"));
    if (view_.number(tcp, layerField("tcp.ack")).value_or(0) != 0) {
        writeNumber(tcp, " ack ", layerField("tcp.acknowledgement_number"));
    }
    writeNumber(tcp, " win ", layerField("tcp.window"));
    constexpr std::uint32_t word = 4;
    constexpr std::uint32_t ipv6Header = 40;
    const auto total = view_.number(ip, layerField("ip.total_length"));
    const auto ipv6Payload = view_.number(ip, layerField("ip.payload_length"));
    const auto header = view_.number(tcp, layerField("tcp.data_offset"));
    if (header && (total || ipv6Payload)) {
        const std::uint32_t end = ip.firstOctet + (total ? *total : *ipv6Payload + ipv6Header);
        const std::uint32_t start = tcp.firstOctet + *header * word;
        out_ << " len " << (end > start ? end - start : 0U);
    }
    writeTcpOptions(tcp);
}

void SummaryLine::writeTcpOptions(const Layer &tcp) {
    const Output::Mark start = out_.mark();
    writeNumber(tcp, ",mss ", layerField("tcp.maximum_segment_size"));
    writeNumber(tcp, ",wscale ", layerField("tcp.window_scale"));
    if (view_.has(tcp, layerField("tcp.sack_permitted"))) {
        out_ << ",sackOK";
    }
    writeNumber(tcp, ",TS ", layerField("tcp.timestamp"));
    writeNumber(tcp, "/", layerField("tcp.timestamp_echo"));
    writeNumber(tcp, ",sack ", layerField("tcp.sack_left_edge"));
    writeNumber(tcp, ":", layerField("tcp.sack_right_edge"));
    if (view_.has(tcp, layerField("tcp.md5"))) {
        out_ << ",md5";
    }
    if (out_.mark() == start) {
        return;
    }
    out_ << '>';
    // The comma in front of the first one.
    const std::size_t size = out_.since(start).size();
    std::array<char, 128> kept;
    const std::string_view options = out_.since(start).substr(1, std::min(size - 1, kept.size()));
    std::copy(options.begin(), options.end(), kept.begin());
    out_.takeBack(start);
    out_ << " <" << std::string_view(kept.data(), options.size());
}

void SummaryLine::writePorts(std::uint32_t at, std::uint32_t protocol, bool isSource) {
    constexpr std::uint32_t tcp = 6;
    constexpr std::uint32_t udp = 17;
    const std::size_t port = at + (isSource ? 0U : 2U);
    if ((protocol == tcp || protocol == udp) && port + 2 <= view_.packet().size()) {
        out_ << ':' << (std::uint32_t{view_.packet()[port]} << 8U | view_.packet()[port + 1]);
    }
}

void SummaryLine::writeIcmp(const Layer &icmp) {
    const std::uint32_t type = view_.number(icmp, layerField("icmp.type")).value_or(0) & 0xffU;
    const std::uint32_t code = view_.number(icmp, layerField("icmp.code")).value_or(0) & 0xffU;
    out_ << ' ';
    icmpTypes_[type].empty() ? out_ << "type " << type : out_ << icmpTypes_[type];
    if (type == icmpUnreachable && !icmpUnreachable_[code].empty()) {
        out_ << ": " << icmpUnreachable_[code];
    } else if (code != 0) {
        out_ << " code " << code;
    }
    writeNumber(icmp, " id ", layerField("icmp.identifier"));
    writeNumber(icmp, " seq ", layerField("icmp.sequence_number"));
    TextRoom room;
    if (view_.has(icmp, layerField("icmp.gateway"))) {
        out_ << " to " << view_.address(icmp, layerField("icmp.gateway"), room);
    }
    const Layer *const quoted = find(LayerKind::quoted);
    if (quoted == nullptr || !view_.has(*quoted, layerField("quoted.destination"))) {
        return;
    }
    const std::uint32_t protocol = view_.number(*quoted, layerField("quoted.protocol")).value_or(0) & 0xffU;
    const bool hasData = view_.has(*quoted, layerField("quoted.data"));
    const std::uint32_t data = view_.octet(*quoted, layerField("quoted.data"));
    out_ << ", quotes " << protocols_[protocol] << ' ' << view_.address(*quoted, layerField("quoted.source"), room);
    writePorts(data, hasData ? protocol : 0, true);
    out_ << " > " << view_.address(*quoted, layerField("quoted.destination"), room);
    writePorts(data, hasData ? protocol : 0, false);
}

std::string_view SummaryLine::ipv6At(std::uint32_t octet, TextRoom &room) const {
    Ipv6Octets octets = {};
    if (octet + octets.size() > view_.packet().size()) {
        return {};
    }
    std::copy_n(view_.packet().begin() + octet, octets.size(), octets.begin());
    return ipv6Text(octets, room);
}

void SummaryLine::writeIcmpv6(const Layer &icmp) {
    constexpr std::uint32_t headOctets = 8;
    const std::uint32_t type = view_.number(icmp, layerField("icmpv6.type")).value_or(0) & 0xffU;
    const std::uint32_t code = view_.number(icmp, layerField("icmpv6.code")).value_or(0);
    out_ << ' ';
    icmpv6Types_[type].empty() ? out_ << "type " << type : out_ << icmpv6Types_[type];
    if (code != 0) {
        out_ << " code " << code;
    }
    writeNumber(icmp, " mtu ", layerField("icmpv6.mtu"));
    writeNumber(icmp, " id ", layerField("icmpv6.identifier"));
    writeNumber(icmp, " seq ", layerField("icmpv6.sequence_number"));
    TextRoom room;
    if (type == neighborSolicitation || type == neighborAdvertisement) {
        out_ << (type == neighborSolicitation ? " who has " : " ") << ipv6At(icmp.firstOctet + headOctets, room);
    } else if (type <= mostIcmpv6Error) {
        writeQuotedIpv6(icmp.firstOctet + headOctets);
    }
}

// The plug-in shows the quoted packet as octets.
void SummaryLine::writeQuotedIpv6(std::uint32_t at) {
    constexpr std::uint32_t headerOctets = 40;
    constexpr std::uint32_t nextHeader = 6;
    constexpr std::uint32_t source = 8;
    constexpr std::uint32_t destination = 24;
    if (at + headerOctets > view_.packet().size()) {
        return;
    }
    const std::uint8_t protocol = view_.packet()[at + nextHeader];
    TextRoom room;
    out_ << ", quotes " << protocols_[protocol] << ' ' << ipv6At(at + source, room);
    writePorts(at + headerOctets, protocol, true);
    out_ << " > " << ipv6At(at + destination, room);
    writePorts(at + headerOctets, protocol, false);
}

void SummaryLine::writeChunks() {
    bool isFirst = true;
    for (const Layer &layer : view_.layers()) {
        if (layer.kind == LayerKind::chunk && layer.ipLayer == view_.ipLayers()) {
            out_ << (isFirst ? " " : "; ");
            isFirst = false;
            writeChunk(layer);
        }
    }
}

void SummaryLine::writeChunk(const Layer &chunk) {
    const std::uint32_t type = view_.number(chunk, layerField("sctp.chunk_type")).value_or(0);
    const auto *const known = std::ranges::find(chunkNames, type, &Name::first);
    known == chunkNames.end() ? out_ << "chunk " << type : out_ << known->second;
    writeNumber(chunk, " tsn ", layerField("sctp.tsn"));
    writeNumber(chunk, " stream ", layerField("sctp.stream"));
    writeNumber(chunk, " seq ", layerField("sctp.stream_sequence_number"));
    if (const auto payload = view_.number(chunk, layerField("sctp.payload_protocol")); payload && *payload != 0) {
        const auto *const name = std::ranges::find(payloadNames, *payload, &Name::first);
        name == payloadNames.end() ? out_ << " protocol " << *payload : out_ << ' ' << name->second;
    }
    writeNumber(chunk, " itsn ", layerField("sctp.initial_tsn"));
    writeNumber(chunk, " ack ", layerField("sctp.cumulative_tsn"));
    writeNumber(chunk, " rwnd ", layerField("sctp.receiver_window"));
    writeNumber(chunk, " cause ", layerField("sctp.cause"));
}

} // namespace netfloor::cli
