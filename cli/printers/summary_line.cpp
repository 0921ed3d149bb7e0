// SPDX-License-Identifier: MIT
#include "printers/summary_line.h"

#include <algorithm>
#include <charconv>
#include <utility>

#include "netfloor-host/assigned_names.h"

namespace netfloor::cli {

namespace {

constexpr std::size_t protocolWidth = 7;

constexpr std::uint32_t neighborSolicitation = 135;
constexpr std::uint32_t neighborAdvertisement = 136;
constexpr std::uint32_t mostIcmpv6Error = 127;

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
    while (name.ends_with(' ')) {
        name.pop_back();
    }
    return name;
}

// By value, as far as there are names.
std::vector<std::string> namesOf(const FieldDescription &field) {
    constexpr std::uint32_t mostValues = 256;
    std::vector<std::string> names;
    for (const NamedValue &row : field.values) {
        if (row.from != row.to || row.from >= mostValues) { // the names of many
            continue;
        }
        names.resize(std::max<std::size_t>(names.size(), row.from + 1));
        if (names[row.from].empty()) { // the first row counts
            names[row.from] = withoutMessage(field.valueName(row.from));
        }
    }
    return names;
}

// The names of the first field of the plug-in that has this name in the table of layers.
std::vector<std::string> namesOf(const FieldTables &tables, std::string_view name) {
    const auto source = std::ranges::find(layerFieldSources(), name, &LayerFieldSource::name);
    const auto field =
        std::ranges::find_if(tables.fields(), [&](const FieldDescription &row) { return source->field.fits(row); });
    return field == tables.fields().end() ? std::vector<std::string>() : namesOf(*field);
}

// "INIT ACK" of "Initiation Acknowledgement (INIT ACK)".
std::string inBrackets(const std::string &name) {
    const std::size_t open = name.rfind('(');
    return open == std::string::npos || !name.ends_with(')') ? name : name.substr(open + 1, name.size() - open - 2);
}

} // namespace

SummaryLine::SummaryLine(Output &out, Host &host) : out_(out), view_(host) {
    const FieldTables &tables = host.fieldTables();
    constexpr std::uint32_t icmpv6Protocol = 58;
    protocols_ = namesOf(tables, "ip.protocol");
    protocols_.resize(std::max<std::size_t>(protocols_.size(), icmpv6Protocol + 1));
    protocols_[icmpv6Protocol] = "ICMPv6";
    icmpTypes_ = namesOf(tables, "icmp.type");
    icmpv6Types_ = namesOf(tables, "icmpv6.type");
    chunks_ = namesOf(tables, "sctp.chunk_type");
    std::ranges::transform(chunks_, chunks_.begin(), inBrackets);
    for (const LayerFieldSource &row : layerFieldSources()) { // each message has a field of its own for its code
        if (row.name == "icmp.code" || row.name == "icmpv6.code") {
            for (const FieldDescription &field : tables.fields()) {
                if (row.field.fits(field)) {
                    codes_[field.id] = namesOf(field);
                }
            }
        }
    }
}

std::string_view SummaryLine::nameIn(const Names &names, std::uint32_t value) {
    return value < names.size() ? std::string_view(names[value]) : std::string_view();
}

void SummaryLine::writeName(std::string_view name, std::string_view otherwise, std::uint32_t number) {
    name.empty() ? out_ << otherwise << number : out_ << name;
}

std::string_view SummaryLine::icmpv6Name(std::uint32_t type) const {
    const std::string_view name = nameIn(icmpv6Types_, type);
    return name.empty() ? icmpv6MessageName(type) : name;
}

