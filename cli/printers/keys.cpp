// SPDX-License-Identifier: MIT
// CSV (RFC 4180) out of the layers of each packet: a row for each IP layer, or for each SCTP chunk.
#include <array>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "netfloor-analysis/rows.h"
#include "printers/key_columns.h"
#include "printers/printer.h"
#include "where.h"

namespace netfloor::cli {

namespace {

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
        } else {
            view_.read(packet.network.octets, packet.runOptions());
            printLayers(packet);
        }
    }

    void finish(const Tally & /*tally*/) override {}

private:
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
            startRow(packet, layer.ipLayer, tunnelOf(view_, layer), note);
            rows_.write(view_, layer.ipLayer, options().perChunk ? &layer : nullptr);
            out() << '\n';
        }
    }

    [[nodiscard]] bool meetsCondition(const Layer &layer) const {
        return layer.kind == LayerKind::chunk ? condition_->holdsFor(view_, layer.ipLayer, &layer)
                                              : condition_->holdsFor(view_, layer.ipLayer);
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
    LayerView view_;
    std::optional<Condition> condition_; // of the rows
    std::string note_;
};

} // namespace

std::unique_ptr<Printer> makeKeysPrinter(const Options &options, Output &out, Host &host) {
    return std::make_unique<KeysPrinter>(options, out, host);
}

} // namespace netfloor::cli
