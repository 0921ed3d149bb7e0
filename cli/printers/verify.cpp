// SPDX-License-Identifier: MIT
// A verdict on each packet, out of the MV pass, and a total.
#include <algorithm>
#include <array>
#include <cstdio>
#include <string_view>

#include "findings.h"
#include "netfloor-host/field_knowledge.h"
#include "printers/printer.h"

namespace netfloor::cli {

namespace {

// The verdict on a packet. The verdict of the pass tells the first from all others.
enum class PacketVerdict : std::uint8_t {
    good,
    byDesign, // flags that say nothing against the packet
    unread,   // octets that no field covers
    cut,      // damage in a packet that the capture has cut: it says nothing about the packet on the wire
    damaged,
};

struct VerdictWords {
    std::string_view verdict;
    std::string_view total;
    Style style;
};

constexpr std::array<VerdictWords, 5> words = {{
    {"good", "good", Style::good},
    {"good", "good with flags by design", Style::good},
    {"unread", "with octets unread", Style::warning},
    {"cut", "with flags, but cut by the snap length", Style::warning},
    {"DAMAGED", "damaged", Style::bad},
}};

class VerifyPrinter final : public Printer {
public:
    VerifyPrinter(const Options &options, Output &out, Host &host)
        : Printer(options, out, host), knowledge_(FieldTables(host.library()).fields()) {}

    void print(const CapturedPacket &packet, const NetworkPart &network, const std::string &time) override {
        printHead(packet, time);
        if (network.isIp()) {
            printVerdict(packet, network.octets);
        } else {
            printOther(network);
        }
        if (packet.isCut()) {
            out().styled(Style::warning, "  [" + cutText(packet) + "]");
        }
        out() << '\n';
    }

    void finish(const Tally &tally) override {
        printTally(tally);
        if (tally.withIp == 0) {
            return;
        }
        out() << "verdicts: ";
        bool first = true;
        for (std::size_t i = 0; i < words.size(); ++i) {
            if (counts_[i] != 0) {
                out() << (first ? "" : ", ");
                out().styled(words[i].style, std::to_string(counts_[i]) + " " + std::string(words[i].total));
                first = false;
            }
        }
        out() << '\n';
    }

    [[nodiscard]] ExitCode exitCode() const override {
        return counts_[static_cast<std::size_t>(PacketVerdict::damaged)] == 0 ? ExitCode::good
                                                                              : ExitCode::damagedPackets;
    }

private:
    void printVerdict(const CapturedPacket &packet, std::span<const std::uint8_t> octets) {
        const Report report = host().run(Pass::mv, octets);
        std::vector<Finding> findings;
        if (report.verdict.fault()) {
            findings = explainFlags(report.flags, host().run(Pass::md, octets), knowledge_);
        }
        const auto verdict = static_cast<std::size_t>(verdictOf(report, findings, packet.isCut()));
        ++counts_[verdict];

        const VerdictWords &shown = words[verdict];
        out().styled(shown.style, shown.verdict);
        if (!findings.empty()) {
            out().blanks(words.back().verdict.size() - shown.verdict.size());
        }
        if (report.ending == Ending::cutOff) {
            out() << "  the pass was cut off";
        }
        for (const Finding &finding : findings) {
            std::array<char, 16> flag{};
            std::snprintf(flag.data(), flag.size(), "  0x%x ", finding.flag);
            out() << flag.data() << finding.text;
            if (finding.kind == FindingKind::byDesign) {
                out().styled(Style::dim, " (by design)");
            }
        }
        if (report.bitsLeft != 0) {
            out().styled(Style::dim, "  " + countText(report.bitsLeft / 8, "octet") + " not decoded");
        }
    }

    [[nodiscard]] static PacketVerdict verdictOf(const Report &report, const std::vector<Finding> &findings,
                                                 bool isCut) {
        if (report.ending == Ending::cutOff) {
            return PacketVerdict::damaged;
        }
        if (!report.verdict.fault()) {
            return PacketVerdict::good;
        }
        FindingKind worst = FindingKind::byDesign;
        for (const Finding &finding : findings) {
            worst = std::max(worst, finding.kind);
        }
        switch (worst) {
        case FindingKind::byDesign: return PacketVerdict::byDesign;
        case FindingKind::unread: return PacketVerdict::unread;
        case FindingKind::damage: break;
        }
        return isCut ? PacketVerdict::cut : PacketVerdict::damaged;
    }

    FieldKnowledge knowledge_;
    std::array<std::uint64_t, words.size()> counts_ = {};
};

} // namespace

std::unique_ptr<Printer> makeVerifyPrinter(const Options &options, Output &out, Host &host) {
    return std::make_unique<VerifyPrinter>(options, out, host);
}

} // namespace netfloor::cli
