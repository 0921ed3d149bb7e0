// SPDX-License-Identifier: MIT
// All layers of a packet with the values of their fields, also those of the packets inside it. No layer overwrites
// another one.
//
//     netfloor::LayerView view(host);
//     view.read(packet);                                  // from the IP header on
//     for (const netfloor::Layer &layer : view.layers()) {
//         if (layer.kind == netfloor::LayerKind::tcp) {
//             std::cout << view.number(layer, netfloor::layerField("tcp.window")).value_or(0) << '\n';
//         }
//     }
//
// A view keeps its storage from packet to packet, and what it gives is valid until the next read. Octets are counted
// from the start of the packet that was read.
#pragma once

#include <array>
#include <cstdint>
#include <memory>
#include <optional>
#include <span>
#include <string>
#include <string_view>
#include <vector>

#include "netfloor-host/inner_packets.h"
#include "netfloor-host/layer_fields.h"
#include "netfloor-host/plugin_host.h"

namespace netfloor {

struct Layer {
    LayerKind kind = LayerKind::ip;
    std::uint16_t ipLayer = 0;    // the number of the IP header that it belongs to, from 1; 0 before the first one
    std::uint16_t packet = 0;     // index of the packet, from 0: each packet inside another one is decoded by itself
    std::uint32_t firstOctet = 0; // of the field that opens it
    std::uint32_t endOctet = 0;   // after its last field so far
    std::uint32_t present = 0;    // a bit for each field, by place
    std::uint32_t values = 0;     // where its values begin
    std::uint32_t nameEnd = 0;    // payload: the owner's name and line in the texts
    std::uint32_t name = 0;
    std::uint32_t textEnd = 0;
};

class PlainPackets;
struct PlainHeader;

// How a view reads packets.
enum class LayerReading : std::uint8_t {
    // Those with one IP header, TCP or UDP and the usual options out of their octets, in the places that the plug-in
    // gives for the fields of sample packets; all others by the MD pass. The layers are the same, in a fraction of the
    // time. Where Host::owners() were changed, all packets are read by the pass.
    fast,
    byPass, // all by the MD pass
};

class LayerView final : private Sink {
public:
    static constexpr std::uint16_t mostIpLayers = 16;

    explicit LayerView(Host &host, LayerReading reading = LayerReading::fast);
    ~LayerView() override;

    // Reads the packet and the packets inside it. Of a packet that was cut, RunOptions::wireOctets gives the length on
    // the wire. Throws as Host::run does.
    void read(std::span<const std::uint8_t> packet, const RunOptions &options = {});

    [[nodiscard]] std::span<const Layer> layers() const { return layers_; } // as they begin
    [[nodiscard]] std::span<const std::uint8_t> packet() const { return packet_; }
    [[nodiscard]] std::uint16_t ipLayers() const { return ipLayers_; }

    // The packets, the outermost one first, and how each was found.
    [[nodiscard]] std::span<const InnerPacket> packets() const { return packets_; }

    [[nodiscard]] bool has(const Layer &layer, LayerField field) const {
        return layer.kind == field.kind && (layer.present >> field.place & 1U) != 0;
    }
    // A number, or an IPv4 address with its first octet on top.
    [[nodiscard]] std::optional<std::uint32_t> number(const Layer &layer, LayerField field) const {
        return has(layer, field) ? std::optional(values_[layer.values + field.place].number) : std::nullopt;
    }
    // The octets of an address or of LayerValue::octets, as the packet has them.
    [[nodiscard]] std::span<const std::uint8_t> octets(const Layer &layer, LayerField field) const;
    // Where the octets of a field begin.
    [[nodiscard]] std::uint32_t octet(const Layer &layer, LayerField field) const {
        return values_[layer.values + field.place].octet;
    }
    [[nodiscard]] LayerValue valueKind(const Layer &layer, LayerField field) const {
        return values_[layer.values + field.place].kind;
    }
    // The id of the plug-in's field that gave the value, of the several that the name stands for.
    [[nodiscard]] std::uint32_t fieldId(const Layer &layer, LayerField field) const {
        return values_[layer.values + field.place].fieldId;
    }
    // The address of a field, in the form of RFC 5952 or in dotted form. Empty if the layer does not have it.
    [[nodiscard]] std::string_view address(const Layer &layer, LayerField field, TextRoom &room) const;

    // LayerKind::payload: what the owner reported. Data without an owner have no text.
    [[nodiscard]] std::string_view name(const Layer &layer) const {
        return std::string_view(texts_).substr(layer.name, layer.nameEnd - layer.name);
    }
    [[nodiscard]] std::string_view text(const Layer &layer) const {
        return std::string_view(texts_).substr(layer.nameEnd, layer.textEnd - layer.nameEnd);
    }

    [[nodiscard]] std::string_view limit() const { return limit_; } // why layers are missing, or nothing

    // The header that follows several IPv6 options; its octet is one of packet(). The plug-in takes the second option
    // for the next header, so that all that it reads from there on is left out, and limit() says so.
    [[nodiscard]] std::optional<UpperLayer> unread() const { return unread_; }
    [[nodiscard]] bool isCutOff() const { return isCutOff_; } // a pass was

    // Passes that were run for all packets so far. Packets that were read without one are not in it.
    [[nodiscard]] std::uint64_t passes() const { return passes_; }

private:
    struct Value {
        std::uint32_t number; // LayerValue::octets: how many
        std::uint32_t octet;
        std::uint16_t fieldId;
        LayerValue kind;
    };

    using Sink::text; // clang warns where the one above hides it

    [[nodiscard]] bool wantsBlocks() const override { return false; }
    [[nodiscard]] bool wantsBlockNames() const override { return false; }
    [[nodiscard]] std::span<const std::uint8_t> wantedFields() const override { return map_.known(); }
    void field(const FieldView &field) override;
    void end(const PassEnd &end) override;

    void leaveOutMisread(std::size_t firstLayer, std::size_t wireOctets);
    [[nodiscard]] bool readPlain(std::span<const std::uint8_t> octets, std::size_t wireOctets);
    void addHeader(const PlainHeader &header, std::uint32_t octet);
    [[nodiscard]] bool openLayer(LayerKind kind, std::uint32_t octet);
    void keepVersion(Layer &layer, std::uint32_t octet, LayerField opener);
    void keepPayload(std::string_view name, std::string_view text, std::uint32_t octet, std::uint32_t endOctet);

    Host &host_;
    LayerFieldMap map_;
    LayerReading reading_;
    std::unique_ptr<PlainPackets> plain_; // from the first packet on
    std::span<const std::uint8_t> packet_;
    std::vector<Layer> layers_;
    std::vector<Value> values_; // it only grows; those that are not present are left as they were
    std::uint32_t valueCount_ = 0;
    std::vector<InnerPacket> packets_;
    std::string texts_;
    std::string_view limit_;
    std::array<std::int32_t, layerKinds> open_ = {}; // the current layer of each kind, or -1
    std::uint32_t offset_ = 0;                       // of the current packet
    std::uint16_t ipLayers_ = 0;
    std::optional<UpperLayer> unread_;
    bool isCutOff_ = false;
    bool isFull_ = false;
    std::uint64_t passes_ = 0;
    bool isLaterFragment_ = false;
};

} // namespace netfloor
