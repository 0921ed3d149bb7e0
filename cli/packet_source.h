// SPDX-License-Identifier: MIT
// The packets of one capture that were asked for by number and filter, in their order.
#pragma once

#include <cstdint>
#include <memory>
#include <optional>
#include <string>

#include "netfloor-capture/capture_file.h"
#include "netfloor-capture/filter.h"
#include "netfloor-capture/time_text.h"
#include "options.h"
#include "progress.h"

namespace netfloor::cli {

class PacketSource {
public:
    // Throws CaptureError and FilterError.
    PacketSource(const Options &options, const std::string &file);
    PacketSource(const Options &options, const CapturePlan &plan, std::size_t shard);

    // The next packet, valid until the next call. False at the end, at damage and after an interrupt; and where the
    // next packet has not come yet, unless the call may wait for it. Throws FilterError.
    [[nodiscard]] bool next(CapturedPacket &packet, bool mayWait = true);

    // Of the packets up to the last one that `next` gave.
    [[nodiscard]] const TimeStart &timeStart() const { return timeStart_; }

    [[nodiscard]] const CaptureFile &capture() const { return capture_; }
    [[nodiscard]] std::uint64_t read() const { return read_; } // packets, also those that were not asked for
    [[nodiscard]] const std::string &damage() const { return damage_; }

    // No packet is read any more: takes the progress bar away. Throws UsageError for a filter that fits no packet's
    // link type.
    void end();

    // What the filter left out because it has no meaning there, as a sentence, or nothing.
    [[nodiscard]] std::string refusedText() const;

private:
    PacketSource(const Options &options, CaptureFile capture);

    const Options &options_;
    CaptureFile capture_;
    std::optional<PacketFilter> filter_;
    std::unique_ptr<ProgressBar> progress_;
    TimeStart timeStart_;
    std::uint64_t read_ = 0;
    bool isAtEnd_ = false;
    std::string damage_; // that ended the reading
};

} // namespace netfloor::cli