SummaryLine::Columns SummaryLine::write(std::span<const std::uint8_t> packet, const RunOptions &options) {
    before_ = after_ = {};
    view_.read(packet, options);
    const Layer *const ip = find(LayerKind::ip);
    if (ip == nullptr) {
        const Output::Mark start = out_.mark();
        out_.styled(Style::warning, "no whole IP header");
        return {start, start, start};
    }
    const Layer *const carried = transport();
    writeProtocol(view_.number(*ip, layerField("ip.protocol")), carried);
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
    } else if (const auto unread = view_.unread()) {
        writeUnread(unread->octet, unread->protocol);
    } else if (const auto protocol = view_.number(*ip, layerField("ip.protocol")); protocol && isCarried(*protocol)) {
        out_ << (view_.number(*ip, layerField("ip.fragment_offset")).value_or(0) == 0 ? " its header is cut short"
                                                                                      : "");
    }
    if (!view_.limit().empty() && !view_.unread()) {
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

void SummaryLine::writeProtocol(std::optional<std::uint32_t> protocol, const Layer *carried) {
    std::string_view name = "IP";
    if (carried != nullptr && carried->kind == LayerKind::icmpv6) {
        name = "ICMPv6";
    } else if (protocol) {
        const std::string_view known = nameIn(protocols_, *protocol);
        name = known.empty() ? "IP" : known;
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
    before_ = {columns.source, from.size < width ? width - from.size : 0};
    out_.blanks(before_.count);
    out_ << from.view() << " > ";
    columns.destination = out_.mark();
    out_ << to.view();
    after_ = {out_.mark(), to.size < width ? width - to.size : 0};
    out_.blanks(after_.count);
    out_ << ' ';
    columns.rest = out_.mark();
    return columns;
}

void SummaryLine::shorten(std::size_t excess) {
    for (Blanks *const blanks : {&after_, &before_}) { // the later ones first, so that the marks hold
        const std::size_t count = std::min(excess, blanks->count);
        out_.erase(blanks->start, count);
        excess -= count;
    }
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
    const Output::Mark noFlags = out_.mark();
    for (const auto &[flag, letter] : flags) {
        if (view_.number(tcp, flag).value_or(0) != 0) {
            out_ << letter;
        }
    }
    writeCongestionFlags(tcp);
    out_ << (out_.mark() == noFlags ? "none]" : "]");
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

// ECE and CWR (RFC 3168), which the plug-in has as reserved bits beside its flags.
void SummaryLine::writeCongestionFlags(const Layer &tcp) {
    constexpr LayerField urgent = layerField("tcp.urg");
    const std::uint32_t octet = view_.has(tcp, urgent) ? view_.packet()[view_.octet(tcp, urgent)] : 0;
    out_ << ((octet & 0x40U) != 0 ? "E" : "") << ((octet & 0x80U) != 0 ? "W" : "");
}

// The timestamps come last, as they are what a short line can best do without.
void SummaryLine::writeTcpOptions(const Layer &tcp) {
    const Output::Mark start = out_.mark();
    const auto separator = [&] { return out_.mark() == start ? std::string_view(" <") : std::string_view(","); };
    const auto option = [&](std::string_view name, LayerField field) {
        if (const auto number = view_.number(tcp, field)) {
            out_ << separator() << name << *number;
        }
    };
    option("mss ", layerField("tcp.maximum_segment_size"));
    option("wscale ", layerField("tcp.window_scale"));
    if (view_.has(tcp, layerField("tcp.sack_permitted"))) {
        out_ << separator() << "sackOK";
    }
    option("sack ", layerField("tcp.sack_left_edge"));
    writeNumber(tcp, ":", layerField("tcp.sack_right_edge"));
    if (view_.has(tcp, layerField("tcp.md5"))) {
        out_ << separator() << "md5";
    }
    option("TS ", layerField("tcp.timestamp"));
    writeNumber(tcp, "/", layerField("tcp.timestamp_echo"));
    if (out_.mark() != start) {
        out_ << '>';
    }
}

// What follows several IPv6 options, by its first octets.
void SummaryLine::writeUnread(std::uint32_t at, std::uint32_t protocol) {
    constexpr std::uint32_t icmpv6 = 58;
    if (protocol == icmpv6 && at < view_.packet().size()) {
        const std::uint32_t type = view_.packet()[at];
        out_ << ' ';
        writeName(icmpv6Name(type), "type ", type);
        out_ << ',';
    } else if (hasPorts(at, protocol)) {
        out_ << ' ';
        writePorts(at, protocol, true);
        out_ << " > ";
        writePorts(at, protocol, false);
        out_ << ',';
    }
    out_ << " not decoded: it follows several IPv6 options";
}

// The name of the message, and that of its code. Where the code's starts with the message's, that is enough.
void SummaryLine::writeMessage(std::string_view message, std::uint32_t type, const Layer &icmp, LayerField codeField) {
    constexpr std::string_view manyCodes = "Destination Unreachable"; // whose code 0 is one of several reasons
    const std::uint32_t code = view_.number(icmp, codeField).value_or(0);
    const auto names = codes_.find(view_.fieldId(icmp, codeField));
    const std::string_view name =
        names == codes_.end() || (code == 0 && message != manyCodes) ? std::string_view() : nameIn(names->second, code);
    out_ << ' ';
    if (message.empty() || !name.starts_with(message)) {
        writeName(message, "type ", type);
        out_ << (name.empty() ? "" : ": ");
    }
    out_ << name;
    if (name.empty() && code != 0) {
        out_ << " code " << code;
    }
}

// RFC 1191 has it in octets that the plug-in knows as unused.
void SummaryLine::writeNextHopMtu(const Layer &icmp) {
    constexpr std::uint32_t unreachable = 3;
    constexpr std::uint32_t fragmentationNeeded = 4;
    const std::size_t at = icmp.firstOctet + std::size_t{6};
    if (view_.number(icmp, layerField("icmp.type")) == unreachable &&
        view_.number(icmp, layerField("icmp.code")) == fragmentationNeeded && at + 2 <= view_.packet().size()) {
        out_ << " mtu " << be16At(at);
    }
}

void SummaryLine::writeQuoted(std::uint32_t protocol) {
    out_ << ", quotes ";
    writeName(nameIn(protocols_, protocol), "protocol ", protocol);
    out_ << ' ';
}

bool SummaryLine::hasPorts(std::uint32_t at, std::uint32_t protocol) const {
    constexpr std::uint32_t tcp = 6;
    constexpr std::uint32_t udp = 17;
    constexpr std::uint32_t portOctets = 4;
    return (protocol == tcp || protocol == udp) && at + portOctets <= view_.packet().size();
}

void SummaryLine::writePorts(std::uint32_t at, std::uint32_t protocol, bool isSource) {
    if (hasPorts(at, protocol)) {
        out_ << ':' << be16At(at + (isSource ? 0U : 2U));
    }
}

void SummaryLine::writeIcmp(const Layer &icmp) {
    const std::uint32_t type = view_.number(icmp, layerField("icmp.type")).value_or(0) & 0xffU;
    writeMessage(nameIn(icmpTypes_, type), type, icmp, layerField("icmp.code"));
    writeNextHopMtu(icmp);
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
    writeQuoted(protocol);
    out_ << view_.address(*quoted, layerField("quoted.source"), room);
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
    writeMessage(icmpv6Name(type), type, icmp, layerField("icmpv6.code"));
    writeNumber(icmp, " mtu ", layerField("icmpv6.mtu"));
    writeNumber(icmp, " id ", layerField("icmpv6.identifier"));
    writeNumber(icmp, " seq ", layerField("icmpv6.sequence_number"));
    TextRoom room;
    if (type == neighborSolicitation || type == neighborAdvertisement) {
        if (const std::string_view target = ipv6At(icmp.firstOctet + headOctets, room); !target.empty()) { // not cut
            out_ << (type == neighborSolicitation ? " who has " : " ") << target;
        }
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
    writeQuoted(protocol);
    out_ << ipv6At(at + source, room);
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
    const std::string_view known = nameIn(chunks_, type);
    writeName(known.empty() ? laterChunkName(type) : known, "chunk ", type);
    writeNumber(chunk, " tsn ", layerField("sctp.tsn"));
    writeNumber(chunk, " stream ", layerField("sctp.stream"));
    writeNumber(chunk, " seq ", layerField("sctp.stream_sequence_number"));
    if (const auto payload = view_.number(chunk, layerField("sctp.payload_protocol")); payload && *payload != 0) {
        out_ << ' ';
        writeName(payloadProtocolName(*payload), "protocol ", *payload);
    }
    writeNumber(chunk, " itsn ", layerField("sctp.initial_tsn"));
    writeNumber(chunk, " ack ", layerField("sctp.cumulative_tsn"));
    writeNumber(chunk, " rwnd ", layerField("sctp.receiver_window"));
    writeNumber(chunk, " cause ", layerField("sctp.cause"));
}

} // namespace netfloor::cli
