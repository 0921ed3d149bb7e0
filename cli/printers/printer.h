// SPDX-License-Identifier: MIT
// What is printed of each packet. Printers know the types of reports, and no protocol.
#pragma once

#include <cstdint>
#include <map>
#include <memory>
#include <string>

#include "exit_code.h"
#include "netfloor-capture/link_layer.h"
#include "netfloor-capture/packet.h"
#include "netfloor-host/plugin_host.h"
#include "options.h"
#include "output.h"
#include "text.h"

namespace netfloor::cli {

// What the packets that were shown have been.
struct Tally {
    std::uint64_t packets = 0;
    std::uint64_t withIp = 0;
    std::map<NotIp, std::uint64_t> others;

    void add(const NetworkPart &network);
    // "205 packets: 198 with IP, 7 without (4 ARP, 3 LLDP)"
    [[nodiscard]] std::string text() const;
};

class Printer {
public:
    Printer(const Options &options, Output &out, Host &host) : options_(options), out_(out), host_(host) {}
    Printer(const Printer &) = delete;
    Printer &operator=(const Printer &) = delete;
    virtual ~Printer() = default;

    // One packet, `time` in the form that the options ask for.
    virtual void print(const CapturedPacket &packet, const NetworkPart &network, const std::string &time) = 0;

    // Behind the last packet.
    virtual void finish(const Tally &tally) = 0;

    [[nodiscard]] virtual ExitCode exitCode() const { return ExitCode::good; }

protected:
    [[nodiscard]] const Options &options() const { return options_; }
    [[nodiscard]] Output &out() const { return out_; }
    [[nodiscard]] Host &host() const { return host_; }

    // The columns that start a line: number, time, octets.
    void printHead(const CapturedPacket &packet, const std::string &time);
    // "no IP: ARP", dimmed.
    void printOther(const NetworkPart &network) const;
    void printTally(const Tally &tally) const;

private:
    const Options &options_;
    Output &out_;
    Host &host_;
    std::size_t timeWidth_ = 11;
};

// "cut by the snap length: 96 of 1514 octets", or empty.
[[nodiscard]] std::string cutText(const CapturedPacket &packet);

[[nodiscard]] std::unique_ptr<Printer> makePrinter(const Options &options, Output &out, Host &host);

[[nodiscard]] std::unique_ptr<Printer> makeSummaryPrinter(const Options &options, Output &out, Host &host);
[[nodiscard]] std::unique_ptr<Printer> makeDetailPrinter(const Options &options, Output &out, Host &host);
[[nodiscard]] std::unique_ptr<Printer> makeVerifyPrinter(const Options &options, Output &out, Host &host);
[[nodiscard]] std::unique_ptr<Printer> makeKeysPrinter(const Options &options, Output &out, Host &host);

} // namespace netfloor::cli
