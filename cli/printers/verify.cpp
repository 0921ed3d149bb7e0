// SPDX-License-Identifier: MIT
// Two verdicts on each packet, out of the MV pass and of the checks, and totals.
#include <algorithm>
#include <array>
#include <span>
#include <string>
#include <string_view>

#include "findings.h"
#include "netfloor-host/checks.h"
#include "netfloor-host/inner_packets.h"
#include "printers/printer.h"

namespace netfloor::cli {

namespace {

// A verdict on a packet. That of the plug-in is one of all, that of the checks is good or damaged.
enum class PacketVerdict : std::uint8_t {
    good,
    byDesign, // flags that say nothing against the packet
    unread,   // octets that no field covers
    misread,  // the plug-in reads on from a wrong place, and its flags say nothing
    cut,      // damage in a packet that the capture has cut: it says nothing about the packet on the wire
    damaged,
};

struct VerdictWords {
    std::string_view verdict;
    std::string_view total;
    Style style;
};

constexpr std::array<VerdictWords, 6> words = {{
    {"good", "good", Style::good},
    {"good", "good with flags by design", Style::good},
    {"unread", "with octets unread", Style::warning},
    {"misread", "misread", Style::warning},
    {"cut", "with flags, but cut by the snap length", Style::warning},
    {"DAMAGED", "damaged", Style::bad},
}};

constexpr const VerdictWords &wordsOf(PacketVerdict verdict) {
    return words[static_cast<std::size_t>(verdict)];
}

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
        : Printer(options, out, host), explainer_(host.fieldTables()) {}

    void print(const PacketToPrint &packet) override {
        if (!packet.network.isIp()) {
            if (!options().bad) {
                printHead(packet);
                printOther(packet);
                endLine(packet.captured);
            }
            return;
        }
        judge(packet);
        const bool isDamaged = plugin_ == PacketVerdict::damaged || checked_ == PacketVerdict::damaged;
        counts_.damaged += isDamaged ? 1 : 0;
        if (isDamaged || !options().bad) {
            printHead(packet);
            printVerdicts();
            endLine(packet.captured);
        }
    }

    void finish(const Tally &tally) override {
        printTotals(tally, counts_);
        allCounts_.add(counts_);
        counts_ = {};
    }

    void finishAll(const Tally &tally) override { printTotals(tally, allCounts_); }

    void takeCounts(Printer &from) override {
        auto &other = dynamic_cast<VerifyPrinter &>(from);
        counts_.add(other.counts_);
        other.counts_ = {};
    }

    [[nodiscard]] ExitCode exitCode() const override {
        return counts_.damaged + allCounts_.damaged == 0 ? ExitCode::good : ExitCode::damagedPackets;
    }

private:
    using VerdictCounts = std::array<std::uint64_t, words.size()>;

    // Packets by their verdicts.
    struct Counts {
        VerdictCounts plugin = {};
        VerdictCounts checks = {};
        std::uint64_t damaged = 0;

        void add(const Counts &other) {
            for (std::size_t i = 0; i < words.size(); ++i) {
                plugin[i] += other.plugin[i];
                checks[i] += other.checks[i];
            }
            damaged += other.damaged;
        }
    };

    void printTotals(const Tally &tally, const Counts &counts) {
        printTally(tally);
        if (tally.withIp == 0) {
            return;
        }
        printCounts("plug-in: ", counts.plugin);
        printCounts("checks:  ", counts.checks);
    }

    void judge(const PacketToPrint &packet) {
        faults_ = checks_.check(packet.network.octets, packet.runOptions().wireOctets);
        explainer_.clear();
        plugin_ = PacketVerdict::good;
        isCutOff_ = false;
        InnerPackets at(packet.network.octets, packet.runOptions().wireOctets);
        for (; !at.ended(); at.next()) {
            plugin_ = std::max(plugin_, verdictOn(at, packet));
        }
        limit_ = at.limit();
        checked_ = has(FaultKind::damage) ? PacketVerdict::damaged : PacketVerdict::good;
        ++counts_.plugin[static_cast<std::size_t>(plugin_)];
        ++counts_.checks[static_cast<std::size_t>(checked_)];
    }

