// SPDX-License-Identifier: MIT
// A verdict on each packet, out of the MV pass, and a total.
#include <algorithm>
#include <array>
#include <cstdio>
#include <string_view>

#include "marks.h"
#include "printers/printer.h"

namespace netfloor::cli {

namespace {

// What a packet is found to be. The verdict of the pass tells the first from all others.
enum class Finding : std::uint8_t {
    good,
    byDesign, // marks that say nothing against the packet
    unread,   // octets that no field covers
    cut,      // damage in a packet that the capture has cut: it says nothing about the packet on the wire
    damaged,
};

struct FindingWords {
    std::string_view verdict;
    std::string_view total;
    Style style;
};

constexpr std::array<FindingWords, 5> words = {{
    {"good", "good", Style::good},
    {"good", "good with marks by design", Style::good},
    {"unread", "with octets unread", Style::warning},
    {"cut", "with marks, but cut by the snap length", Style::warning},
    {"DAMAGED", "damaged", Style::bad},
}};

class VerifyPrinter final : public Printer {
public:
    using Printer::Printer;

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
            if (counts_[i] != 0 || i == 0) {
                out() << (first ? "" : ", ");
                out().styled(words[i].style, std::to_string(counts_[i]) + " " + std::string(words[i].total));
                first = false;
            }
        }
        out() << '\n';
    }

    [[nodiscard]] ExitCode exitCode() const override {
        return counts_[static_cast<std::size_t>(Finding::damaged)] == 0 ? ExitCode::good : ExitCode::damagedPackets;
    }

private:
    void printVerdict(const CapturedPacket &packet, std::span<const std::uint8_t> octets) {
        const Report report = host().run(Pass::mv, octets);
        std::vector<Mark> marks;
        if (report.verdict.fault()) {
            marks = explainFlags(report.flags, host().run(Pass::md, octets));
        }
        const Finding finding = findingOf(report, marks, packet.isCut());
        ++counts_[static_cast<std::size_t>(finding)];

        const FindingWords &found = words[static_cast<std::size_t>(finding)];
        out().styled(found.style, found.verdict);
        if (!marks.empty()) {
            out().blanks(words.back().verdict.size() - found.verdict.size());
        }
        if (report.ending == Ending::cutOff) {
            out() << "  the pass was cut off";
        }
        for (const Mark &mark : marks) {
            std::array<char, 16> flag{};
            std::snprintf(flag.data(), flag.size(), "  0x%x ", mark.flag);
            out() << flag.data() << mark.text;
            if (mark.kind == MarkKind::byDesign) {
                out().styled(Style::dim, " (by design)");
            }
        }
        if (report.bitsLeft != 0) {
            out().styled(Style::dim, "  " + countText(report.bitsLeft / 8, "octet") + " not decoded");
        }
    }

    [[nodiscard]] static Finding findingOf(const Report &report, const std::vector<Mark> &marks, bool isCut) {
        if (report.ending == Ending::cutOff) {
            return Finding::damaged;
        }
        if (!report.verdict.fault()) {
            return Finding::good;
        }
        MarkKind worst = MarkKind::byDesign;
        for (const Mark &mark : marks) {
            worst = std::max(worst, mark.kind);
        }
        switch (worst) {
        case MarkKind::byDesign: return Finding::byDesign;
        case MarkKind::unread: return Finding::unread;
        case MarkKind::damage: break;
        }
        return isCut ? Finding::cut : Finding::damaged;
    }

    std::array<std::uint64_t, words.size()> counts_ = {};
};

} // namespace

std::unique_ptr<Printer> makeVerifyPrinter(const Options &options, Output &out, Host &host) {
    return std::make_unique<VerifyPrinter>(options, out, host);
}

} // namespace netfloor::cli
