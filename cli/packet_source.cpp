// SPDX-License-Identifier: MIT
#include "packet_source.h"

#include <utility>

#include "exit_code.h"
#include "interrupt.h"
#include "netfloor-capture/link_layer.h"
#include "text.h"

namespace netfloor::cli {

PacketSource::PacketSource(const Options &options, const std::string &file)
    : PacketSource(options, CaptureFile(file)) {}

PacketSource::PacketSource(const Options &options, const CapturePlan &plan, std::size_t shard)
    : PacketSource(options, CaptureFile(plan, shard)) {
    timeStart_ = plan.shards[shard].timeStart;
}

PacketSource::PacketSource(const Options &options, CaptureFile capture)
    : options_(options), capture_(std::move(capture)), progress_(std::make_unique<ProgressBar>(capture_)) {
    if (!options.filter.empty()) {
        filter_.emplace(options.filter);
    }
}

bool PacketSource::next(CapturedPacket &packet, bool mayWait) {
    while (!isAtEnd_ && !isInterrupted()) {
        if (!mayWait && !capture_.isNextHere()) {
            return false;
        }
        try {
            isAtEnd_ = !capture_.next(packet);
        } catch (const CaptureDamage &found) {
            isAtEnd_ = true;
            damage_ = isInterrupted() ? "" : found.what(); // an interrupt cuts the input anywhere
        }
        if (isAtEnd_) {
            return false;
        }
        read_ = packet.number;
        isAtEnd_ = read_ == options_.packets.last;
        timeStart_.see(packet);
        progress_->packetDone(read_);
        if (options_.packets.hold(read_) && (!filter_ || filter_->passes(packet))) {
            return true;
        }
    }
    return false;
}

void PacketSource::end() {
    progress_.reset();
    if (filter_ && filter_->refusedAll()) {
        throw UsageError(refusedText());
    }
}

std::string PacketSource::refusedText() const {
    if (!filter_ || filter_->refused().empty()) {
        return {};
    }
    constexpr std::size_t mostTold = 3;
    std::string text = "--filter '" + options_.filter + "' leaves out what libpcap cannot filter with it:";
    std::size_t told = 0;
    for (const auto &[linkType, refused] : filter_->refused()) {
        if (told++ == mostTold) {
            return text + " and packets of " + countText(filter_->refused().size() - mostTold, "more link type") + ".";
        }
        text += (told == 1 ? " " : "; ") + countText(refused.packets, "packet") + " of link type " +
                linkTypeName(linkType) + " (" + refused.reason + ")";
    }
    return text + ". Filter on what all link types of the capture have, or leave the filter out.";
}

} // namespace netfloor::cli