    // On the packet or on one inside it.
    [[nodiscard]] PacketVerdict verdictOn(const InnerPackets &at, const PacketToPrint &packet) {
        RunOptions options = packet.runOptions();
        options.wireOctets = at.wireOctets();
        host().run(Pass::mv, at.octets(), outcome_, options);
        if (!at.isInner()) {
            bitsLeft_ = outcome_.bitsLeft;
        }
        if (outcome_.ending == Ending::cutOff) {
            isCutOff_ = true;
            return PacketVerdict::damaged;
        }
        if (!outcome_.verdict.fault()) {
            return PacketVerdict::good;
        }
        // Flags that come from a wrong place need no explanation, which takes a pass of its own.
        const bool isMisread = has(FaultKind::misread);
        if (isMisread && !this->options().all) {
            return PacketVerdict::misread;
        }
        const auto findings = explainer_.explain(outcome_.verdict.flags, host(), at.octets(), options, at.firstOctet());
        return isMisread ? PacketVerdict::misread : worstOf(findings, packet.captured.isCut());
    }

    [[nodiscard]] bool has(FaultKind kind) const {
        return std::ranges::find(faults_, kind, &Fault::kind) != faults_.end();
    }

    void printVerdicts() {
        const Output::Mark start = out().mark();
        isFirstNote_ = true;
        for (const PacketVerdict verdict : {plugin_, checked_}) {
            const VerdictWords &shown = wordsOf(verdict);
            out().styled(shown.style, shown.verdict);
            out().blanks(words.back().verdict.size() + 2 - shown.verdict.size());
        }
        for (const Fault &fault : faults_) {
            printFault(fault);
        }
        if (isCutOff_) {
            startNote();
            out() << "the pass was cut off";
        }
        for (const Finding &finding : explainer_.findings()) {
            if (finding.kind == FindingKind::byDesign && !options().all) {
                continue;
            }
            startNote();
            out() << "plug-in: 0x" << Hex{finding.flag} << ' ';
            explainer_.write(out(), finding);
            if (finding.kind == FindingKind::byDesign) {
                out().styled(Style::dim, " (by design)");
            }
        }
        if (!limit_.empty()) {
            startNote();
            out() << limit_;
        }
        if (bitsLeft_ != 0) {
            startNote();
            (out().start(Style::dim) << "plug-in: ").count(bitsLeft_ / 8, "octet") << " not decoded";
            out().stop(Style::dim);
        }
        // The column of the second verdict is the last one where there is no note.
        while (out().since(start).ends_with(' ')) {
            out().takeBack(out().mark() - 1);
        }
    }

    void startNote() {
        out() << (isFirstNote_ ? "" : "; ");
        isFirstNote_ = false;
    }

    void printFault(const Fault &fault) {
        const Style style = fault.kind == FaultKind::damage ? Style::bad : Style::dim;
        text_.clear();
        appendFaultText(text_, fault);
        startNote();
        (out().start(style) << text_).stop(style);
    }

    void printCounts(std::string_view column, const VerdictCounts &counts) {
        out() << column;
        bool first = true;
        for (std::size_t i = 0; i < words.size(); ++i) {
            if (counts[i] != 0) {
                out() << (first ? "" : ", ");
                (out().start(words[i].style) << counts[i] << ' ' << words[i].total).stop(words[i].style);
                first = false;
            }
        }
        out() << '\n';
    }

    [[nodiscard]] static PacketVerdict worstOf(std::span<const Finding> findings, bool isCut) {
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
    PacketChecks checks_;
    Counts counts_;    // of the capture
    Counts allCounts_; // of the captures before

    // Of the packet.
    std::string text_;
    Outcome outcome_;
    std::span<const Fault> faults_;
    PacketVerdict plugin_ = PacketVerdict::good;
    PacketVerdict checked_ = PacketVerdict::good;
    std::string_view limit_; // why packets inside it stay closed
    std::uint32_t bitsLeft_ = 0;
    bool isCutOff_ = false;
    bool isFirstNote_ = true;
};

} // namespace

std::unique_ptr<Printer> makeVerifyPrinter(const Options &options, Output &out, Host &host) {
    return std::make_unique<VerifyPrinter>(options, out, host);
}

} // namespace netfloor::cli
