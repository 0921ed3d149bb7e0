// SPDX-License-Identifier: MIT
// The capture library: an input is a capture file. What was read is written again, and what is read from that must be
// the same.
#include <cstdio>
#include <cstdlib>
#include <optional>
#include <string>
#include <vector>

#include "memory_file.h"
#include "netfloor-capture/capture_file.h"
#include "netfloor-capture/capture_writer.h"
#include "netfloor-capture/link_layer.h"
#include "netfloor-capture/time_text.h"

namespace netfloor::fuzz {
namespace {

// What a packet was read as, without what another file need not have alike.
struct Kept {
    int linkType;
    std::uint32_t wireOctets;
    CaptureTime time; // that of the packet before where it has none
    std::vector<std::uint8_t> octets;
    std::string interfaceName;
    std::vector<std::string> comments;
    bool operator==(const Kept &) const = default;
};

void require(bool holds, const char *what) {
    if (!holds) {
        std::fprintf(stderr, "FAULT: %s\n", what);
        std::abort();
    }
}

bool isPrintable(const std::string &text) {
    return text.find_first_not_of("0123456789-.:T Z") == std::string::npos;
}

void check(const CapturedPacket &packet, std::uint64_t number) {
    require(packet.number == number, "packets are not counted one by one");
    require(!packet.time || packet.time->nanoseconds < 1'000'000'000, "a second has too many nanoseconds");
    const NetworkPart part = findNetworkPart(packet.linkType, packet.octets);
    require(part.isIp() == part.other.text().empty(), "IP is named as something else, or the reverse");
    if (part.isIp()) {
        require(part.offset <= packet.octets.size() &&
                    part.octets.data() + part.octets.size() <= packet.octets.data() + packet.octets.size() &&
                    part.octets.data() == packet.octets.data() + part.offset,
                "the IP header is outside the packet");
    }
}

// The packets of a file, up to where it is damaged; also into `copy`, if there is one.
std::vector<Kept> readAll(const std::string &path, CaptureWriter *copy) {
    std::vector<Kept> packets;
    TimeText utc(TimeForm::utc);
    TimeText sinceFirst(TimeForm::sinceFirst);
    CaptureTime time;
    try {
        CaptureFile capture(path);
        for (CapturedPacket packet; capture.next(packet);) {
            check(packet, packets.size() + 1);
            for (TimeText *const text : {&utc, &sinceFirst}) {
                text->see(packet);
                require(isPrintable(text->text(packet)), "a time is no time");
            }
            time = packet.time.value_or(time);
            packets.push_back({packet.linkType,
                               packet.wireOctets,
                               time,
                               {packet.octets.begin(), packet.octets.end()},
                               std::string(packet.interfaceName),
                               {packet.comments.begin(), packet.comments.end()}});
            if (copy != nullptr) {
                copy->write(packet);
            }
        }
    } catch (const CaptureError &) {
        require(packets.empty(), "a file with packets is no capture");
    } catch (const CaptureDamage &) {
        require(copy != nullptr, "a capture that was written is damaged");
    }
    return packets;
}

} // namespace
} // namespace netfloor::fuzz

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size) {
    using namespace netfloor;
    static const fuzz::MemoryFile input;
    static const fuzz::MemoryFile written;
    input.set({data, size});
    CaptureWriter writer(written.path());
    std::vector<fuzz::Kept> packets;
    try {
        packets = fuzz::readAll(input.path(), &writer);
    } catch (const CaptureWriteError &) {
        return 0; // pcapng does not have each link type that pcap has
    }
    writer.finish();
    fuzz::require(packets == fuzz::readAll(written.path(), nullptr), "what was written is not what was read");
    return 0;
}
