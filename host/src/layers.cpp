// SPDX-License-Identifier: MIT
#include "netfloor-host/layers.h"

#include <algorithm>

#include "data_owner.h"
#include "octets.h"
#include "plain_packets.h"

namespace netfloor {
namespace {

constexpr std::uint8_t mostTextOctets = 120; // of what an owner says

constexpr auto fieldCounts = [] {
    std::array<std::uint32_t, layerKinds> counts = {};
    for (std::size_t kind = 0; kind < layerKinds; ++kind) {
        counts[kind] = layerFieldCount(static_cast<LayerKind>(kind));
    }
    return counts;
}();
static_assert(std::ranges::max(fieldCounts) <= 32, "the fields of a layer are bits of one word");

// The octets of a field from the lowest to the highest. Some fields are read from their last octet on.
struct Place {
    std::uint32_t first;
    std::uint32_t end;
};
Place placeOf(std::span<const BitRange> ranges) {
    const BitRange &front = ranges.front();
    const BitRange &back = ranges.back();
    return {(std::min(front.firstBit, back.firstBit) - 1) / bitsPerOctet,
            (std::max(front.lastBit, back.lastBit) - 1) / bitsPerOctet + 1};
}

LayerKind layerKindOf(PlainPart transport) {
    switch (transport) {
    case PlainPart::udp: return LayerKind::udp;
    case PlainPart::icmpEcho: return LayerKind::icmp;
    default: return LayerKind::tcp;
    }
}

} // namespace

LayerView::LayerView(Host &host, LayerReading reading)
    : host_(host), map_(host.fieldTables().fields()), reading_(reading) {}

LayerView::~LayerView() = default;

void LayerView::read(std::span<const std::uint8_t> packet, const RunOptions &options) {
    packet_ = packet;
    layers_.clear();
    valueCount_ = 0;
    packets_.clear();
    texts_.clear();
    limit_ = {};
    ipLayers_ = 0;
    unread_.reset();
    isCutOff_ = false;
    isFull_ = false;
    if (!plain_ && reading_ == LayerReading::fast) {
        plain_ = std::make_unique<PlainPackets>(host_, map_);
    }
    InnerPackets at(packet, options.wireOctets);
    for (; !at.ended(); at.next()) {
        open_.fill(-1);
        isLaterFragment_ = false;
        packets_.push_back(at.opened());
        packets_.back().firstOctet = at.firstOctet();
        packets_.back().octets = static_cast<std::uint32_t>(at.octets().size());
        offset_ = at.firstOctet();
        RunOptions inner = options;
        inner.wireOctets = at.wireOctets();
        if (!readPlain(at.octets(), inner.wireOctets)) {
            ++passes_;
            const std::size_t firstLayer = layers_.size();
            host_.run(Pass::md, at.octets(), *this, inner);
            leaveOutMisread(firstLayer, inner.wireOctets);
        }
    }
    if (limit_.empty()) {
        limit_ = at.limit();
    }
}

// The layers of a pass are those from `firstLayer` on.
void LayerView::leaveOutMisread(std::size_t firstLayer, std::size_t wireOctets) {
    constexpr LayerField version = layerField("ip.version");
    constexpr LayerField protocol = layerField("ip.protocol");
    for (std::size_t i = firstLayer; i + 1 < layers_.size(); ++i) {
        std::size_t carried = i + 1;
        while (carried < layers_.size() && layers_[carried].kind == LayerKind::security) {
            ++carried;
        }
        if (number(layers_[i], version) != 6U || carried == layers_.size() ||
            layers_[carried].kind == LayerKind::payload) {
            continue;
        }
        const std::uint32_t first = layers_[i].firstOctet;
        const std::size_t before = first - offset_;
        auto upper = findUpperLayer(packet_.subspan(first), wireOctets > before ? wireOctets - before : 0);
        if (!upper || first + upper->octet == layers_[carried].firstOctet) {
            continue;
        }
        upper->octet += first;
        unread_ = upper;
        values_[layers_[i].values + protocol.place].number = upper->protocol;
        ipLayers_ = layers_[i].ipLayer;
        layers_.resize(carried);
        limit_ = "what follows several IPv6 options is not decoded";
        return;
    }
}

bool LayerView::readPlain(std::span<const std::uint8_t> octets, std::size_t wireOctets) {
    PlainPacket found;
    if (!plain_ || !plain_->isUsable() || !host_.owners().isUnchanged() || !findPlain(octets, wireOctets, found)) {
        return false;
    }
    if (!openLayer(LayerKind::ip, offset_)) {
        return true;
    }
    addHeader(plain_->header(found.ip), offset_);
    if (!found.transport) {
        return true;
    }
    const std::uint32_t transport = offset_ + octetsOf(found.ip);
    (void)openLayer(layerKindOf(*found.transport), transport); // only those of IP have a limit
    addHeader(plain_->header(*found.transport), transport);
    for (std::uint32_t i = 0; i < found.optionCount; ++i) {
        addHeader(plain_->header(found.options[i].part), offset_ + found.options[i].octet);
    }
    constexpr std::uint32_t mostUnread = 4; // the plug-in does not hand off so few
    const bool isHandedOff = found.transport != PlainPart::icmpEcho;
    if (isHandedOff && found.endOctet - found.payloadOctet > mostUnread) {
        const auto end = std::min(found.endOctet, static_cast<std::uint32_t>(octets.size()));
        keepPayload(dataName, {}, offset_ + found.payloadOctet, offset_ + end);
    }
    return true;
}

// Adds the fields of a header to the layer that was opened last.
void LayerView::addHeader(const PlainHeader &header, std::uint32_t octet) {
    Layer &layer = layers_.back();
    layer.present |= header.present;
    layer.endOctet = std::max(layer.endOctet, octet + header.endOctet);
    const std::uint8_t *const octets = packet_.data() + octet;
    Value *const values = values_.data() + layer.values;
    for (const PlainField &field : header.fields) {
        values[field.place] = {field.read(octets), octet + field.octet, field.id, field.value};
    }
}

bool LayerView::openLayer(LayerKind kind, std::uint32_t octet) {
    if (kind == LayerKind::ip) {
        if (ipLayers_ == mostIpLayers) {
            limit_ = "more than 16 IP layers: the rest is left out";
            isFull_ = true;
            return false;
        }
        ++ipLayers_;
        open_.fill(-1);
    }
    open_[static_cast<std::size_t>(kind)] = static_cast<std::int32_t>(layers_.size());
    Layer &layer = layers_.emplace_back();
    layer.kind = kind;
    layer.ipLayer = ipLayers_;
    layer.packet = static_cast<std::uint16_t>(packets_.size() - 1);
    layer.firstOctet = layer.endOctet = octet;
    layer.values = valueCount_;
    valueCount_ += fieldCounts[static_cast<std::size_t>(kind)];
    if (values_.size() < valueCount_) {
        values_.resize(2 * std::size_t{valueCount_});
    }
    return true;
}

void LayerView::field(const FieldView &field) {
    if (isFull_ || field.ranges.empty()) {
        return;
    }
    if (field.id == 0) {
        if (isLaterFragment_) {
            return;
        }
        const Place place = placeOf(field.ranges);
        const std::string_view text = field.name == dataName ? std::string_view() : field.text.view();
        keepPayload(field.name, text, place.first + offset_, place.end + offset_);
        return;
    }
    const LayerFieldMap::Entry &entry = map_.find(field.id);
    if (!entry.isKnown || (isLaterFragment_ && entry.field.kind != LayerKind::ip)) {
        return;
    }
    Place place = placeOf(field.ranges);
    place.first += offset_;
    place.end += offset_;
    std::int32_t &open = open_[static_cast<std::size_t>(entry.field.kind)];
    if (entry.opensLayer && (isLaterFragment_ || !openLayer(entry.field.kind, place.first))) {
        return;
    }
    if (open < 0) {
        return;
    }
    Layer &layer = layers_[static_cast<std::size_t>(open)];
    layer.present |= 1U << entry.field.place;
    layer.endOctet = std::max(layer.endOctet, place.end);
    Value &value = values_[layer.values + entry.field.place];
    value = {field.value, place.first, static_cast<std::uint16_t>(field.id), entry.value};
    if (entry.value == LayerValue::packetNumber) {
        value.number = be32(packet_, place.first);
    } else if (entry.value == LayerValue::octets) {
        value.number = place.end - place.first;
    }
    // The plug-in reads what is in the middle of a segment as a header.
    isLaterFragment_ |= entry.field == layerField("ip.fragment_offset") && field.value != 0;
    if (entry.opensLayer && entry.field.kind == LayerKind::ip) {
        keepVersion(layer, place.first, entry.field);
    }
}

// The plug-in reads the version ahead of the first header only, and not at all in IPv6 inside IPv6.
void LayerView::keepVersion(Layer &layer, std::uint32_t octet, LayerField opener) {
    constexpr LayerField version = layerField("ip.version");
    if (opener == layerField("ip.protocol")) { // minimal encapsulation has none
        return;
    }
    layer.present |= 1U << version.place;
    values_[layer.values + version.place] = {std::uint32_t{packet_[octet]} >> 4U, octet, 0, LayerValue::number};
}

// A text longer than that is cut: who needs all of it has the octets.
void LayerView::keepPayload(std::string_view name, std::string_view text, std::uint32_t octet, std::uint32_t endOctet) {
    if (!openLayer(LayerKind::payload, octet)) {
        return;
    }
    Layer &layer = layers_.back();
    layer.endOctet = endOctet;
    layer.name = static_cast<std::uint32_t>(texts_.size());
    texts_.append(name.substr(0, mostTextOctets));
    layer.nameEnd = static_cast<std::uint32_t>(texts_.size());
    texts_.append(text.substr(0, mostTextOctets));
    layer.textEnd = static_cast<std::uint32_t>(texts_.size());
}

void LayerView::end(const PassEnd &end) {
    isCutOff_ |= end.ending == Ending::cutOff;
}

std::span<const std::uint8_t> LayerView::octets(const Layer &layer, LayerField field) const {
    if (!has(layer, field)) {
        return {};
    }
    const Value &value = values_[layer.values + field.place];
    switch (value.kind) {
    case LayerValue::octets: return packet_.subspan(value.octet, value.number);
    case LayerValue::ipv4Address: return packet_.subspan(value.octet, sizeof(std::uint32_t));
    case LayerValue::ipv6Address: return packet_.subspan(value.octet, Ipv6Octets().size());
    case LayerValue::number:
    case LayerValue::packetNumber: break;
    }
    return {};
}

std::string_view LayerView::address(const Layer &layer, LayerField field, TextRoom &room) const {
    if (!has(layer, field)) {
        return {};
    }
    const Value &value = values_[layer.values + field.place];
    if (value.kind != LayerValue::ipv6Address) {
        return ipv4Text(value.number, room);
    }
    Ipv6Octets octets = {};
    std::copy_n(packet_.begin() + value.octet, octets.size(), octets.begin());
    return ipv6Text(octets, room);
}

} // namespace netfloor
