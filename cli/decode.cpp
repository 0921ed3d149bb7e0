// SPDX-License-Identifier: MIT
#include "decode.h"

#include <array>
#include <cstdio>
#include <cstdlib>
#include <ctime>
#include <iostream>
#include <memory>
#include <string>
#include <string_view>

#include <unistd.h>

#include "capture/capture.h"
#include "filter.h"
#include "output.h"
#include "plugin_path.h"
#include "printers/printer.h"
#include "progress.h"

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

// Writes the times of packets: seconds since the first one, or date and time of day.
class TimeTexts {
public:
    TimeTexts(bool utc, int digits) : utc_(utc), digits_(digits) {}

    [[nodiscard]] std::string operator()(const std::optional<CaptureTime> &time) {
        if (!time) {
            return "";
        }
        if (!first_) {
            first_ = time;
        }
        return utc_ ? dateText(*time) : sinceFirst(*time);
    }

private:
    [[nodiscard]] std::string fraction(std::uint32_t nanoseconds) const {
        std::array<char, 16> text{};
        std::snprintf(text.data(), text.size(), ".%09u", nanoseconds);
        return {text.data(), static_cast<std::size_t>(digits_) + 1};
    }

    [[nodiscard]] std::string sinceFirst(const CaptureTime &time) const {
        constexpr std::int64_t second = 1'000'000'000;
        const std::int64_t difference = (time.seconds - first_->seconds) * second + time.nanoseconds -
                                        static_cast<std::int64_t>(first_->nanoseconds);
        const std::int64_t size = difference < 0 ? -difference : difference;
        return (difference < 0 ? "-" : "") + std::to_string(size / second) +
               fraction(static_cast<std::uint32_t>(size % second));
    }

    [[nodiscard]] std::string dateText(const CaptureTime &time) const {
        std::tm parts = {};
        const std::time_t seconds = time.seconds;
        if (gmtime_r(&seconds, &parts) == nullptr) {
            return std::to_string(time.seconds) + fraction(time.nanoseconds);
        }
        std::array<char, 64> text{};
        const std::size_t size = std::strftime(text.data(), text.size(), "%Y-%m-%dT%H:%M:%S", &parts);
        return std::string(text.data(), size) + fraction(time.nanoseconds) + "Z";
    }

    bool utc_;
    int digits_;
    std::optional<CaptureTime> first_;
};

class Decoding {
public:
    explicit Decoding(const Options &options)
        : options_(options),
          stream_(options.file),
          capture_(openCapture(stream_)),
          filter_(options.filter),
          host_(PluginLibrary::open(findPlugin(options.plugin))),
          out_(wantsColour(options.colour), stream_.isLive() || ::isatty(STDOUT_FILENO) == 1),
          printer_(makePrinter(options, out_, host_)),
          times_(options.utc, capture_->timeDigits()),
          progress_(std::make_unique<ProgressBar>(stream_)) {}

    ExitCode run() {
        ExitCode code = ExitCode::good;
        std::string damage;
        try {
            readPackets();
        } catch (const CaptureDamage &found) {
            damage = found.what();
            code = ExitCode::cutCapture;
        }
        progress_.reset(); // what follows stands on a clean line
        printer_->finish(tally_);
        out_.flush();
        if (!damage.empty()) {
            std::cerr << "netfloor: " << damage << '\n';
            return code;
        }
        if (options_.packet && tally_.packets == 0) {
            throw UsageError(read_ < *options_.packet
                                 ? "--packet " + std::to_string(*options_.packet) + ": the capture has only " +
                                       countText(read_, "packet") + "."
                                 : "--packet " + std::to_string(*options_.packet) + " does not match the filter.");
        }
        if (read_ == 0 && options_.count != std::uint64_t{0}) {
            std::cerr << "netfloor: " << stream_.name() << " holds no packets.\n";
        }
        return printer_->exitCode();
    }

private:
    void readPackets() {
        CapturedPacket packet;
        while ((!options_.count || tally_.packets < *options_.count) && capture_->next(packet)) {
            read_ = packet.number;
            const std::string time = times_(packet.time);
            if (options_.packet && packet.number < *options_.packet) {
                continue;
            }
            if (filter_.passes(packet)) {
                const NetworkPart network = findNetworkPart(packet.linkType, packet.octets);
                tally_.add(network);
                printer_->print(packet, network, time);
                out_.endPacket();
            }
            if (options_.packet) {
                return;
            }
            progress_->packetDone(packet.number);
        }
    }

    const Options &options_;
    OctetStream stream_;
    std::unique_ptr<CaptureReader> capture_;
    Filter filter_;
    Host host_;
    Output out_;
    std::unique_ptr<Printer> printer_;
    TimeTexts times_;
    std::unique_ptr<ProgressBar> progress_;
    Tally tally_;
    std::uint64_t read_ = 0; // packets of the capture
};

} // namespace

ExitCode decodeCapture(const Options &options) {
    return Decoding(options).run();
}

} // namespace netfloor::cli
