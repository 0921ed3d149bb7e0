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
#include "plan.h"
#include "plugin_path.h"

namespace netfloor::cli {

namespace {

bool isTerminal() {
    return ::isatty(STDOUT_FILENO) == 1;
}

bool wantsColour(Colour colour) {
    if (colour != Colour::automatic) {
        return colour == Colour::always;
    }
    const char *const noColour = std::getenv("NO_COLOR"); // see no-color.org
    const char *const terminal = std::getenv("TERM");
    return isTerminal() && (noColour == nullptr || *noColour == '\0') &&
           (terminal == nullptr || std::string_view(terminal) != "dumb");
}

// A shard's output is a part of that of all captures of the plan.
Options withFiles(Options options, const std::optional<ChosenShard> &shard) {
    if (shard) {
        options.totals = false;
        for (const CapturePlan &capture : shard->captures) {
            options.files.push_back(capture.path);
        }
    }
    return options;
}

class Decoding {
public:
    explicit Decoding(const Options &asked)
        : shard_(asked.shard.empty() ? std::nullopt : std::optional(chooseShard(asked.shard))),
          options_(withFiles(asked, shard_)),
          isFirstPart_(!shard_ || (shard_->capture == 0 && shard_->shard == 0)),
          out_(wantsColour(asked.colour), isTerminal()),
          library_(PluginLibrary::open(findPlugin(asked.plugin))),
          decoder_(options_, library_, out_) {
        if (!options_.write.empty()) {
            refuseToWriteWhatIsRead();
        }
        if (options_.command == Command::exporting && !options_.append) {
            refuseToWriteWhatIsThere();
        }
        if (jobCount(options_) > 1) {
            jobs_.emplace(options_, wantsColour(asked.colour), library_);
        }
    }

    ExitCode run() {
        ExitCode code = ExitCode::good;
        if (shard_) {
            const CapturePlan &plan = shard_->captures[shard_->capture];
            code = tryDecode([&] { return PacketSource(options_, plan, shard_->shard); });
        }
        for (std::size_t i = 0; i < options_.files.size() && !shard_ && !isInterrupted() && !isFull(); ++i) {
            code = worse(code, tryDecode([&] { return PacketSource(options_, options_.files[i]); }));
        }
        if (writer_) {
            writer_->finish();
        }
        if (hasSeveral() && options_.totals) {
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
    template <typename Open>
    ExitCode tryDecode(Open open) {
        try {
            PacketSource source = open();
            return decode(source);
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

    ExitCode decode(PacketSource &source) {
        if (!isStarted_) {
            start();
        }
        if (!shard_ || shard_->shard == 0) {
            startPart(source.capture().name());
            printer().startCapture(source.capture().name());
        }
        Tally tally;
        readAll(source, tally);
        source.end();
        printer().endCapture(problemOf(source));
        all_.add(tally);
        if (options_.totals) {
            printer().finish(tally);
        }
        out_.flush();
        return tellEnd(source, tally.packets);
    }

    // Not before there is a capture.
    void start() {
        isStarted_ = true;
        if (!options_.write.empty()) {
            writer_.emplace(options_.write);
        }
        if (isFirstPart_) {
            printer().start();
        }
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

    void refuseToWriteWhatIsThere() const {
        std::error_code error; // one that does not exist has no octets
        if (std::filesystem::file_size(options_.to, error) != 0 && !error) {
            throw UsageError("--to " + options_.to.string() +
                             ": this file is there already. Name another one, or add to it with --append.");
        }
    }

    // The heading in front of what follows, as programs that show the starts of several files have it.
    void startPart(std::string_view name) {
        if (!hasSeveral() || !printer().hasHeadings()) {
            return;
        }
        out_ << (isFirstPart_ ? "" : "\n");
        isFirstPart_ = false;
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
            printer().write(block.text.view());
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
        if (shard_) { // what is asked for may be in the others
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

    const std::optional<ChosenShard> shard_; // none: all of the files
    const Options options_;
    bool isFirstPart_; // of the output
    Output out_;
    PluginLibrary library_;
    PacketDecoder decoder_;    // of the thread that reads, where there are no jobs
    std::optional<Jobs> jobs_; // none: one thread does all
    std::optional<CaptureWriter> writer_;
    Tally all_; // of all captures
    bool isStarted_ = false;
};

} // namespace

ExitCode decodeCapture(const Options &options) {
    return Decoding(options).run();
}

} // namespace netfloor::cli
