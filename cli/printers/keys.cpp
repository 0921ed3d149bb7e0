// SPDX-License-Identifier: MIT
// CSV (RFC 4180) out of the layers of each packet: a row for each IP layer, or for each SCTP chunk. Most packets have
// one IPv4 header and TCP or UDP: these are read by XTR, where all columns are key fields, which takes half the time.
#include <algorithm>
#include <array>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "printers/key_columns.h"
#include "printers/printer.h"
#include "where.h"

namespace netfloor::cli {

namespace {

// The columns out of one XTR pass.
class PlainKeys final : public Sink {
public:
    // `names` are those of the key-field table. Of several rows of one name the last is the one that is filled.
    PlainKeys(const std::vector<std::string> &names, std::span<const KeyColumn> columns)
        : columns_(names.size(), noColumn), values_(columns.size()) {
        for (std::size_t column = 0; column < columns.size(); ++column) {
            bool isKnown = false;
            for (const std::string_view key : plainKeyFields(columns[column])) {
                const auto row = std::find(names.rbegin(), names.rend(), key);
                if (row != names.rend()) {
                    std::size_t &place = columns_[static_cast<std::size_t>(names.rend() - row) - 1];
                    isKnown = place == noColumn; // a column that is named twice takes the other way
                    place = isKnown ? column : place;
                }
            }
            isComplete_ &= isKnown;
        }
    }

    [[nodiscard]] bool isComplete() const { return isComplete_; }

    void begin(Pass /*pass*/, std::span<const std::uint8_t> /*packet*/) override {
        for (Value &value : values_) {
            value.isPresent = false;
        }
    }
    void key(const KeyView &key) override {
        if (key.row < columns_.size() && columns_[key.row] != noColumn) {
            values_[columns_[key.row]] = {key.number, key.type == KeyType::ipv4Address, true};
        }
    }

    void write(Output &out) const {
        TextRoom room;
        for (const Value &value : values_) {
            out << ',';
            if (!value.isPresent) {
                continue;
            }
            if (value.isAddress) {
                out << ipv4Text(value.number, room);
            } else {
                out << value.number;
            }
        }
    }

private:
    static constexpr std::size_t noColumn = static_cast<std::size_t>(-1);
    struct Value {
        std::uint32_t number;
        bool isAddress;
        bool isPresent;
    };

    std::vector<std::size_t> columns_; // by row of the table
    std::vector<Value> values_;        // by column
    bool isComplete_ = true;
};

// The names in the plug-in's key-field table, row by row.
std::vector<std::string> keyFieldNames(Host &host) {
    // The plug-in hands its table over in its first XTR pass, whatever the packet.
    constexpr std::array<std::uint8_t, 1> noPacket = {0};
    Sink nothing;
    host.run(Pass::xtr, noPacket, nothing);
    return host.library().keyFieldNames();
}

// Seconds since 1970 with nine digits after the point.
void writeTime(Output &out, const CaptureTime &time) {
    constexpr std::uint32_t perSecond = 1'000'000'000;
    constexpr std::size_t digits = 9;
    const bool isBefore = time.seconds < 0;
    const bool carries = isBefore && time.nanoseconds != 0;
    const std::uint32_t nanoseconds = carries ? perSecond - time.nanoseconds : time.nanoseconds;
    const std::int64_t seconds = time.seconds + (carries ? 1 : 0);
    out << (isBefore ? "-" : "")
        << (isBefore ? 0 - static_cast<std::uint64_t>(seconds) : static_cast<std::uint64_t>(seconds));
    std::array<char, digits + 1> text = {'.'};
    for (std::uint32_t rest = nanoseconds, place = digits; place != 0; --place, rest /= 10) {
        text[place] = static_cast<char>('0' + rest % 10);
    }
    out << std::string_view(text.data(), text.size());
}

class KeysPrinter final : public Printer {
public:
    KeysPrinter(const Options &options, Output &out, Host &host)
        : Printer(options, out, host),
          columns_(keyColumns(options.columns, options.perChunk)),
          rows_(out, columns_, options.raw),
          plain_(keyFieldNames(host), columns_),
          view_(host) {
        if (!options.where.empty()) {
            condition_.emplace(parseWhere(options.where));
        }
    }

