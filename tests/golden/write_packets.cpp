// SPDX-License-Identifier: MIT
// Writes the IP packets of captures into one file, from which machines without the capture library can read them:
//
//   write_packets FILE CAPTURE...
//
// A packet comes after its number of octets in four octets, the first the highest.
#include <cstdio>
#include <exception>
#include <fstream>

#include "netfloor-capture/capture_file.h"
#include "netfloor-capture/link_layer.h"

namespace {

void write(std::ofstream &file, std::span<const std::uint8_t> octets) {
    for (int shift = 24; shift >= 0; shift -= 8) {
        file.put(static_cast<char>(octets.size() >> shift & 0xff));
    }
    file.write(reinterpret_cast<const char *>(octets.data()), static_cast<std::streamsize>(octets.size()));
}

void writeCapture(std::ofstream &file, const char *path) {
    netfloor::CaptureFile capture(path);
    try {
        for (netfloor::CapturedPacket packet; capture.next(packet);) {
            const auto part = netfloor::findNetworkPart(packet.linkType, packet.octets);
            if (part.isIp()) {
                write(file, part.octets);
            }
        }
    } catch (const netfloor::CaptureDamage &) {
        return; // what came before is good
    }
}

} // namespace

int main(int count, char **arguments) {
    try {
        std::ofstream file(count < 3 ? "" : arguments[1], std::ios::binary);
        for (int i = 2; i < count; ++i) {
            writeCapture(file, arguments[i]);
        }
        file.close();
        return file ? 0 : 1;
    } catch (const std::exception &error) {
        std::fprintf(stderr, "write_packets: %s\n", error.what());
        return 1;
    }
}
