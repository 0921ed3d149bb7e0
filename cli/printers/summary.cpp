// SPDX-License-Identifier: MIT
// One line a packet: what matters of it, or with --all the short texts of the TO pass.
#include <algorithm>
#include <array>
#include <optional>
#include <string_view>

#include <sys/ioctl.h>
#include <unistd.h>

#include "printers/field_names.h"
#include "printers/printer.h"
#include "printers/summary_line.h"

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
    TextLine(Output &out, const FieldTables &tables) : out_(out), names_(tables) {}

    void begin(Pass /*pass*/, std::span<const std::uint8_t> /*packet*/) override {
        isFirst_ = true;
        isRun_ = false;
    }

    void text(const ShortTextView &text) override {
        if (isRun_ && text.displayId == runId_) {
            out_ << ' ';
            out_.untrusted(text.text.view());
            out_.mayFlush();
            return;
        }
        isRun_ = true;
        runId_ = text.displayId;
        writeFirst(names_.find(runId_), text.text.view());
    }

    void notCaptured(const NotCaptured &first) override {
        isRun_ = false;
        out_.styled(Style::dim, " | ");
        (out_.start(Style::warning) << first.name << " not captured").stop(Style::warning);
    }

    void end(const PassEnd &end) override {
        if (end.ending == Ending::cutOff) {
            out_.styled(Style::bad, "  [the pass was cut off]");
        }
    }

private:
    void writeFirst(const DisplayName &field, std::string_view text) {
        out_.mayFlush();
        if (!isFirst_) {
            out_.styled(Style::dim, " | ");
        }
        isFirst_ = false;
        if (isBareNumber(text)) {
            out_ << field.name << '=';
        }
        out_.untrusted(text);
    }

    Output &out_;
    FieldNames names_;
    bool isFirst_ = true;
    bool isRun_ = false;
    std::uint32_t runId_ = 0;
};

// The columns of the terminal, or what a wide one has.
std::size_t lineWidth() {
    constexpr std::size_t usual = 160;
    constexpr std::size_t least = 60;
    winsize size = {};
    if (::isatty(STDOUT_FILENO) != 1 || ::ioctl(STDOUT_FILENO, TIOCGWINSZ, &size) != 0 || size.ws_col == 0) {
        return usual;
    }
    return std::max<std::size_t>(size.ws_col, least);
}

class SummaryPrinter final : public Printer {
public:
    SummaryPrinter(const Options &options, Output &out, Host &host) : Printer(options, out, host), width_(lineWidth()) {
        if (options.all) {
            texts_.emplace(out, host.fieldTables());
        } else {
            line_.emplace(out, host);
        }
    }

    void print(const PacketToPrint &packet) override {
        const Output::Mark start = out().mark();
        printHead(packet);
        if (!packet.network.isIp()) {
            printOther(packet);
        } else if (texts_) {
            run(Pass::to, packet, *texts_);
        } else {
            line_->write(packet.network.octets, packet.runOptions());
            cutLine(start, packet.captured.isCut());
        }
        endLine(packet.captured);
    }

    void finish(const Tally &tally) override {
        // One line a packet; what is no IP packet is counted after them.
        if (tally.hasOthers()) {
            printTally(tally);
        }
    }

    void finishAll(const Tally &tally) override { printTally(tally); }

private:
    // With room for the note of the snap length.
    void cutLine(Output::Mark start, bool hasNote) {
        constexpr std::size_t noteWidth = 52;
        constexpr std::string_view mark = "...";
        const std::size_t width = width_ - (hasNote ? std::min(noteWidth, width_ / 2) : 0);
        if (const std::size_t size = out().mark() - start; size > width) {
            line_->shorten(size - width);
        }
        while (out().since(start).ends_with(' ')) {
            out().takeBack(out().mark() - 1);
        }
        if (out().mark() - start > width) {
            out().takeBack(start + width - mark.size());
            out() << mark;
        }
    }

    std::size_t width_;
    std::optional<SummaryLine> line_;
    std::optional<TextLine> texts_; // --all
};

} // namespace

std::unique_ptr<Printer> makeSummaryPrinter(const Options &options, Output &out, Host &host) {
    return std::make_unique<SummaryPrinter>(options, out, host);
}

} // namespace netfloor::cli
