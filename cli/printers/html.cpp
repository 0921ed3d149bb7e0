// SPDX-License-Identifier: MIT
// A page for a browser: the list of packets, the tree of fields and the octets of each, in one file.
#include <algorithm>
#include <string>
#include <string_view>
#include <vector>

#include "netfloor-capture/time_text.h"
#include "netfloor-host/checks.h"
#include "netfloor-host/inner_packets.h"
#include "page/page.h"
#include "printers/page_data.h"
#include "printers/page_tree.h"
#include "printers/printer.h"
#include "printers/summary_line.h"

namespace netfloor::cli {

namespace {

std::string_view withoutBlanks(std::string_view text) {
    text = withoutLeadingBlanks(text);
    while (text.ends_with(' ')) {
        text.remove_suffix(1);
    }
    return text;
}

// The heading and the column of captures have little room.
std::string_view baseName(std::string_view file) {
    return file == "-" ? "standard input" : file.substr(file.rfind('/') + 1);
}

std::string_view labelOf(FaultKind kind) {
    switch (kind) {
    case FaultKind::note: return "note";
    case FaultKind::misread: return "misread";
    case FaultKind::damage: break;
    }
    return "DAMAGED";
}

class HtmlPrinter final : public Printer {
public:
    HtmlPrinter(const Options &options, Output &out, Host &host)
        : Printer(options, out, host),
          items_(out),
          tree_(out, items_),
          line_(lineText_, host),
          limitText_("the page has the first " + countText(options.limit, "packet") +
                     ", and there are more. --limit N takes another number, --where and --filter choose.") {}

    void start() override {
        out() << pageStart() << "f{\"version\":";
        writePageText(out(), NETFLOOR_VERSION);
        out() << ",\"filter\":";
        writePageText(out(), options().filter);
        out() << ",\"where\":";
        writePageText(out(), options().where);
        out() << ",\"files\":[";
        for (std::size_t i = 0; i < options().files.size(); ++i) {
            out() << (i == 0 ? "" : ",");
            writePageText(out(), baseName(options().files[i]));
        }
        out() << "]}\n";
    }

    void print(const PacketToPrint &packet) override {
        if (packets_ == options().limit) {
            isFull_ = true;
            return;
        }
        ++packets_;
        faults_ = {};
        if (packet.network.isIp()) {
            faults_ = checks_.check(packet.network.octets, packet.runOptions().wireOctets);
        }
        items_.begin();
        writeCaptured(packet);
        writeFaults(packet);
        if (packet.network.isIp()) {
            writeFields(packet);
        }
        items_.end();
        items_.writeNewLabels();
        out() << 'o' << '"';
        writeBase64(out(), packet.captured.octets);
        out() << "\"\n";
        writeRow(packet);
    }

    [[nodiscard]] bool hasHeadings() const override { return false; }
    [[nodiscard]] std::string_view limitText() const override { return isFull_ ? limitText_ : std::string_view(); }
    void remark(std::string_view sentence) override { remarks_.emplace_back(sentence); }
    void finish(const Tally &tally) override { total_ = tally.text(); }
    void finishAll(const Tally &tally) override { total_ = tally.text(); }

    void end() override {
        out() << "e{\"total\":";
        writePageText(out(), total_);
        out() << ",\"remarks\":[";
        for (std::size_t i = 0; i < remarks_.size(); ++i) {
            out() << (i == 0 ? "" : ",");
            writePageText(out(), remarks_[i]);
        }
        out() << "]}\n" << pageEnd();
    }

private:
    using Kind = PageItems::Kind;

    void writeItem(Kind kind, std::uint32_t depth, std::string_view label, std::string_view value) {
        items_.start(kind, depth, label);
        items_.value(value);
        items_.close();
    }

    // What the capture says of the packet.
    void writeCaptured(const PacketToPrint &packet) {
        const CapturedPacket &captured = packet.captured;
        writeItem(Kind::block, 0, "Packet", std::to_string(captured.number));
        times_.see(captured);
        if (captured.time) {
            writeItem(Kind::field, 1, "Time", times_.text(captured));
        }
        writeItem(Kind::field, 1, "Length", lengthText(captured));
        if (captured.linkType != linkType_ || linkName_.empty()) {
            linkType_ = captured.linkType;
            linkName_ = linkTypeName(linkType_);
        }
        writeItem(Kind::field, 1, "Link layer", linkName_);
        if (!packet.network.isIp()) {
            writeItem(Kind::note, 1, "no IP", packet.other);
        }
        if (!captured.interfaceName.empty()) {
            writeItem(Kind::field, 1, "Interface", captured.interfaceName);
        }
        for (const std::string_view comment : captured.comments) {
            writeItem(Kind::note, 1, "Comment", comment);
        }
    }

