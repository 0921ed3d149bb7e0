// SPDX-License-Identifier: MIT
#include "printers/printer.h"

#include <algorithm>
#include <utility>
#include <vector>

namespace netfloor::cli {

std::string_view Tally::add(const NetworkPart &network) {
    ++packets;
    if (network.isIp()) {
        ++withIp;
        return {};
    }
    constexpr std::size_t mostKinds = 4096;
    auto found = others_.find(network.other);
    if (found == others_.end() && others_.size() == mostKinds) {
        rest_.text = network.other.text();
        ++rest_.packets;
        return rest_.text;
    }
    if (found == others_.end()) {
        found = others_.emplace(network.other, Other{network.other.text(), 0}).first;
    }
    ++found->second.packets;
    return found->second.text;
}

std::string Tally::text() const {
    std::string text = countText(packets, "packet") + ": " + std::to_string(withIp) + " with IP";
    if (!hasOthers()) {
        return text;
    }
    std::vector<std::pair<std::string_view, std::uint64_t>> byCount;
    for (const auto &[kind, other] : others_) {
        byCount.emplace_back(other.text, other.packets);
    }
    std::sort(byCount.begin(), byCount.end(), [](const auto &left, const auto &right) {
        return left.second != right.second ? left.second > right.second : left.first < right.first;
    });
    if (rest_.packets != 0) {
        byCount.emplace_back("of other kinds", rest_.packets);
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
    case Command::fields: break; // prints no packets
    }
    return nullptr;
}

} // namespace netfloor::cli
