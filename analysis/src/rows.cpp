// SPDX-License-Identifier: MIT
#include "netfloor-analysis/rows.h"

#include <algorithm>
#include <utility>

#include "column_table.h"
#include "netfloor-analysis/utf8.h"

namespace netfloor {
namespace {

constexpr std::size_t noColumn = Row::mostColumns;

constexpr std::size_t findColumn(RowKind kind, std::string_view name) {
    const auto columns = column_table::of(kind);
    for (std::size_t place = 0; place < columns.size(); ++place) {
        if (columns[place].name == name) {
            return place;
        }
    }
    return noColumn;
}

// The place of a column. A wrong name does not compile.
consteval std::size_t column(RowKind kind, std::string_view name) {
    const std::size_t place = findColumn(kind, name);
    return place != noColumn ? place : throw "there is no such column";
}

// The columns of a layer's fields, by kind and place of the field.
constexpr std::size_t mostFields = 32;
using FieldColumns = std::array<std::array<std::uint8_t, mostFields>, layerKinds>;

// In one walk: compilers bound the steps of a constant. All rows of a name stand together.
constexpr FieldColumns fieldColumns(RowKind row) {
    FieldColumns columns = {};
    for (auto &ofKind : columns) {
        ofKind.fill(noColumn);
    }
    std::array<std::size_t, layerKinds> fields = {};
    std::string_view before;
    for (const LayerFieldSource &source : layerFieldSources()) {
        if (source.name != before) {
            const auto kind = static_cast<std::size_t>(source.kind);
            columns[kind][fields[kind]++] = static_cast<std::uint8_t>(findColumn(row, source.name));
        }
        before = source.name;
    }
    return columns;
}

constexpr FieldColumns layerColumns = fieldColumns(RowKind::layer);
constexpr FieldColumns chunkColumns = fieldColumns(RowKind::chunk);

// Whether each column of a protocol is that of a field: no two have one name.
constexpr bool haveFields(RowKind row, const FieldColumns &columns) {
    std::ptrdiff_t found = 0;
    for (const auto &ofKind : columns) {
        found += std::ranges::count_if(ofKind, [](std::uint8_t column) { return column != noColumn; });
    }
    return found ==
           std::ranges::count_if(column_table::of(row), [](const Column &one) { return !one.group().empty(); });
}

constexpr bool isComplete() {
    for (std::size_t kind = 0; kind < layerKinds; ++kind) {
        const bool isChunk = static_cast<LayerKind>(kind) == LayerKind::chunk;
        const auto &columns = (isChunk ? chunkColumns : layerColumns)[kind];
        const std::uint32_t fields = layerFieldCount(static_cast<LayerKind>(kind));
        if (std::cmp_not_equal(std::ranges::count(columns, std::uint8_t{noColumn}), mostFields - fields)) {
            return false;
        }
    }
    return haveFields(RowKind::layer, layerColumns) && haveFields(RowKind::chunk, chunkColumns);
}
static_assert(isComplete(), "each field of layer_fields.h has a column, and each column of a protocol has a field");
static_assert(column_table::layers.size() <= Row::mostColumns);

Value number(std::uint64_t value) {
    return {value, {}, {}};
}
Value text(std::string_view value) {
    return {0, value, {}};
}

void addSentence(std::string &text, const Fault &fault) {
    text += text.empty() ? "" : "; ";
    appendFaultText(text, fault);
}

std::uint16_t be16(std::span<const std::uint8_t> octets, std::size_t at) {
    return static_cast<std::uint16_t>(octets[at] << 8U | octets[at + 1]);
}

} // namespace

std::string_view tunnelOf(const LayerView &view, const Layer &ipLayer) {
    const auto before = std::ranges::find_if(view.layers(), [&](const Layer &other) {
        return other.kind == LayerKind::ip && other.packet == ipLayer.packet;
    });
    if (before->ipLayer == ipLayer.ipLayer) {
        return tunnelName(view.packets()[ipLayer.packet].tunnel);
    }
    return view.has(ipLayer, layerField("ip.version")) ? "IP" : "minimal";
}

std::string_view addressText(std::span<const std::uint8_t> octets, TextRoom &room) {
    Ipv6Octets address = {};
    if (octets.size() == address.size()) {
        std::ranges::copy(octets, address.begin());
        return ipv6Text(address, room);
    }
    return ipv4Text(std::uint32_t{be16(octets, 0)} << 16U | be16(octets, 2), room);
}

PacketRows::PacketRows(Host &host) : view_(host) {}

void PacketRows::read(const PacketInput &packet, RowSink &sink) {
    const bool isIp = packet.network.isIp();
    if (isIp) {
        view_.read(packet.network.octets, packet.runOptions());
    }
    readPacket(packet, sink.wantsChecks());
    sink.row(packet_);
    if (!isIp) {
        return;
    }
    // Layers stand in the order in which they begin: those of one IP layer are one piece.
    const std::span<const Layer> layers = view_.layers();
    auto first = std::ranges::find_if(layers, [](const Layer &layer) { return layer.ipLayer != 0; });
    while (first != layers.end()) {
        const auto end =
            std::find_if(first, layers.end(), [first](const Layer &layer) { return layer.ipLayer != first->ipLayer; });
        readLayer({first, end}, sink);
        first = end;
    }
}

bool PacketRows::holds(const Condition &condition, const Row &row) const {
    switch (row.kind()) {
    case RowKind::packet: return condition.holdsFor(view_);
    case RowKind::layer: return condition.holdsFor(view_, currentLayer_->ipLayer);
    case RowKind::chunk:
    case RowKind::cause: break;
    }
    return condition.holdsFor(view_, currentLayer_->ipLayer, currentChunk_);
}

void PacketRows::readPacket(const PacketInput &packet, bool withChecks) {
    constexpr RowKind kind = RowKind::packet;
    const CapturedPacket &captured = packet.captured;
    packet_.clear();
    packet_.set(column(kind, "packet"), number(captured.number));
    if (const auto time = captured.time ? captured.time->inNanoseconds() : std::nullopt) {
        packet_.set(column(kind, "time"), number(static_cast<std::uint64_t>(*time)));
    }
    packet_.set(column(kind, "interface.number"), number(captured.interfaceNumber));
    if (!captured.interfaceName.empty()) {
        packet_.set(column(kind, "interface.name"), text(asUtf8(captured.interfaceName, interfaceName_)));
    }
    packet_.set(column(kind, "link_type"), number(static_cast<std::uint32_t>(captured.linkType)));
    packet_.set(column(kind, "length"), number(captured.wireOctets));
    packet_.set(column(kind, "captured_length"), number(captured.octets.size()));
    if (!packet.network.isIp()) {
        packet_.set(column(kind, "no_ip"), text(packet.other));
        packet_.set(column(kind, "ip_layers"), number(0));
        return;
    }
    packet_.set(column(kind, "ip_offset"), number(packet.network.offset));
    packet_.set(column(kind, "ip_layers"), number(view_.ipLayers()));
    const std::string_view note = view_.isCutOff()         ? "the pass was cut off"
                                  : !view_.limit().empty() ? view_.limit()
                                  : view_.ipLayers() == 0  ? "no whole IP header"
                                                           : std::string_view();
    if (!note.empty()) {
        packet_.set(column(kind, "note"), text(note));
    }
    if (withChecks) {
        writeChecks(checks_.check(packet.network.octets, packet.runOptions().wireOctets));
    }
}

void PacketRows::writeChecks(std::span<const Fault> faults) {
    constexpr RowKind kind = RowKind::packet;
    damage_.clear();
    notes_.clear();
    for (const Fault &fault : faults) {
        addSentence(fault.kind == FaultKind::damage ? damage_ : notes_, fault);
    }
    packet_.set(column(kind, "checks.damaged"), number(damage_.empty() ? 0 : 1));
    if (!damage_.empty()) {
        packet_.set(column(kind, "checks.damage"), text(damage_));
    }
    if (!notes_.empty()) {
        packet_.set(column(kind, "checks.notes"), text(notes_));
    }
}

// The first of the layers is that of the IP header.
void PacketRows::readLayer(std::span<const Layer> layers, RowSink &sink) {
    constexpr RowKind kind = RowKind::layer;
    const Layer &ipLayer = layers.front();
    currentLayer_ = &ipLayer;
    layer_.clear();
    layer_.set(column(kind, "packet"), packet_[column(RowKind::packet, "packet")]);
    if (packet_.has(column(RowKind::packet, "time"))) {
        layer_.set(column(kind, "time"), packet_[column(RowKind::packet, "time")]);
    }
    layer_.set(column(kind, "layer"), number(ipLayer.ipLayer));
    layer_.set(column(kind, "octet"), number(ipLayer.firstOctet));
    readTunnel(ipLayer);
    bool hasChunks = false;
    for (const Layer &layer : layers) {
        if (layer.kind == LayerKind::chunk) {
            hasChunks = true;
        } else {
            fill(layer_, layer);
        }
    }
    readPorts();
    sink.row(layer_);
    if (hasChunks) {
        readChunks(layers, sink);
    }
}

void PacketRows::readTunnel(const Layer &ipLayer) {
    const std::string_view tunnel = ipLayer.ipLayer == 1 ? std::string_view() : tunnelOf(view_, ipLayer);
    if (tunnel.empty()) {
        packetBefore_ = ipLayer.packet;
        return;
    }
    layer_.set(column(RowKind::layer, "tunnel"), text(tunnel));
    const InnerPacket &packet = view_.packets()[ipLayer.packet];
    if (packet.id && ipLayer.packet != packetBefore_) {
        layer_.set(column(RowKind::layer, "tunnel_id"), number(*packet.id));
    }
    packetBefore_ = ipLayer.packet;
}

void PacketRows::readPorts() {
    constexpr RowKind kind = RowKind::layer;
    for (const auto &[source, destination] :
         {std::pair{column(kind, "tcp.source_port"), column(kind, "tcp.destination_port")},
          std::pair{column(kind, "udp.source_port"), column(kind, "udp.destination_port")},
          std::pair{column(kind, "sctp.source_port"), column(kind, "sctp.destination_port")}}) {
        if (layer_.has(source)) {
            layer_.set(column(kind, "source_port"), layer_[source]);
        }
        if (layer_.has(destination)) {
            layer_.set(column(kind, "destination_port"), layer_[destination]);
        }
    }
}

void PacketRows::readChunks(std::span<const Layer> layers, RowSink &sink) {
    constexpr RowKind kind = RowKind::chunk;
    chunk_.clear();
    for (const Layer &layer : layers) {
        if (layer.kind != LayerKind::chunk) {
            fill(chunk_, layer);
        }
    }
    chunk_.set(column(kind, "packet"), layer_[column(RowKind::layer, "packet")]);
    if (layer_.has(column(RowKind::layer, "time"))) {
        chunk_.set(column(kind, "time"), layer_[column(RowKind::layer, "time")]);
    }
    chunk_.set(column(kind, "layer"), layer_[column(RowKind::layer, "layer")]);
    std::uint32_t chunks = 0;
    for (const Layer &layer : layers) {
        if (layer.kind != LayerKind::chunk) {
            continue;
        }
        for (const std::uint8_t place : chunkColumns[static_cast<std::size_t>(LayerKind::chunk)]) {
            if (place != noColumn) {
                chunk_.unset(place); // of the chunk before
            }
        }
        currentChunk_ = &layer;
        chunk_.set(column(kind, "chunk"), number(++chunks));
        chunk_.set(column(kind, "octet"), number(layer.firstOctet));
        fill(chunk_, layer);
        sink.row(chunk_);
        readCauses(layer, sink);
    }
}

// Causes are read by their lengths. One that is longer than its chunk is given as far as it is there, and ends them.
void PacketRows::readCauses(const Layer &chunk, RowSink &sink) {
    constexpr std::uint32_t abort = 6;
    constexpr std::uint32_t error = 9;
    constexpr std::size_t headOctets = 4; // of a chunk and of a cause
    constexpr RowKind kind = RowKind::cause;
    const std::uint32_t type = view_.number(chunk, layerField("sctp.chunk_type")).value();
    const InnerPacket &packet = view_.packets()[chunk.packet];
    const std::size_t packetEnd = std::size_t{packet.firstOctet} + packet.octets;
    std::size_t at = chunk.firstOctet;
    if ((type != abort && type != error) || at + headOctets > packetEnd) {
        return;
    }
    const std::span<const std::uint8_t> octets = view_.packet();
    const std::size_t end = std::min(packetEnd, at + be16(octets, at + 2));
    std::uint32_t causes = 0;
    for (at += headOctets; at + headOctets <= end;) {
        const std::size_t length = be16(octets, at + 2);
        const std::size_t causeEnd = std::min(end, at + std::max(length, headOctets));
        cause_.clear();
        for (const auto &[from, to] : {std::pair{column(RowKind::chunk, "packet"), column(kind, "packet")},
                                       std::pair{column(RowKind::chunk, "time"), column(kind, "time")},
                                       std::pair{column(RowKind::chunk, "layer"), column(kind, "layer")},
                                       std::pair{column(RowKind::chunk, "chunk"), column(kind, "chunk")}}) {
            if (chunk_.has(from)) {
                cause_.set(to, chunk_[from]);
            }
        }
        cause_.set(column(kind, "cause"), number(++causes));
        cause_.set(column(kind, "octet"), number(at));
        cause_.set(column(kind, "cause_code"), number(be16(octets, at)));
        cause_.set(column(kind, "cause_length"), number(length));
        cause_.set(column(kind, "cause_value"), {0, {}, octets.subspan(at + headOctets, causeEnd - at - headOctets)});
        sink.row(cause_);
        if (length < headOctets) {
            return;
        }
        at += (length + 3) & ~std::size_t{3}; // padded
    }
}

// The fields of a layer for which the row has columns. What is there stays: of two AH or ESP headers, the first.
void PacketRows::fill(Row &row, const Layer &layer) const {
    const std::span<const Column> types = columns(row.kind());
    const FieldColumns &columns = row.kind() == RowKind::layer ? layerColumns : chunkColumns;
    const auto &ofKind = columns[static_cast<std::size_t>(layer.kind)];
    for (std::uint32_t rest = layer.present; rest != 0; rest &= rest - 1) {
        const auto place = static_cast<std::uint8_t>(std::countr_zero(rest));
        const std::size_t to = ofKind[place];
        if (to == noColumn || row.has(to)) {
            continue;
        }
        const LayerField field = {layer.kind, place};
        const LayerValue kind = view_.valueKind(layer, field);
        if (kind == LayerValue::number || kind == LayerValue::packetNumber) {
            const std::uint32_t value = view_.number(layer, field).value();
            // A field may be an option's kind where the column tells whether there is one.
            const bool isTrue = types[to].type == ColumnType::boolean && value != 0;
            row.setNumber(to, isTrue ? 1 : value);
        } else {
            row.set(to, {0, {}, view_.octets(layer, field)});
        }
    }
}

} // namespace netfloor
