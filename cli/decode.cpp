// SPDX-License-Identifier: MIT
#include "decode.h"

#include <algorithm>
#include <cstdlib>
#include <iostream>
#include <optional>
#include <string>
#include <string_view>

#include <unistd.h>

#include "interrupt.h"
#include "jobs.h"
#include "netfloor-capture/capture_writer.h"
#include "output.h"
#include "packet_decoder.h"
#include "packet_source.h"
#include "plugin_path.h"

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

class Decoding {
public:
    explicit Decoding(const Options &options)
        : options_(options),
          out_(wantsColour(options.colour), ::isatty(STDOUT_FILENO) == 1),
          library_(PluginLibrary::open(findPlugin(options.plugin))),
          decoder_(options, library_, out_) {
        if (!options.write.empty()) {
            refuseToWriteWhatIsRead();
        }
        if (jobCount(options) > 1) {
            jobs_.emplace(options, wantsColour(options.colour), library_);
        }
    }

    ExitCode run() {
        ExitCode code = ExitCode::good;
        for (const std::string &file : options_.files) {
            code = worse(code, tryFile(file));
            if (isInterrupted() || isFull()) {
                break;
            }
        }
        if (writer_) {
            writer_->finish();
        }
        if (hasSeveral()) {
            startPart("all " + std::to_string(options_.files.size()) + " captures");
            printer().finishAll(all_);
        }
        if (isFull()) {
            tell(printer().limitText());
        }
        if (isStarted_) {
            printer().end();
        }
        out_.flush();
        return worse(code, printer().exitCode());
    }

private:
    [[nodiscard]] bool hasSeveral() const { return options_.files.size() > 1; }
    [[nodiscard]] Printer &printer() { return decoder_.printer(); }
    [[nodiscard]] bool isFull() { return !printer().limitText().empty(); }

    void tell(std::string_view sentence) {
        printer().remark(sentence);
        std::cerr << "netfloor: " << sentence << '\n';
    }

    // What is wrong with one capture does not keep the others from being read.
    ExitCode tryFile(const std::string &file) {
        try {
            return decodeFile(file);
        } catch (const CaptureError &error) {
            return fail(ExitCode::noCapture, error.what());
        } catch (const UsageError &error) {
            return fail(ExitCode::usage, error.what());
        }
    }

    ExitCode fail(ExitCode code, std::string_view sentence) {
        out_.flush(); // on a terminal the two stand in their order
        tell(sentence);
        return code;
    }

    ExitCode decodeFile(const std::string &file) {
        PacketSource source(options_, file);
        if (!isStarted_) {
            start();
        }
        startPart(source.capture().name());
        printer().startCapture(source.capture().name());
        Tally tally;
        readAll(source, tally);
        source.end();
        printer().endCapture(problemOf(source));
        all_.add(tally);
        printer().finish(tally);
        out_.flush();
        return tellEnd(source, tally.packets);
    }

    // Not before there is a capture.
    void start() {
        isStarted_ = true;
        if (!options_.write.empty()) {
            writer_.emplace(options_.write);
        }
        printer().start();
    }

    void refuseToWriteWhatIsRead() const {
        for (const std::string &file : options_.files) {
            std::error_code error; // one that does not exist is another file
            if (std::filesystem::equivalent(file, options_.write, error)) {
                throw UsageError("--write " + options_.write.string() +
                                 " is a capture that is read. Name another file.");
            }
        }
    }

    // The heading in front of what follows, as programs that show the starts of several files have it.
    void startPart(std::string_view name) {
        if (!hasSeveral() || !printer().hasHeadings()) {
            return;
        }
        out_ << (hasParts_ ? "\n" : "");
        hasParts_ = true;
        out_.start(Style::bold) << "==> ";
        out_.untrusted(name);
        (out_ << " <==").stop(Style::bold) << '\n';
    }

    void readAll(PacketSource &source, Tally &tally) {
        const std::string_view file = hasSeveral() ? std::string_view(source.capture().name()) : std::string_view();
        const bool isLive = source.capture().isLive();
        const auto decode = [&](const CapturedPacket &packet) {
            if (const auto kind = decoder_.decode(packet, source.timeStart(), file); kind && !isFull()) {
                keep(packet, *kind, tally);
            }
            isLive ? out_.flush() : out_.endPacket();
        };
        if (jobs_) {
            DecodedBlock first;
            const bool hasPackets = first.fill(source);
            if (hasPackets && (first.packets.isFull() || isLive)) {
                return readInThreads(first, source, file, tally);
            }
            std::ranges::for_each(first.packets.packets(), decode); // these are all: threads would take longer to start
        }
        CapturedPacket packet;
        while ((!options_.count || tally.packets < *options_.count) && !isFull() && source.next(packet)) {
            decode(packet);
        }
    }

    void readInThreads(DecodedBlock &first, PacketSource &source, std::string_view file, Tally &tally) {
        jobs_->decode(first, source, file, [&](const DecodedBlock &block) {
            const auto packets = block.packets.packets();
            for (std::size_t i = 0; i < packets.size(); ++i) {
                if (block.kinds[i]) {
                    keep(packets[i], *block.kinds[i], tally);
                }
            }
            out_.writeThrough(block.text.view());
        });
        jobs_->giveCounts(printer());
    }

    // A packet that was shown.
    void keep(const CapturedPacket &packet, const NotIp &kind, Tally &tally) {
        tally.add(kind);
        if (writer_) {
            writer_->write(packet);
        }
    }

    // Why packets are missing, or nothing.
    static std::string problemOf(const PacketSource &source) {
        if (source.damage().empty() && isInterrupted()) {
            return "interrupted after " + countText(source.read(), "packet") + ".";
        }
        return source.damage();
    }

    ExitCode tellEnd(const PacketSource &source, std::uint64_t shown) {
        if (const std::string refused = source.refusedText(); !refused.empty()) {
            tell(refused);
        }
        if (const std::string note = source.capture().note(); !note.empty()) {
            tell(note);
        }
        if (!source.damage().empty()) {
            tell(source.damage());
            return ExitCode::cutCapture;
        }
        if (isInterrupted()) {
            tell(problemOf(source));
            return ExitCode::good;
        }
        if (!options_.packets.areAll() && shown == 0) {
            throw UsageError("--packet " + options_.packets.text +
                             (source.read() < options_.packets.last
                                  ? ": the capture has only " + countText(source.read(), "packet") + "."
                                  : " does not match the filter or the condition."));
        }
        if (source.read() == 0 && options_.count != std::uint64_t{0}) {
            tell(source.capture().name() + " holds no packets.");
        }
        return ExitCode::good;
    }

    const Options &options_;
    Output out_;
    PluginLibrary library_;
    PacketDecoder decoder_;    // of the thread that reads, where there are no jobs
    std::optional<Jobs> jobs_; // none: one thread does all
    std::optional<CaptureWriter> writer_;
    Tally all_; // of all captures
    bool isStarted_ = false;
    bool hasParts_ = false;
};

} // namespace

ExitCode decodeCapture(const Options &options) {
    return Decoding(options).run();
}

} // namespace netfloor::cli
