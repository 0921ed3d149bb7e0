// SPDX-License-Identifier: MIT
// The rows of a packet: itself, its IP layers, their SCTP chunks and the error causes in these, with typed values.
//
//     netfloor::PacketRows rows(host);
//     while (capture.next(packet)) {
//         const netfloor::NetworkPart network = netfloor::findNetworkPart(packet.linkType, packet.octets);
//         rows.read({packet, network, network.other.text()}, sink); // calls sink.row(...) for each
//     }
#pragma once

#include <array>
#include <bit>
#include <cstddef>
#include <cstdint>
#include <optional>
#include <span>
#include <string>
#include <string_view>
#include <vector>

#include "netfloor-analysis/columns.h"
#include "netfloor-capture/link_layer.h"
#include "netfloor-capture/packet.h"
#include "netfloor-host/checks.h"
#include "netfloor-host/condition.h"
#include "netfloor-host/layers.h"

namespace netfloor {

// A packet of a capture, from its IP header on where it has one.
struct PacketInput {
    const CapturedPacket &captured;
    const NetworkPart &network;
    std::string_view other; // what it is if it is no IP

    // For the passes over it.
    [[nodiscard]] RunOptions runOptions() const {
        RunOptions options;
        options.wireOctets = captured.isCut() ? captured.wireOctets - network.offset : 0;
        return options;
    }
};

// One of the three, by the type of its column.
struct Value {
    std::uint64_t number = 0; // boolean (0 or 1), u8 to u64; of a time the bits of the signed number
    std::string_view text;
    std::span<const std::uint8_t> octets; // also of an address

    [[nodiscard]] std::int64_t time() const { return static_cast<std::int64_t>(number); }
};

// An address as text: dotted, or in the form of RFC 5952.
[[nodiscard]] std::string_view addressText(std::span<const std::uint8_t> octets, TextRoom &room);

// The values of a row by the place of their column in columns(kind()).
class Row {
public:
    static constexpr std::size_t mostColumns = 128;
    using Columns = std::array<std::uint64_t, mostColumns / 64>; // a bit for each, by place

    explicit Row(RowKind kind) : kind_(kind), values_(columns(kind).size()) {}

    [[nodiscard]] RowKind kind() const { return kind_; }
    [[nodiscard]] const Columns &present() const { return present_; }
    [[nodiscard]] bool has(std::size_t column) const { return (present_[column / 64] >> column % 64 & 1U) != 0; }
    [[nodiscard]] const Value &operator[](std::size_t column) const { return values_[column]; }

    // visit(std::size_t column, const Value &value), in the order of the columns, without those that it has not.
    template <typename Visit>
    void forEach(Visit visit) const {
        forEachColumn(present_, [&](std::size_t column) { visit(column, values_[column]); });
    }
    // visit(std::size_t column), in their order.
    template <typename Visit>
    static void forEachColumn(const Columns &columns, Visit visit) {
        for (std::size_t word = 0; word < columns.size(); ++word) {
            for (std::uint64_t rest = columns[word]; rest != 0; rest &= rest - 1) {
                visit(64 * word + static_cast<std::size_t>(std::countr_zero(rest)));
            }
        }
    }

    void clear() { present_ = {}; }
    void set(std::size_t column, const Value &value) {
        present_[column / 64] |= std::uint64_t{1} << column % 64;
        values_[column] = value;
    }
    // Of a column that holds numbers only: in place, which is much faster than a whole Value.
    void setNumber(std::size_t column, std::uint64_t number) {
        present_[column / 64] |= std::uint64_t{1} << column % 64;
        values_[column].number = number;
    }
    void unset(std::size_t column) { present_[column / 64] &= ~(std::uint64_t{1} << column % 64); }

private:
    RowKind kind_;
    Columns present_ = {};
    std::vector<Value> values_;
};

// Takes rows: a packet, then each of its layers, each layer followed by its chunks, each chunk by its causes. A row is
// valid during the call.
class RowSink {
public:
    RowSink() = default;
    RowSink(const RowSink &) = delete;
    RowSink &operator=(const RowSink &) = delete;
    virtual ~RowSink() = default;

    // Without them the columns of the group "checks" are left out, and so is their time.
    [[nodiscard]] virtual bool wantsChecks() const { return true; }

    virtual void row(const Row &row) = 0;
};

// How the IP header of a layer came into the one before: "IP", "minimal", "GRE"... Empty for the first one.
[[nodiscard]] std::string_view tunnelOf(const LayerView &view, const Layer &ipLayer);

// Keeps its storage from packet to packet: a usual packet allocates nothing.
class PacketRows {
public:
    explicit PacketRows(Host &host);

    // Throws as Host::run does, and what the sink throws.
    void read(const PacketInput &packet, RowSink &sink);

    // Of the packet that was read last, if it has IP.
    [[nodiscard]] const LayerView &view() const { return view_; }

    // Whether a condition holds for the row that the sink is given now, which is of a packet with IP: for any IP layer
    // of a packet, for a layer, or for the layer and the chunk of a chunk or a cause.
    [[nodiscard]] bool holds(const Condition &condition, const Row &row) const;

private:
    void readPacket(const PacketInput &packet, bool withChecks);
    void writeChecks(std::span<const Fault> faults);
    void readLayer(std::span<const Layer> layers, RowSink &sink);
    void readTunnel(const Layer &ipLayer);
    void readPorts();
    void readChunks(std::span<const Layer> layers, RowSink &sink);
    void readCauses(const Layer &chunk, RowSink &sink);
    void fill(Row &row, const Layer &layer) const;

    LayerView view_;
    PacketChecks checks_;
    Row packet_{RowKind::packet};
    Row layer_{RowKind::layer};
    Row chunk_{RowKind::chunk};
    Row cause_{RowKind::cause};
    std::uint16_t packetBefore_ = 0;      // of the layer before
    const Layer *currentLayer_ = nullptr; // of the row that the sink is given, for the IP layer
    const Layer *currentChunk_ = nullptr;
    std::string interfaceName_;
    std::string damage_;
    std::string notes_;
};

} // namespace netfloor
