// SPDX-License-Identifier: MIT
// Files that only the tests of this library need.
#pragma once

#include <algorithm>
#include <cstdint>
#include <string>
#include <vector>

#include <zlib.h>

#include "netfloor-capture/capture_file.h"
#include "support/captures.h"

namespace netfloor::test {

// Numbers and headers in one of the two byte orders.
struct Numbers {
    bool bigEndian = true;

    [[nodiscard]] Octets u32(std::uint32_t number) const {
        Octets octets = be32(number);
        if (!bigEndian) {
            std::reverse(octets.begin(), octets.end());
        }
        return octets;
    }
    [[nodiscard]] Octets pcapHead(std::uint32_t magic, std::uint32_t snapOctets, std::uint32_t linkType) const {
        return u32(magic) + (bigEndian ? hex("0002 0004") : hex("0200 0400")) + hex("00*8") + u32(snapOctets) +
               u32(linkType);
    }
};

// `start` and then `part` so many times, packed with gzip into a file in folder(); gives its path.
inline std::string writePacked(const std::string &name, const Octets &start, const Octets &part = {},
                               std::uint32_t times = 0, const Octets &end = {}) {
    std::string path = folder() + "/" + name;
    gzFile file = gzopen(path.c_str(), "wb1");
    const auto write = [&](const Octets &octets) {
        gzwrite(file, octets.data(), static_cast<unsigned>(octets.size()));
    };
    write(start);
    for (std::uint32_t i = 0; i < times; ++i) {
        write(part);
    }
    write(end);
    gzclose(file);
    return path;
}

// What a capture says of a packet. Another capture may have the packet at another place.
[[nodiscard]] std::string told(const CapturedPacket &packet, bool withPlace = false);

// All packets, and what ends them if it is not the end.
[[nodiscard]] std::vector<std::string> readAll(CaptureFile capture, bool withPlaces = false);

} // namespace netfloor::test
