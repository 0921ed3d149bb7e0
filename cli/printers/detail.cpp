// SPDX-License-Identifier: MIT
// Every field of a packet as a tree, out of the MD pass.
#include <optional>
#include <string>
#include <string_view>

#include "netfloor-host/checks.h"
#include "netfloor-host/inner_packets.h"
#include "netfloor-host/plain_tcp.h"
#include "printers/printer.h"
#include "printers/tree.h"

namespace netfloor::cli {

namespace {

class DetailPrinter final : public Printer {
public:
    DetailPrinter(const Options &options, Output &out, Host &host) : Printer(options, out, host), tree_(options, out) {}

    void print(const PacketToPrint &packet) override {
        printHeading(packet);
        if (packet.network.isIp()) {
            printFields(packet);
        } else {
            out() << "  ";
            printOther(packet);
            out() << '\n';
        }
        if (packet.captured.isCut()) {
            out().start(Style::warning) << "  ";
            printCut(packet.captured);
            out().stop(Style::warning) << '\n';
        }
        out() << '\n';
    }

    void finish(const Tally &tally) override {
        if (tally.hasOthers()) {
            printTally(tally);
        }
    }

    void finishAll(const Tally &tally) override { printTally(tally); }

private:
    // Of the packet, and of those inside it.
    void printFields(const PacketToPrint &packet) {
        RunOptions options = packet.runOptions();
        printMisread(packet);
        InnerPackets at(packet.network.octets, options.wireOctets);
        while (!at.ended()) {
            const auto octets = at.octets();
            const std::uint32_t first = at.firstOctet();
            options.wireOctets = at.wireOctets();
            if (at.isInner()) {
                printInside(at.opened(), first);
            }
            at.next();
            tree_.place(first, at.ended() ? std::nullopt : std::optional(at.firstOctet() - first));
            host().run(Pass::md, octets, tree_, options);
        }
        if (!at.limit().empty()) {
            (out().start(Style::warning) << "  [" << at.limit() << ']').stop(Style::warning) << '\n';
        }
    }

    // Which fields are not to be believed.
    void printMisread(const PacketToPrint &packet) {
        if (isPlainTcp(packet.network.octets)) { // they are
            return;
        }
        for (const Fault &fault : checks_.check(packet.network.octets, packet.runOptions().wireOctets)) {
            if (fault.kind == FaultKind::misread) {
                text_.clear();
                appendFaultText(text_, fault);
                (out().start(Style::warning) << "  [misread: " << text_ << ']').stop(Style::warning) << '\n';
            }
        }
    }

    void printInside(const InnerPacket &opened, std::uint32_t firstOctet) {
        out().start(Style::bold) << "  Inside " << tunnelName(opened.tunnel);
        if (opened.id) {
            out() << " 0x" << Hex{*opened.id};
        }
        out().stop(Style::bold) << ", from octet " << firstOctet << " on\n";
    }

    void printHeading(const PacketToPrint &packet) {
        const CapturedPacket &captured = packet.captured;
        (out().start(Style::bold) << "Packet " << captured.number).stop(Style::bold);
        if (!packet.time.empty()) {
            out() << "  " << packet.time;
        }
        if (captured.linkType != linkType_) {
            linkType_ = captured.linkType;
            linkName_ = linkTypeName(linkType_);
        }
        (out() << "  ").count(captured.wireOctets, "octet") << ", " << linkName_;
        if (packet.network.isIp() && packet.network.offset != 0) {
            out() << ", IP header at octet " << std::uint64_t{packet.network.offset};
        }
        if (!captured.interfaceName.empty()) {
            out() << ", interface ";
            out().untrusted(captured.interfaceName);
        }
        out() << '\n';
        for (const std::string_view comment : captured.comments) {
            out().start(Style::bold) << "  Comment: ";
            out().untrusted(comment);
            out().stop(Style::bold) << '\n';
        }
    }

    Tree tree_;
    PacketChecks checks_;
    std::string text_;
    int linkType_ = -1;
    std::string linkName_; // of that type
};

} // namespace

std::unique_ptr<Printer> makeDetailPrinter(const Options &options, Output &out, Host &host) {
    return std::make_unique<DetailPrinter>(options, out, host);
}

} // namespace netfloor::cli
