// SPDX-License-Identifier: MIT
#include "decode.h"

#include <cstdlib>
#include <iostream>
#include <memory>
#include <optional>
#include <string>
#include <string_view>

#include <unistd.h>

#include "interrupt.h"
#include "netfloor-capture/capture_file.h"
#include "netfloor-capture/capture_writer.h"
#include "netfloor-capture/filter.h"
#include "netfloor-capture/link_layer.h"
#include "netfloor-capture/time_text.h"
#include "output.h"
#include "plugin_path.h"
#include "printers/printer.h"
#include "progress.h"
#include "where.h"

namespace netfloor::cli {

namespace {

bool wantsColour(Colour colour) {
    if (colour != Colour::automatic) {
        return colour == Colour::always;
    }
    const char *const noColour = std::getenv("NO_COLOR"); // see no-color.org
    const char *const terminal = std::getenv("TERM");
    return ::isatty(STDOUT_FILENO) == 1 && (noColour == nullptr || *noColour == '\0') &&
           (terminal == nullptr || std::string_view(terminal) != "dumb");
}

// What a filter left out because it has no meaning there.
std::string refusedText(const std::string &expression, const PacketFilter &filter) {
    constexpr std::size_t mostTold = 3;
    std::string text = "--filter '" + expression + "' leaves out what libpcap cannot filter with it:";
    std::size_t told = 0;
    for (const auto &[linkType, refused] : filter.refused()) {
        if (told++ == mostTold) {
            return text + " and packets of " + countText(filter.refused().size() - mostTold, "more link type") + ".";
        }
        text += (told == 1 ? " " : "; ") + countText(refused.packets, "packet") + " of link type " +
                linkTypeName(linkType) + " (" + refused.reason + ")";
    }
    return text + ". Filter on what all link types of the capture have, or leave the filter out.";
}

class Decoding {
public:
    explicit Decoding(const Options &options)
        : options_(options),
          capture_(options.file),
          host_(PluginLibrary::open(findPlugin(options.plugin))),
          out_(wantsColour(options.colour), capture_.isLive() || ::isatty(STDOUT_FILENO) == 1),
          printer_(makePrinter(options, out_, host_)),
          times_(options.utc ? TimeForm::utc : TimeForm::sinceFirst),
          progress_(std::make_unique<ProgressBar>(capture_)) {
        if (!options.filter.empty()) {
            filter_.emplace(options.filter);
        }
        if (!options.where.empty()) {
            condition_.emplace(parseWhere(options.where));
            layers_.emplace(host_);
        }
        if (!options.write.empty()) {
            openWriter();
        }
    }

    ExitCode run() {
        ExitCode code = ExitCode::good;
        std::string damage;
        try {
            readPackets();
        } catch (const CaptureDamage &found) {
            if (!isInterrupted()) { // which cuts the input anywhere
                damage = found.what();
                code = ExitCode::cutCapture;
            }
        }
        progress_.reset(); // what follows stands on a clean line
        if (filter_ && filter_->refusedAll()) {
            throw UsageError(refusedText(options_.filter, *filter_));
        }
        if (writer_) {
            writer_->finish();
        }
        printer_->finish(tally_);
        out_.flush();
        if (filter_ && !filter_->refused().empty()) {
            std::cerr << "netfloor: " << refusedText(options_.filter, *filter_) << '\n';
        }
        if (const std::string note = capture_.note(); !note.empty()) {
            std::cerr << "netfloor: " << note << '\n';
        }
        if (!damage.empty()) {
            std::cerr << "netfloor: " << damage << '\n';
            return code;
        }
        if (isInterrupted()) {
            std::cerr << "netfloor: interrupted after " << countText(read_, "packet") << ".\n";
            return printer_->exitCode();
        }
        if (!options_.packets.areAll() && tally_.packets == 0) {
            throw UsageError("--packet " + options_.packets.text +
                             (read_ < options_.packets.last
                                  ? ": the capture has only " + countText(read_, "packet") + "."
                                  : " does not match the filter or the condition."));
        }
        if (read_ == 0 && options_.count != std::uint64_t{0}) {
            std::cerr << "netfloor: " << capture_.name() << " holds no packets.\n";
        }
        return printer_->exitCode();
    }

private:
    void openWriter() {
        std::error_code error; // one that does not exist is another file
        if (std::filesystem::equivalent(options_.file, options_.write, error)) {
            throw UsageError("--write " + options_.write.string() + " is the capture that is read. Name another file.");
        }
        writer_.emplace(options_.write);
    }

    void readPackets() {
        CapturedPacket packet;
        while (!isInterrupted() && (!options_.count || tally_.packets < *options_.count) && capture_.next(packet)) {
            read_ = packet.number;
            times_.see(packet);
            if (options_.packets.hold(packet.number) && (!filter_ || filter_->passes(packet))) {
                print(packet);
            }
            if (packet.number == options_.packets.last) {
                return;
            }
            progress_->packetDone(packet.number);
        }
    }

    void print(const CapturedPacket &packet) {
        const NetworkPart network = findNetworkPart(packet.linkType, packet.octets);
        if (condition_ && !meetsCondition({packet, network, {}, {}, 0})) {
            return;
        }
        if (writer_) {
            writer_->write(packet);
        }
        printer_->print({packet, network, tally_.add(network), times_.text(packet), times_.width()});
        out_.endPacket();
    }

    [[nodiscard]] bool meetsCondition(const PacketToPrint &packet) {
        if (!packet.network.isIp()) {
            return false;
        }
        layers_->read(packet.network.octets, packet.runOptions());
        return condition_->holdsFor(*layers_);
    }

    const Options &options_;
    CaptureFile capture_;
    std::optional<PacketFilter> filter_;
    Host host_;
    std::optional<CaptureWriter> writer_;
    std::optional<Condition> condition_;
    std::optional<LayerView> layers_; // for the condition
    Output out_;
    std::unique_ptr<Printer> printer_;
    TimeText times_;
    std::unique_ptr<ProgressBar> progress_;
    Tally tally_;
    std::uint64_t read_ = 0; // packets of the capture
};

} // namespace

ExitCode decodeCapture(const Options &options) {
    return Decoding(options).run();
}

} // namespace netfloor::cli
