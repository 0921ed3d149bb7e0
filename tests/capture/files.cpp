// SPDX-License-Identifier: MIT
#include "capture/files.h"

#include <sstream>

namespace netfloor::test {

std::string told(const CapturedPacket &packet, bool withPlace) {
    std::ostringstream text;
    if (withPlace) {
        text << packet.position << ' ' << packet.interfaceNumber << ' ';
    }
    text << packet.number << ' ' << packet.linkType << ' ' << packet.interfaceName << ' ' << packet.wireOctets << ' ';
    if (packet.time) {
        text << int{packet.timeDigits} << ' ' << packet.time->seconds << '.' << packet.time->nanoseconds;
    }
    for (const std::string_view comment : packet.comments) {
        text << '#' << comment;
    }
    text << ' ' << std::string_view(reinterpret_cast<const char *>(packet.octets.data()), packet.octets.size());
    return text.str();
}

std::vector<std::string> readAll(CaptureFile capture, bool withPlaces) {
    std::vector<std::string> all;
    CapturedPacket packet;
    try {
        while (capture.next(packet)) {
            all.push_back(told(packet, withPlaces));
        }
    } catch (const CaptureDamage &damage) {
        all.emplace_back(damage.what());
    }
    return all;
}

} // namespace netfloor::test
