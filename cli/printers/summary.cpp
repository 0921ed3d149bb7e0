// SPDX-License-Identifier: MIT
// One line a packet, out of the short texts of the TO pass.
#include <array>
#include <string_view>

#include "printers/field_names.h"
#include "printers/printer.h"

namespace netfloor::cli {

namespace {

constexpr auto isDigitOrStar = [] {
    std::array<bool, 256> is = {};
    for (const char character : std::string_view("0123456789abcdef*")) {
        is[static_cast<unsigned char>(character)] = true;
    }
    return is;
}();

// A text that says nothing without the name of its field: "64", "5f01", "0x1b3", "99(dec)", "28 octets", "5*4 octets".
bool isBareNumber(std::string_view text) {
    if (text.starts_with("0x")) {
        text.remove_prefix(2);
    }
    std::size_t end = 0;
    while (end < text.size() && isDigitOrStar[static_cast<unsigned char>(text[end])]) {
        ++end;
    }
    if (end == text.size()) {
        return end != 0;
    }
    return end != 0 && (text.substr(end).starts_with("(dec)") || text.substr(end).starts_with(" octet"));
}

// Writes texts as they come. Texts of one id are a run: a field that was looked at ahead is reported twice, an address
// also without a text, and data come octet by octet.
class TextLine final : public Sink {
public:
    TextLine(const Options &options, Output &out, const PluginLibrary &library)
        : showsAll_(options.all), out_(out), names_(library) {}

    void begin(Pass /*pass*/, std::span<const std::uint8_t> /*packet*/) override {
        isFirst_ = true;
        count_ = 0;
    }

    void text(const ShortTextView &text) override {
        if (count_ == 0 || text.displayId != runId_) {
            endRun();
            beginRun(text);
            return;
        }
        ++count_;
        if (!isRunShown_) {
            return;
        }
        if (showsAll_) {
            out_ << ' ';
            out_.untrusted(text.text.view());
            out_.mayFlush();
        } else if (count_ <= mostShown) {
            addOther(text.text.view());
        }
    }

    void notCaptured(const NotCaptured &first) override {
        endRun();
        isRunShown_ = false;
        out_.styled(Style::dim, " | ");
        (out_.start(Style::warning) << first.name << " not captured").stop(Style::warning);
    }

    void end(const PassEnd &end) override {
        endRun();
        if (end.ending == Ending::cutOff) {
            out_.styled(Style::bad, "  [the pass was cut off]");
        }
    }

private:
    static constexpr std::uint64_t mostShown = 4;

    void beginRun(const ShortTextView &text) {
        runId_ = text.displayId;
        count_ = 1;
        const DisplayName &field = names_.find(runId_);
        isRunShown_ = showsAll_ || field.isKey;
        if (isRunShown_) {
            writeFirst(field, text.text.view());
        }
    }

    void writeFirst(const DisplayName &field, std::string_view text) {
        isRunShown_ = showsAll_ || !text.empty();
        if (!isRunShown_) {
            return;
        }
        out_.mayFlush();
        if (!isFirst_) {
            out_.styled(Style::dim, " | ");
        }
        isFirst_ = false;
        if (isBareNumber(text)) {
            out_ << field.name << '=';
        }
        lastText_ = out_.mark();
        out_.untrusted(text);
        lastSize_ = out_.mark() - lastText_;
    }

    // Another text of the run, unless it repeats the one before.
    void addOther(std::string_view text) {
        if (text.empty()) {
            return;
        }
        const Output::Mark before = out_.mark();
        out_ << ' ';
        const Output::Mark start = out_.mark();
        out_.untrusted(text);
        if (out_.since(start) == out_.since(lastText_).substr(0, lastSize_)) {
            out_.takeBack(before);
            return;
        }
        lastText_ = start;
        lastSize_ = out_.mark() - start;
    }

    void endRun() {
        if (count_ > mostShown && isRunShown_ && !showsAll_) {
            (out_.start(Style::dim) << " ... (" << count_ << ')').stop(Style::dim);
        }
    }

    bool showsAll_;
    Output &out_;
    FieldNames names_;
    bool isFirst_ = true;

    std::uint32_t runId_ = 0;
    std::uint64_t count_ = 0; // of the texts of the run; 0 in front of the first run
    bool isRunShown_ = false;
    Output::Mark lastText_ = 0; // that was written
    std::size_t lastSize_ = 0;
};

class SummaryPrinter final : public Printer {
public:
    SummaryPrinter(const Options &options, Output &out, Host &host)
        : Printer(options, out, host), line_(options, out, host.library()) {}

    void print(const PacketToPrint &packet) override {
        printHead(packet);
        if (packet.network.isIp()) {
            run(Pass::to, packet, line_);
        } else {
            printOther(packet);
        }
        endLine(packet.captured);
    }

    void finish(const Tally &tally) override {
        // One line a packet; what is no IP packet is counted after them.
        if (tally.hasOthers()) {
            printTally(tally);
        }
    }

private:
    TextLine line_;
};

} // namespace

std::unique_ptr<Printer> makeSummaryPrinter(const Options &options, Output &out, Host &host) {
    return std::make_unique<SummaryPrinter>(options, out, host);
}

} // namespace netfloor::cli
