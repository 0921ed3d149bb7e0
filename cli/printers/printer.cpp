// SPDX-License-Identifier: MIT
#include "printers/printer.h"

#include <algorithm>
#include <utility>
#include <vector>

namespace netfloor::cli {

void Tally::add(const NetworkPart &network) {
    ++packets;
    if (network.isIp()) {
        ++withIp;
    } else {
        ++others[network.other];
    }
}

std::string Tally::text() const {
    std::string text = countText(packets, "packet") + ": " + std::to_string(withIp) + " with IP";
    if (others.empty()) {
        return text;
    }
    std::vector<std::pair<std::string, std::uint64_t>> byCount;
    for (const auto &[what, count] : others) {
        byCount.emplace_back(what.text(), count);
    }
    std::sort(byCount.begin(), byCount.end(), [](const auto &left, const auto &right) {
        return left.second != right.second ? left.second > right.second : left.first < right.first;
    });
    text += ", " + std::to_string(packets - withIp) + " without (";
    for (const auto &[name, count] : byCount) {
        text += (text.back() == '(' ? "" : ", ") + std::to_string(count) + " " + name;
    }
    return text + ")";
}

void Printer::printHead(const CapturedPacket &packet, const std::string &time) {
    timeWidth_ = std::max(timeWidth_, time.size()); // a long time must not shift the lines behind it back
    out_.rightAligned(std::to_string(packet.number), 5);
    out_ << "  ";
    out_.rightAligned(time, timeWidth_);
    out_ << "  ";
    out_.rightAligned(std::to_string(packet.wireOctets), 5);
    out_ << "  ";
}

void Printer::printOther(const NetworkPart &network) const {
    out_.styled(Style::dim, "no IP: " + network.other.text());
}

void Printer::printTally(const Tally &tally) const {
    out_ << tally.text() << '\n';
}

std::string cutText(const CapturedPacket &packet) {
    if (!packet.isCut()) {
        return {};
    }
    return "cut by the snap length: " + std::to_string(packet.octets.size()) + " of " +
           std::to_string(packet.wireOctets) + " octets";
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