    static std::string lengthText(const CapturedPacket &captured) {
        std::string text = countText(captured.wireOctets, "octet");
        if (captured.isCut()) {
            text += ", cut by the snap length to " + std::to_string(captured.octets.size());
        }
        return text;
    }

    void writeFaults(const PacketToPrint &packet) {
        if (faults_.empty()) {
            return;
        }
        items_.start(Kind::block, 0, "Checks");
        items_.close();
        for (const Fault &fault : faults_) {
            text_.clear();
            appendFaultText(text_, fault);
            items_.start(fault.kind == FaultKind::damage ? Kind::damage : Kind::note, 1, labelOf(fault.kind));
            items_.value(text_);
            if (fault.octet < packet.network.octets.size()) {
                items_.bits(fault.octet * bitsPerOctet + 1, bitsPerOctet);
            }
            items_.close();
        }
    }

    // Of the packet and of those inside it.
    void writeFields(const PacketToPrint &packet) {
        const std::span<const std::uint8_t> octets = packet.network.octets;
        const RunOptions options = packet.runOptions();
        InnerPackets at(octets, options.wireOctets);
        for (; !at.ended(); at.next()) {
            if (at.isInner()) {
                text_.assign(tunnelName(at.opened().tunnel));
                if (at.opened().id) {
                    lineText_.takeBack(0);
                    lineText_ << " 0x" << Hex{*at.opened().id};
                    text_.append(lineText_.since(0));
                }
                text_.append(", at octet ").append(std::to_string(at.firstOctet()));
                writeItem(Kind::block, 0, "Packet inside", text_);
            }
            RunOptions inner = options;
            inner.wireOctets = at.wireOctets();
            tree_.place(at.firstOctet(), at.isInner() ? 1 : 0);
            host().run(Pass::md, at.octets(), tree_, inner);
        }
        if (!at.limit().empty()) {
            writeItem(Kind::note, 0, "limit", at.limit());
        }
    }

    void writeRow(const PacketToPrint &packet) {
        const CapturedPacket &captured = packet.captured;
        out() << "p[" << captured.number << ',';
        writePageText(out(), packet.time);
        out() << ',' << captured.wireOctets << ',';
        lineText_.takeBack(0);
        SummaryLine::Columns columns = {};
        if (packet.network.isIp()) {
            columns = line_.write(packet.network.octets, packet.runOptions());
        } else {
            lineText_ << "no IP: " << packet.other;
        }
        const auto damage = std::ranges::find(faults_, FaultKind::damage, &Fault::kind);
        if (damage != faults_.end()) {
            text_.clear();
            appendFaultText(text_, *damage);
            lineText_ << "  [" << text_ << ']';
        }
        const std::string_view line = lineText_.since(0);
        std::string_view source = line.substr(columns.source, columns.destination - columns.source);
        source = source.substr(0, source.rfind('>'));
        const std::string_view destination = line.substr(columns.destination, columns.rest - columns.destination);
        for (const std::string_view column :
             {line.substr(0, columns.source), source, destination, line.substr(columns.rest)}) {
            writePageText(out(), withoutBlanks(column));
            out() << ',';
        }
        writePageText(out(), stateOf(captured));
        out() << ',' << std::uint64_t{packet.network.offset};
        if (!packet.file.empty()) {
            out() << ',';
            writePageText(out(), baseName(packet.file));
        }
        out() << "]\n";
    }

    [[nodiscard]] std::string_view stateOf(const CapturedPacket &captured) const {
        if (std::ranges::find(faults_, FaultKind::damage, &Fault::kind) != faults_.end()) {
            return "DAMAGED";
        }
        return captured.isCut() ? "cut" : "";
    }

    PageItems items_;
    PageTree tree_;
    Output lineText_{false, false}; // of which nothing leaves
    SummaryLine line_;
    PacketChecks checks_;
    TimeText times_{TimeForm::utc};
    int linkType_ = 0;
    std::string linkName_; // of that type
    std::string limitText_;
    std::uint64_t packets_ = 0;
    bool isFull_ = false;
    std::string total_;
    std::vector<std::string> remarks_;

    // Of the packet.
    std::span<const Fault> faults_;
    std::string text_;
};

} // namespace

std::unique_ptr<Printer> makeHtmlPrinter(const Options &options, Output &out, Host &host) {
    return std::make_unique<HtmlPrinter>(options, out, host);
}

} // namespace netfloor::cli
