// SPDX-License-Identifier: MIT
// One line a packet, out of the short texts of the TO pass.
#include <set>
#include <string_view>
#include <unordered_map>

#include "printers/printer.h"

namespace netfloor::cli {

namespace {

// Which display ids belong to key fields, the fields by which a plug-in itself says what matters of a packet.
// A short text bears no name, so the name behind an id is learned from the MD pass over the same packet,
// which reports the same fields in the same order.
class KeyDisplays {
public:
    explicit KeyDisplays(Host &host) : host_(host) {}

    // Makes isKey() good for all that `report` shows.
    void learn(const Report &report, std::span<const std::uint8_t> packet) {
        bool known = true;
        for (const DisplayReport &display : report.displays) {
            known = known && isKey_.contains(display.displayId);
        }
        if (known) {
            return;
        }
        if (names_.empty()) {
            const auto names = keyFieldNames(host_);
            names_.insert(names.begin(), names.end());
        }
        const Report named = host_.run(Pass::md, packet);
        for (std::size_t i = 0; i < report.displays.size() && i < named.fields.size(); ++i) {
            isKey_.try_emplace(report.displays[i].displayId, names_.contains(named.fields[i].name));
        }
        isKey_[0] = true; // what an owner of a next layer says
    }

    [[nodiscard]] bool isKey(std::uint32_t displayId) const {
        const auto found = isKey_.find(displayId);
        return found == isKey_.end() || found->second;
    }

private:
    Host &host_;
    std::set<std::string, std::less<>> names_;
    std::unordered_map<std::uint32_t, bool> isKey_;
};

class SummaryPrinter final : public Printer {
public:
    SummaryPrinter(const Options &options, Output &out, Host &host) : Printer(options, out, host), keys_(host) {}

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
        if (!options().all) {
            keys_.learn(report, octets);
        }
        bool first = true;
        const auto &displays = report.displays;
        for (std::size_t i = 0; i < displays.size();) {
            std::size_t end = i + 1;
            while (end < displays.size() && displays[end].displayId == displays[i].displayId) {
                ++end;
            }
            if (options().all || keys_.isKey(displays[i].displayId)) {
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

    // Data come octet by octet, each as a field of its own.
    void printRun(std::span<const DisplayReport> run) {
        constexpr std::size_t mostShown = 4;
        const bool all = options().all || run.size() <= mostShown;
        for (std::size_t i = 0; i < (all ? run.size() : mostShown); ++i) {
            if (i > 0) {
                out() << ' ';
            }
            out() << run[i].text;
        }
        if (!all) {
            out().styled(Style::dim, " ... (" + std::to_string(run.size()) + ")");
        }
    }

    KeyDisplays keys_;
};

} // namespace

std::unique_ptr<Printer> makeSummaryPrinter(const Options &options, Output &out, Host &host) {
    return std::make_unique<SummaryPrinter>(options, out, host);
}

} // namespace netfloor::cli
