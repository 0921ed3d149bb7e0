// SPDX-License-Identifier: MIT
// Every field of a packet as a tree of layers and blocks, out of the MD pass.
#include <algorithm>
#include <array>
#include <cstdio>
#include <string_view>
#include <vector>

#include "gaps.h"
#include "printers/field_text.h"
#include "printers/printer.h"

namespace netfloor::cli {

namespace {

constexpr std::uint32_t bitsPerOctet = 8;
constexpr std::size_t leastRun = 5;       // fewer octets of data stand on lines of their own
constexpr std::size_t octetsPerLine = 16; // of data
constexpr std::size_t mostDataLines = 4;  // without --all

bool isOneOctet(const FieldReport &field) {
    return field.ranges.size() == 1 && field.ranges[0].lastBit - field.ranges[0].firstBit + 1 == bitsPerOctet;
}

// Fields from `first` on that are octets of one stretch of data.
std::size_t runLength(std::span<const FieldReport> fields, std::size_t first) {
    std::size_t end = first;
    while (end < fields.size() && fields[end].id == fields[first].id && fields[end].name == fields[first].name &&
           isOneOctet(fields[end]) &&
           (end == first || fields[end].ranges[0].firstBit == fields[end - 1].ranges[0].lastBit + 1)) {
        ++end;
    }
    return end - first;
}

// Prints one report. Blocks are named when the first field in them comes, and again after another block.
class Tree {
public:
    Tree(Output &out, const Options &options, const Report &report, std::span<const std::uint8_t> packet)
        : out_(out), options_(options), report_(report), packet_(packet), gaps_(findGaps(report)) {}

    void print() {
        const std::span<const FieldReport> fields = report_.fields;
        for (std::size_t i = 0; i < fields.size();) {
            printGap(i);
            if (isReadAgain(i)) {
                ++i;
                continue;
            }
            openBlocks(fields[i]);
            openLayer(fields[i]);
            const std::size_t run = options_.all ? 1 : runLength(fields, i);
            if (run >= leastRun) {
                const std::uint32_t firstBit = fields[i].ranges[0].firstBit;
                printOctets(fields[i], {firstBit, packet_.subspan((firstBit - 1) / bitsPerOctet, run)});
                i += run;
            } else {
                printField(fields[i]);
                ++i;
            }
        }
        printGap(fields.size());
    }

private:
    void indent(std::size_t extra = 0) { out_.blanks(2 * (path_.size() + 1 + extra)); }

    [[nodiscard]] std::vector<std::size_t> pathOf(const FieldReport &field) const {
        std::vector<std::size_t> path;
        for (std::size_t block = field.block; block != Block::none; block = report_.blocks[block].parent) {
            if (!report_.blocks[block].name.empty()) {
                path.push_back(block);
            }
        }
        std::reverse(path.begin(), path.end());
        return path;
    }

    void openBlocks(const FieldReport &field) {
        const auto path = pathOf(field);
        const auto common = static_cast<std::size_t>(
            std::mismatch(path.begin(), path.end(), path_.begin(), path_.end()).first - path.begin());
        path_.resize(common);
        for (std::size_t i = common; i < path.size(); ++i) {
            indent();
            out_.styled(Style::bold, withoutLeadingBlanks(report_.blocks[path[i]].name));
            out_ << '\n';
            path_.push_back(path[i]);
        }
    }

    // A heading wherever another record of the host's list of layers begins.
    void openLayer(const FieldReport &field) {
        if (field.ranges.empty()) {
            return;
        }
        const std::uint32_t bit = field.ranges.front().firstBit;
        const auto found = std::find_if(report_.layers.begin(), report_.layers.end(), [&](const LayerRecord &layer) {
            return layer.layerNumber == field.layerNumber() && layer.firstBit <= bit && bit <= layer.lastBit;
        });
        if (found == report_.layers.end() || &*found == layer_) {
            return;
        }
        layer_ = &*found;
        indent();
        out_.styled(Style::dim, layerText(*layer_));
        out_ << '\n';
    }

    [[nodiscard]] std::string layerText(const LayerRecord &layer) const {
        std::string text =
            "[layer " + std::to_string(layer.layerNumber) + ", " + octetsText(layer.firstBit, layer.lastBit);
        const auto handOff = std::find_if(report_.handOffs.begin(), report_.handOffs.end(),
                                          [&](const HandOff &handed) { return handed.cursor == layer.firstBit; });
        if (handOff != report_.handOffs.end()) {
            text += ", handed on under key " + std::to_string(handOff->key);
            if (handOff->protocol != 0) {
                text += " of protocol " + std::to_string(handOff->protocol);
            }
        }
        return text + "]";
    }

