// SPDX-License-Identifier: MIT
// Writes the IP packets of captures, for programs without the capture library:
//
//   write_packets FILE CAPTURE...      into one file, each after its number of octets in four octets, the first the
//   highest write_packets FOLDER CAPTURE...    into a folder that is there, each into a file of its own
#include <cstdio>
#include <exception>
#include <filesystem>
#include <fstream>
#include <stdexcept>
#include <string>

#include "netfloor-capture/capture_file.h"
#include "netfloor-capture/link_layer.h"

namespace {

class Packets {
public:
    explicit Packets(std::filesystem::path target) : target_(std::move(target)) {
        if (!std::filesystem::is_directory(target_)) {
            file_.open(target_, std::ios::binary);
        }
    }

    void write(std::span<const std::uint8_t> octets) {
        if (!file_.is_open()) {
            std::ofstream file(target_ / std::to_string(++number_), std::ios::binary);
            write(file, octets);
            return;
        }
        for (int shift = 24; shift >= 0; shift -= 8) {
            file_.put(static_cast<char>(octets.size() >> shift & 0xff));
        }
        write(file_, octets);
    }

private:
    void write(std::ofstream &file, std::span<const std::uint8_t> octets) const {
        file.write(reinterpret_cast<const char *>(octets.data()), static_cast<std::streamsize>(octets.size()));
        if (!file.flush()) {
            throw std::runtime_error(target_.string() + " cannot be written");
        }
    }

    std::filesystem::path target_;
    std::ofstream file_; // not open: the target is a folder
    std::size_t number_ = 0;
};

void writeCapture(Packets &packets, const char *path) {
    netfloor::CaptureFile capture(path);
    try {
        for (netfloor::CapturedPacket packet; capture.next(packet);) {
            const auto part = netfloor::findNetworkPart(packet.linkType, packet.octets);
            if (part.isIp()) {
                packets.write(part.octets);
            }
        }
    } catch (const netfloor::CaptureDamage &) {
        return; // what came before is good
    }
}

} // namespace

int main(int count, char **arguments) {
    try {
        if (count < 3) {
            throw std::runtime_error("usage: write_packets FILE|FOLDER CAPTURE...");
        }
        Packets packets(arguments[1]);
        for (int i = 2; i < count; ++i) {
            writeCapture(packets, arguments[i]);
        }
        return 0;
    } catch (const std::exception &error) {
        std::fprintf(stderr, "write_packets: %s\n", error.what());
        return 1;
    }
}
