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
