// SPDX-License-Identifier: MIT
#include "packet_decoder.h"

#include <utility>

#include "where.h"

namespace netfloor::cli {

PacketDecoder::PacketDecoder(const Options &options, PluginLibrary library, Output &out)
    : host_(std::move(library)),
      printer_(makePrinter(options, out, host_)),
      times_(options.utc ? TimeForm::utc : TimeForm::sinceFirst) {
    if (!options.where.empty()) {
        condition_.emplace(parseWhere(options.where));
        layers_.emplace(host_);
    }
}

std::optional<NotIp> PacketDecoder::decode(const CapturedPacket &packet, const TimeStart &start,
                                           std::string_view file) {
    const NetworkPart network = findNetworkPart(packet.linkType, packet.octets);
    if (network.other != other_) {
        other_ = network.other;
        otherText_ = other_.text();
    }
    times_.startAt(start);
    const PacketToPrint toPrint = {packet, network, otherText_, times_.text(packet), times_.width(), file};
    if (condition_ && !meetsCondition(toPrint)) {
        return std::nullopt;
    }
    printer_->print(toPrint);
    return network.other;
}

bool PacketDecoder::meetsCondition(const PacketToPrint &packet) {
    if (!packet.network.isIp()) {
        return false;
    }
    layers_->read(packet.network.octets, packet.runOptions());
    return condition_->holdsFor(*layers_);
}

} // namespace netfloor::cli
