// SPDX-License-Identifier: MIT
#include "support/captures.h"

#include <filesystem>
#include <fstream>
#include <utility>

#include "support/temporary_folder.h"

namespace netfloor::test {

namespace {

Octets le32(std::uint32_t number) {
    Octets octets = be32(number);
    return {octets.rbegin(), octets.rend()};
}

} // namespace

const std::string &folder() {
    static const TemporaryFolder own;
    static const std::string path = own.path().string();
    return path;
}

std::string writeFile(const std::string &name, const Octets &octets) {
    std::string path = folder() + "/" + name;
    std::ofstream(path, std::ios::binary)
        .write(reinterpret_cast<const char *>(octets.data()), static_cast<std::streamsize>(octets.size()));
    return path;
}

std::vector<std::string> testCaptures(const char *where) {
    std::vector<std::string> paths;
    for (const auto &entry : std::filesystem::directory_iterator(where)) {
        if (entry.path().extension() != ".md") {
            paths.push_back(entry.path().string());
        }
    }
    return paths;
}

Octets pcapFile(std::uint32_t linkType, const std::vector<PcapPacket> &packets) {
    Octets file = hex("d4c3b2a1 0200 0400 00000000 00000000 00000400") + le32(linkType);
    std::uint32_t seconds = 1'000'000'000;
    for (const PcapPacket &packet : packets) {
        const auto captured = static_cast<std::uint32_t>(packet.octets.size());
        file = std::move(file) + le32(seconds++) + le32(0) + le32(captured) +
               le32(packet.wireOctets == 0 ? captured : packet.wireOctets) + packet.octets;
    }
    return file;
}

Octets pcapngBlock(std::uint32_t type, const Octets &body) {
    Octets padded = body;
    padded.resize((body.size() + 3) / 4 * 4);
    const Octets size = be32(static_cast<std::uint32_t>(padded.size() + 12));
    return be32(type) + size + padded + size;
}

Octets pcapngSection() {
    return pcapngBlock(0x0a0d0d0a, hex("1a2b3c4d 0001 0000 ffffffffffffffff"));
}

Octets pcapngInterface(std::uint16_t linkType, const Octets &options) {
    return pcapngBlock(1, be16(linkType) + hex("0000 00000000") + options);
}

Octets pcapngPacket(std::uint32_t interfaceNumber, std::uint64_t time, const Octets &octets) {
    const auto size = be32(static_cast<std::uint32_t>(octets.size()));
    return pcapngBlock(6, be32(interfaceNumber) + be32(static_cast<std::uint32_t>(time >> 32U)) +
                              be32(static_cast<std::uint32_t>(time)) + size + size + octets);
}

} // namespace netfloor::test
