// SPDX-License-Identifier: MIT
// One line a packet, out of the short texts of the TO pass.
#include <algorithm>
#include <string_view>

#include "printers/field_names.h"
#include "printers/printer.h"

namespace netfloor::cli {

namespace {

// A text that says nothing without the name of its field: "64", "5f01", "0x1b3", "99(dec)", "28 octets", "5*4 octets".
bool isBareNumber(std::string_view text) {
    if (text.starts_with("0x")) {
        text.remove_prefix(2);
    }
    text = text.substr(0, text.find("(dec)"));
    text = text.substr(0, text.find(" octet"));
    return !text.empty() && text.find_first_not_of("0123456789abcdef*") == std::string_view::npos;
}

class SummaryPrinter final : public Printer {
public:
    SummaryPrinter(const Options &options, Output &out, Host &host)
        : Printer(options, out, host), names_(host.library()) {}

    void print(const CapturedPacket &packet, const NetworkPart &network, const std::string &time) override {
        printHead(packet, time);
        if (network.isIp()) {
            printTexts(network.octets);
        } else {
            printOther(network);
        }
        if (packet.isCut()) {
            out().styled(Style::warning, "  [" + cutText(packet) + "]");
        }
        out() << '\n';
    }

    void finish(const Tally &tally) override {
        // One line a packet; what is no IP packet is counted behind them.
        if (!tally.others.empty()) {
            printTally(tally);
        }
    }

private:
    void printTexts(std::span<const std::uint8_t> octets) {
        const Report report = host().run(Pass::to, octets);
        bool first = true;
        const auto &displays = report.displays;
        for (std::size_t i = 0; i < displays.size();) {
            std::size_t end = i + 1;
            while (end < displays.size() && displays[end].displayId == displays[i].displayId) {
                ++end;
            }
            const bool isShown = names_.find(displays[i].displayId).isKey && !displays[i].text.empty();
            if (options().all || isShown) {
                if (!first) {
                    out().styled(Style::dim, " | ");
                }
                first = false;
                printRun({displays.data() + i, end - i});
            }
            i = end;
        }
        if (report.ending == Ending::cutOff) {
            out().styled(Style::bad, "  [the pass was cut off]");
        }
    }

    // Texts of one id: a field that was looked at ahead is reported twice, an address also without a text, and data
    // come octet by octet.
    void printRun(std::span<const DisplayReport> run) {
        constexpr std::size_t mostShown = 4;
        if (isBareNumber(run.front().text)) {
            out() << names_.find(run.front().displayId).name << '=';
        }
        out().untrusted(run.front().text);
        const std::size_t shown = options().all || run.size() <= mostShown ? run.size() : mostShown;
        for (std::size_t i = 1; i < shown; ++i) {
            if (options().all || (!run[i].text.empty() && run[i].text != run[i - 1].text)) {
                out() << ' ';
                out().untrusted(run[i].text);
            }
        }
        if (shown < run.size()) {
            out().styled(Style::dim, " ... (" + std::to_string(run.size()) + ")");
        }
    }

    FieldNames names_;
};

} // namespace

std::unique_ptr<Printer> makeSummaryPrinter(const Options &options, Output &out, Host &host) {
    return std::make_unique<SummaryPrinter>(options, out, host);
}

} // namespace netfloor::cli
