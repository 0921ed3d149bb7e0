// SPDX-License-Identifier: MIT
// A verdict on each packet, out of the MV pass, and a total.
#include <algorithm>
#include <array>
#include <span>
#include <string_view>

#include "findings.h"
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

// How the MV pass ended.
class Outcome final : public Sink {
public:
    void end(const PassEnd &end) override {
        ending = end.ending;
        verdict = end.verdict;
        bitsLeft = end.bitsLeft;
    }

    Ending ending = Ending::complete;
    Verdict verdict;
    std::uint32_t bitsLeft = 0;
};

class VerifyPrinter final : public Printer {
public:
    VerifyPrinter(const Options &options, Output &out, Host &host)
        : Printer(options, out, host), explainer_(FieldTables(host.library())) {}

    void print(const PacketToPrint &packet) override {
        printHead(packet);
        if (packet.network.isIp()) {
            printVerdict(packet);
        } else {
            printOther(packet);
        }
        endLine(packet.captured);
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
                (out().start(words[i].style) << counts_[i] << ' ' << words[i].total).stop(words[i].style);
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
    void printVerdict(const PacketToPrint &packet) {
        run(Pass::mv, packet, outcome_);
        std::span<const Finding> findings;
        if (outcome_.verdict.fault()) {
            findings = explainer_.explain(outcome_.verdict.flags, host(), packet.network.octets, packet.runOptions());
        }
        const auto verdict = static_cast<std::size_t>(verdictOf(outcome_, findings, packet.captured.isCut()));
        ++counts_[verdict];

        const VerdictWords &shown = words[verdict];
        out().styled(shown.style, shown.verdict);
        if (!findings.empty()) {
            out().blanks(words.back().verdict.size() - shown.verdict.size());
        }
        if (outcome_.ending == Ending::cutOff) {
            out() << "  the pass was cut off";
        }
        for (const Finding &finding : findings) {
            out() << "  0x" << Hex{finding.flag} << ' ';
            explainer_.write(out(), finding);
            if (finding.kind == FindingKind::byDesign) {
                out().styled(Style::dim, " (by design)");
            }
        }
        if (outcome_.bitsLeft != 0) {
            (out().start(Style::dim) << "  ").count(outcome_.bitsLeft / 8, "octet") << " not decoded";
            out().stop(Style::dim);
        }
    }

    [[nodiscard]] static PacketVerdict verdictOf(const Outcome &outcome, std::span<const Finding> findings,
                                                 bool isCut) {
        if (outcome.ending == Ending::cutOff) {
            return PacketVerdict::damaged;
        }
        if (!outcome.verdict.fault()) {
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

    FlagExplainer explainer_;
    Outcome outcome_;
    std::array<std::uint64_t, words.size()> counts_ = {};
};

} // namespace

std::unique_ptr<Printer> makeVerifyPrinter(const Options &options, Output &out, Host &host) {
    return std::make_unique<VerifyPrinter>(options, out, host);
}

} // namespace netfloor::cli
