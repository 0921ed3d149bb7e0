// SPDX-License-Identifier: MIT
#include "records.h"

namespace netfloor {

namespace {

std::string packetsBefore(std::uint64_t count) {
    switch (count) {
    case 0: return "there is no whole packet in front of it.";
    case 1: return "the 1 packet in front of it is whole.";
    default: return "the " + std::to_string(count) + " packets in front of it are whole.";
    }
}

} // namespace

bool RecordReader::isPastShard(const OctetStream &stream, std::uint64_t packets, bool isAtEnd) const {
    if (!shard_) {
        return isAtEnd;
    }
    const std::uint64_t position = stream.position();
    const bool isPast = isAtEnd || (shard_->end && position >= *shard_->end);
    const bool isInPlace =
        packets == shard_->begin.packets + shard_->packets && (!shard_->end || position == *shard_->end);
    if (isPast && !isInPlace) {
        throw shardDamage(stream, packets);
    }
    return isPast;
}

CaptureDamage RecordReader::shardDamage(const OctetStream &stream, std::uint64_t packets) const {
    const std::uint64_t last = shard_->begin.packets + shard_->packets;
    return {stream.file().name() + ": the capture has changed since it was planned. By its plan, packet " +
                std::to_string(last) + " ends at " +
                (shard_->end ? "octet " + std::to_string(*shard_->end) : std::string("the end of the file")) +
                "; the reading is at octet " + std::to_string(stream.position()) + " after packet " +
                std::to_string(packets) + ". Plan the capture again.",
            packets + 1, stream.position()};
}

FileState fileState(OctetStream &stream) {
    constexpr std::size_t startOctets = 64;
    const auto start = stream.peek(startOctets);
    return {stream.file().size(), stream.file().modified(), {start.begin(), start.end()}};
}

CaptureDamage damageAt(const OctetStream &stream, std::uint64_t packetNumber, std::uint64_t position,
                       const std::string &reason) {
    return {stream.file().name() + ": " + reason + " in packet " + std::to_string(packetNumber) +
                ", which begins at octet " + std::to_string(position) +
                (stream.isPacked() ? " of the unpacked capture; " : " of the file; ") +
                packetsBefore(packetNumber - 1) + " Copy or take the capture again if the rest is needed.",
            packetNumber, position};
}

CaptureDamage cutAt(const OctetStream &stream, std::uint64_t packetNumber, std::uint64_t position) {
    const std::string reason = stream.error().empty()
                                   ? "the capture is cut off at octet " + std::to_string(stream.endPosition()) + ","
                                   : stream.error();
    return damageAt(stream, packetNumber, position, reason);
}

} // namespace netfloor
