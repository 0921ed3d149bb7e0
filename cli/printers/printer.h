// SPDX-License-Identifier: MIT
// What is printed of each packet. Printers know what a host reports, and no protocol.
#pragma once

#include <cstdint>
#include <map>
#include <memory>
#include <string>
#include <string_view>

#include "exit_code.h"
#include "netfloor-analysis/rows.h"
#include "netfloor-capture/link_layer.h"
#include "netfloor-capture/packet.h"
#include "netfloor-host/plugin_host.h"
#include "options.h"
#include "output.h"
#include "text.h"

namespace netfloor::cli {

// What the packets that were shown have been.
class Tally {
public:
    std::uint64_t packets = 0;
    std::uint64_t withIp = 0;

    // A packet, by what it is if it is no IP.
    void add(const NotIp &kind, std::uint64_t count = 1);
    void add(const Tally &other);

    [[nodiscard]] bool hasOthers() const { return packets != withIp; }

    // "205 packets: 198 with IP, 7 without (4 ARP, 3 LLDP)"
    [[nodiscard]] std::string text() const;

private:
    std::map<NotIp, std::uint64_t> others_; // of a bounded number: a capture may have millions of kinds
    std::uint64_t rest_ = 0;
};

// One packet, as the printers get it.
struct PacketToPrint {
    const CapturedPacket &captured;
    const NetworkPart &network;
    std::string_view other; // what it is if it is no IP
    std::string_view time;  // in the form that the options ask for
    std::size_t timeWidth;  // of its column
    std::string_view file;  // empty where there is one

    [[nodiscard]] PacketInput input() const { return {captured, network, other}; }
    [[nodiscard]] RunOptions runOptions() const { return input().runOptions(); }
};

// A printer keeps of a packet nothing but counts: each thread that decodes has one, and packets of any part of a
// capture may come to it. What is before and after them, one of these prints.
class Printer {
public:
    Printer(const Options &options, Output &out, Host &host) : options_(options), out_(out), host_(host) {}
    Printer(const Printer &) = delete;
    Printer &operator=(const Printer &) = delete;
    virtual ~Printer() = default;

    // Before the first packet of the first capture: the header of rows.
    virtual void start() {}

    // Before the first packet of each capture.
    virtual void startCapture(std::string_view /*name*/) {}

    virtual void print(const PacketToPrint &packet) = 0;

    // What printers in other threads have printed, in the order of the packets.
    virtual void write(std::string_view printed) { out_.writeThrough(printed); }

    // After the last one. `problem` is a sentence where packets are missing: the capture is damaged, or Ctrl-C came.
    virtual void endCapture(std::string_view /*problem*/) {}

    // After the last packet of a capture: what it had. `tally` is that of the capture.
    virtual void finish(const Tally &tally) = 0;

    // After the last one of several captures.
    virtual void finishAll(const Tally & /*tally*/) {}

    // A sentence on standard error that belongs to the results.
    virtual void remark(std::string_view /*sentence*/) {}

    // A sentence, once a packet came that is one too many; none is taken from then on.
    [[nodiscard]] virtual std::string_view limitText() const { return {}; }

    // After all captures and remarks.
    virtual void end() {}

    // Takes the counts over from a printer of the same kind, which starts again from 0.
    virtual void takeCounts(Printer & /*from*/) {}

    // Whether a heading stands in front of each of several captures; rows have a column for it.
    [[nodiscard]] virtual bool hasHeadings() const { return true; }

    [[nodiscard]] virtual ExitCode exitCode() const { return ExitCode::good; }

protected:
    [[nodiscard]] const Options &options() const { return options_; }
    [[nodiscard]] Output &out() const { return out_; }
    [[nodiscard]] Host &host() const { return host_; }
    // Runs a pass over the packet, which has IP, with its length on the wire.
    Ending run(Pass pass, const PacketToPrint &packet, Sink &sink) const {
        return host_.run(pass, packet.network.octets, sink, packet.runOptions());
    }

    // The columns that start a line: number, time, octets.
    void printHead(const PacketToPrint &packet);
    // "no IP: ARP", dimmed.
    void printOther(const PacketToPrint &packet) const;
    // "cut by the snap length: 96 of 1514 octets", or nothing.
    void printCut(const CapturedPacket &packet) const;
    // Ends the line of a packet, with a note where the snap length has cut it.
    void endLine(const CapturedPacket &packet) const;
    void printTally(const Tally &tally) const;

private:
    const Options &options_;
    Output &out_;
    Host &host_;
};

[[nodiscard]] std::unique_ptr<Printer> makePrinter(const Options &options, Output &out, Host &host);

[[nodiscard]] std::unique_ptr<Printer> makeSummaryPrinter(const Options &options, Output &out, Host &host);
[[nodiscard]] std::unique_ptr<Printer> makeDetailPrinter(const Options &options, Output &out, Host &host);
[[nodiscard]] std::unique_ptr<Printer> makeVerifyPrinter(const Options &options, Output &out, Host &host);
[[nodiscard]] std::unique_ptr<Printer> makeKeysPrinter(const Options &options, Output &out, Host &host);
[[nodiscard]] std::unique_ptr<Printer> makeJsonPrinter(const Options &options, Output &out, Host &host);
[[nodiscard]] std::unique_ptr<Printer> makeExportPrinter(const Options &options, Output &out, Host &host);
[[nodiscard]] std::unique_ptr<Printer> makeHtmlPrinter(const Options &options, Output &out, Host &host);

} // namespace netfloor::cli
