// SPDX-License-Identifier: MIT
#include "printers/printer.h"

#include <algorithm>
#include <utility>
#include <vector>

namespace netfloor::cli {

void Tally::add(const NotIp &kind, std::uint64_t count) {
    packets += count;
    if (kind.kind() == NotIp::Kind::ip) {
        withIp += count;
        return;
    }
    constexpr std::size_t mostKinds = 4096;
    if (others_.size() == mostKinds && !others_.contains(kind)) {
        rest_ += count;
        return;
    }
    others_[kind] += count;
}

void Tally::add(const Tally &other) {
    add(NotIp(), other.withIp);
    for (const auto &[kind, count] : other.others_) {
        add(kind, count);
    }
    packets += other.rest_;
    rest_ += other.rest_;
}

std::string Tally::text() const {
    std::string text = countText(packets, "packet") + ": " + std::to_string(withIp) + " with IP";
    if (!hasOthers()) {
        return text;
    }
    std::vector<std::pair<std::string, std::uint64_t>> byCount;
    for (const auto &[kind, count] : others_) {
        byCount.emplace_back(kind.text(), count);
    }
    std::sort(byCount.begin(), byCount.end(), [](const auto &left, const auto &right) {
        return left.second != right.second ? left.second > right.second : left.first < right.first;
    });
    if (rest_ != 0) {
        byCount.emplace_back("of other kinds", rest_);
    }
    text += ", " + std::to_string(packets - withIp) + " without (";
    for (const auto &[name, count] : byCount) {
        text += (text.back() == '(' ? "" : ", ") + std::to_string(count) + " ";
        text += name;
    }
    return text + ")";
}

void Printer::printHead(const PacketToPrint &packet) {
    out_.rightAligned(packet.captured.number, 5);
    out_ << "  ";
    out_.rightAligned(packet.time, packet.timeWidth);
    out_ << "  ";
    out_.rightAligned(std::uint64_t{packet.captured.wireOctets}, 5);
    out_ << "  ";
}

void Printer::printOther(const PacketToPrint &packet) const {
    (out_.start(Style::dim) << "no IP: " << packet.other).stop(Style::dim);
}

void Printer::endLine(const CapturedPacket &packet) const {
    if (packet.isCut()) {
        out().start(Style::warning) << "  [";
        printCut(packet);
        (out() << ']').stop(Style::warning);
    }
    out() << '\n';
}

void Printer::printCut(const CapturedPacket &packet) const {
    if (packet.isCut()) {
        out_ << "cut by the snap length: " << std::uint64_t{packet.octets.size()} << " of " << packet.wireOctets
             << " octets";
    }
}

void Printer::printTally(const Tally &tally) const {
    out_ << tally.text() << '\n';
}

std::unique_ptr<Printer> makePrinter(const Options &options, Output &out, Host &host) {
    switch (options.command) {
    case Command::summary: return makeSummaryPrinter(options, out, host);
    case Command::detail: return makeDetailPrinter(options, out, host);
    case Command::verify: return makeVerifyPrinter(options, out, host);
    case Command::keys: return makeKeysPrinter(options, out, host);
    case Command::json: return makeJsonPrinter(options, out, host);
    case Command::exporting: return makeExportPrinter(options, out, host);
    case Command::html: return makeHtmlPrinter(options, out, host);
    case Command::plan:
    case Command::fields: break; // print no packets
    }
    return nullptr;
}

} // namespace netfloor::cli