    void start() override {
        out() << (options().files.size() > 1 ? "file," : "") << "packet,time,length,layer,tunnel,note";
        for (const KeyColumn &column : columns_) {
            out() << ',' << column.name;
        }
        out() << '\n';
    }

    [[nodiscard]] bool hasHeadings() const override { return false; }

    void print(const PacketToPrint &packet) override {
        if (!packet.network.isIp()) {
            printWithoutLayers(packet);
        } else if (!options().perChunk && !options().raw && plain_.isComplete() &&
                   isPlainIpv4(packet.network.octets, packet.runOptions().wireOctets)) {
            printPlain(packet);
        } else {
            view_.read(packet.network.octets, packet.runOptions());
            printLayers(packet);
        }
    }

    void finish(const Tally & /*tally*/) override {}

private:
    void printPlain(const PacketToPrint &packet) {
        const Ending ending = run(Pass::xtr, packet, plain_);
        startRow(packet, 1, {}, ending == Ending::complete ? "" : "the pass was cut off");
        plain_.write(out());
        out() << '\n';
    }

    void printWithoutLayers(const PacketToPrint &packet) {
        note_ = "no IP: ";
        note_ += packet.other;
        startRow(packet, 0, {}, note_);
        rows_.writeNone();
        out() << '\n';
    }

    void printLayers(const PacketToPrint &packet) {
        const std::string_view note = view_.isCutOff() ? "the pass was cut off" : view_.limit();
        if (view_.ipLayers() == 0 && !options().perChunk) {
            startRow(packet, 0, {}, note.empty() ? "no whole IP header" : note);
            rows_.writeNone();
            out() << '\n';
        }
        for (const Layer &layer : view_.layers()) {
            if (layer.kind != (options().perChunk ? LayerKind::chunk : LayerKind::ip)) {
                continue;
            }
            if (condition_ && !meetsCondition(layer)) {
                continue;
            }
            startRow(packet, layer.ipLayer, tunnelOf(layer), note);
            rows_.write(view_, layer.ipLayer, options().perChunk ? &layer : nullptr);
            out() << '\n';
        }
    }

    [[nodiscard]] bool meetsCondition(const Layer &layer) const {
        return layer.kind == LayerKind::chunk ? condition_->holdsFor(view_, layer.ipLayer, &layer)
                                              : condition_->holdsFor(view_, layer.ipLayer);
    }

    // How the IP layer came into the one before.
    [[nodiscard]] std::string_view tunnelOf(const Layer &layer) const {
        const InnerPacket &packet = view_.packets()[layer.packet];
        const auto before = std::ranges::find_if(view_.layers(), [&](const Layer &other) {
            return other.kind == LayerKind::ip && other.packet == layer.packet;
        });
        if (before->ipLayer == layer.ipLayer) {
            return tunnelName(packet.tunnel);
        }
        return view_.has(layer, layerField("ip.version")) ? "IP" : "minimal";
    }

    void startRow(const PacketToPrint &packet, std::uint32_t layer, std::string_view tunnel, std::string_view note) {
        if (!packet.file.empty()) {
            writeCsv(out(), packet.file);
            out() << ',';
        }
        out() << packet.captured.number << ',';
        if (options().utc) {
            out() << packet.time;
        } else if (packet.captured.time) {
            writeTime(out(), *packet.captured.time);
        }
        out() << ',' << packet.captured.wireOctets << ',';
        if (layer != 0) {
            out() << layer;
        }
        out() << ',' << tunnel << ',';
        const Output::Mark start = out().mark();
        out() << note;
        if (packet.captured.isCut()) {
            out() << (out().mark() == start ? "" : "; ");
            printCut(packet.captured);
        }
        if (out().mark() != start) {
            const std::string text(out().since(start));
            out().takeBack(start);
            writeCsv(out(), text);
        }
    }

    std::vector<KeyColumn> columns_;
    KeyRows rows_;
    PlainKeys plain_;
    LayerView view_;
    std::optional<Condition> condition_; // of the rows
    std::string note_;
};

} // namespace

std::unique_ptr<Printer> makeKeysPrinter(const Options &options, Output &out, Host &host) {
    return std::make_unique<KeysPrinter>(options, out, host);
}

} // namespace netfloor::cli
