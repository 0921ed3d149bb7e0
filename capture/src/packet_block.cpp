// SPDX-License-Identifier: MIT
#include "netfloor-capture/packet_block.h"

#include <cstring>
#include <memory>

namespace netfloor {

PacketBlock::PacketBlock() : first_(firstRoom), room_(first_.data(), first_.size()) {
    packets_.reserve(mostPackets);
}

void PacketBlock::clear() {
    packets_.clear();
    room_.release();
    octets_ = 0;
}

void PacketBlock::add(const CapturedPacket &packet) {
    const std::string_view lastName = packets_.empty() ? std::string_view() : packets_.back().interfaceName;
    CapturedPacket &copy = packets_.emplace_back(packet);
    if (!packet.octets.empty()) {
        auto *const octets = static_cast<std::uint8_t *>(room_.allocate(packet.octets.size(), 1));
        std::memcpy(octets, packet.octets.data(), packet.octets.size());
        copy.octets = {octets, packet.octets.size()};
        octets_ += packet.octets.size();
    }
    copy.interfaceName = packet.interfaceName == lastName ? lastName : keep(packet.interfaceName);
    if (!packet.comments.empty()) {
        const std::size_t count = packet.comments.size();
        auto *const comments = static_cast<std::string_view *>(
            room_.allocate(count * sizeof(std::string_view), alignof(std::string_view)));
        for (std::size_t i = 0; i < count; ++i) {
            std::construct_at(comments + i, keep(packet.comments[i]));
        }
        copy.comments = {comments, count};
    }
}

std::string_view PacketBlock::keep(std::string_view text) {
    if (text.empty()) {
        return {};
    }
    auto *const copy = static_cast<char *>(room_.allocate(text.size(), 1));
    std::memcpy(copy, text.data(), text.size());
    octets_ += text.size();
    return {copy, text.size()};
}

} // namespace netfloor