    // An address is read a second time for its key, without a text.
    [[nodiscard]] bool isReadAgain(std::size_t i) const {
        if (options_.all || i == 0 || !report_.fields[i].text.empty()) {
            return false;
        }
        const FieldReport &before = report_.fields[i - 1];
        const auto address = ipv6Address(report_.fields[i], packet_);
        return address && report_.fields[i].name == before.name && address == ipv6Address(before, packet_);
    }

    void printGap(std::size_t nextField) {
        for (; gap_ < gaps_.size() && gaps_[gap_].nextField <= nextField; ++gap_) {
            indent();
            out_.styled(Style::dim, "[in no field: " + octetsText(gaps_[gap_].firstBit, gaps_[gap_].lastBit) + "]");
            out_ << '\n';
        }
    }

    void printBits(const std::string &bits) {
        if (options_.bits && !bits.empty()) {
            out_.styled(Style::dim, "  [" + bits + "]");
        }
    }

    void printField(const FieldReport &field) {
        const std::string_view text = withoutLeadingBlanks(field.text);
        const auto address = ipv6Address(field, packet_);
        if (const OctetRun run = unshownOctets(field, packet_); !address && !run.octets.empty()) {
            return printOctets(field, run);
        }
        indent();
        out_.untrusted(text.empty() ? nameOf(field) : text);
        if (address) {
            out_.styled(Style::good, "  (" + ipv6Text(*address) + ")");
        } else if (const auto number = unshownNumber(field)) {
            out_.styled(Style::dim, "  (" + std::to_string(*number) + ")");
        }
        printBits(bitsText(field.ranges));
        out_ << '\n';
    }

    // Octets as they stand in the packet.
    void printOctets(const FieldReport &field, const OctetRun &run) {
        const auto size = run.octets.size();
        indent();
        out_ << nameOf(field) << ": " << countText(size, "octet");
        printBits(bitsText({{0, run.firstBit, run.firstBit + static_cast<std::uint32_t>(size) * bitsPerOctet - 1}}));
        out_ << '\n';
        const std::size_t shown = options_.all ? size : std::min(size, mostDataLines * octetsPerLine);
        for (std::size_t line = 0; line < shown; line += octetsPerLine) {
            indent(1);
            for (std::size_t i = line; i < std::min(shown, line + octetsPerLine); ++i) {
                std::array<char, 4> text{};
                std::snprintf(text.data(), text.size(), i == line ? "%02x" : " %02x", run.octets[i]);
                out_ << std::string_view(text.data());
            }
            out_ << '\n';
        }
        if (shown < size) {
            indent(1);
            out_.styled(Style::dim, "and " + countText(size - shown, "octet") + " more (--all shows them)");
            out_ << '\n';
        }
    }

    Output &out_;
    const Options &options_;
    const Report &report_;
    std::span<const std::uint8_t> packet_;
    std::vector<Gap> gaps_;
    std::size_t gap_ = 0;           // the next one
    std::vector<std::size_t> path_; // open blocks that have a name
    const LayerRecord *layer_ = nullptr;
};

class DetailPrinter final : public Printer {
public:
    using Printer::Printer;

    void print(const CapturedPacket &packet, const NetworkPart &network, const std::string &time) override {
        out().styled(Style::bold, "Packet " + std::to_string(packet.number));
        if (!time.empty()) {
            out() << "  " << time;
        }
        out() << "  " << countText(packet.wireOctets, "octet") << ", " << linkTypeName(packet.linkType);
        if (network.isIp() && network.offset != 0) {
            out() << ", IP header at octet " << network.offset;
        }
        out() << '\n';
        if (network.isIp()) {
            printReport(network.octets);
        } else {
            note(Style::dim, "no IP: " + network.other.text());
        }
        if (packet.isCut()) {
            note(Style::warning, cutText(packet));
        }
        out() << '\n';
    }

    void finish(const Tally &tally) override {
        if (!tally.others.empty()) {
            printTally(tally);
        }
    }

private:
    void note(Style style, const std::string &text) {
        out() << "  ";
        out().styled(style, text);
        out() << '\n';
    }

    void printReport(std::span<const std::uint8_t> octets) {
        const Report report = host().run(Pass::md, octets);
        Tree(out(), options(), report, octets).print();
        if (report.bitsLeft != 0 && report.ending == Ending::complete) {
            const std::uint32_t total = static_cast<std::uint32_t>(octets.size()) * bitsPerOctet;
            note(Style::dim, "not decoded: " + octetsText(total - report.bitsLeft + 1, total));
        }
        if (report.ending == Ending::cutOff) {
            std::string text = "the pass was cut off";
            for (const std::string &name : flagNames(report.flags)) {
                text += ", " + name;
            }
            note(Style::bad, text);
        }
    }
};

} // namespace

std::unique_ptr<Printer> makeDetailPrinter(const Options &options, Output &out, Host &host) {
    return std::make_unique<DetailPrinter>(options, out, host);
}

} // namespace netfloor::cli
