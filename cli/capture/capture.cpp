// SPDX-License-Identifier: MIT
#include "capture/capture.h"

#include <algorithm>
#include <array>
#include <string>
#include <string_view>

namespace netfloor::cli {

namespace {

using namespace std::string_view_literals;

enum class Format : std::uint8_t { pcap, pcapng };

struct Magic {
    std::string_view octets;
    Format format;
};

constexpr std::array magics = {
    Magic{"\xa1\xb2\xc3\xd4"sv, Format::pcap},                                            // microseconds
    Magic{"\xd4\xc3\xb2\xa1"sv, Format::pcap}, Magic{"\xa1\xb2\x3c\x4d"sv, Format::pcap}, // nanoseconds
    Magic{"\x4d\x3c\xb2\xa1"sv, Format::pcap}, Magic{"\xa1\xb2\xcd\x34"sv, Format::pcap}, // with longer packet headers
    Magic{"\x34\xcd\xb2\xa1"sv, Format::pcap}, Magic{"\x0a\x0d\x0d\x0a"sv, Format::pcapng},
};

// What users hand over by mistake, and the program that unpacks it.
struct Packing {
    std::string_view octets;
    std::string_view name;
    std::string_view unpack;
};

constexpr std::array packings = {
    Packing{"\x28\xb5\x2f\xfd"sv, "zstd", "zstd -dc"},
    Packing{"\xfd\x37zXZ"sv, "xz", "xz -dc"},
    Packing{"BZh"sv, "bzip2", "bzip2 -dc"},
    Packing{"\x04\x22\x4d\x18"sv, "lz4", "lz4 -dc"},
    Packing{"PK\x03\x04"sv, "zip", "unzip -p"},
};

} // namespace

std::unique_ptr<CaptureReader> openCapture(OctetStream &stream) {
    const auto peeked = stream.peek(8);
    const std::string start(peeked.begin(), peeked.end());
    if (start.empty()) {
        throw CaptureError(stream.name() + (stream.error().empty() ? " is empty." : ": " + stream.error() + ".") +
                           " Take the capture again, or name another file.");
    }
    for (const Magic &magic : magics) {
        if (start.starts_with(magic.octets)) {
            return magic.format == Format::pcap ? openPcap(stream) : openPcapng(stream);
        }
    }
    for (const Packing &packing : packings) {
        if (start.starts_with(packing.octets)) {
            throw CaptureError(stream.name() + " is packed with " + std::string(packing.name) +
                               ". Unpack it on the way: " + std::string(packing.unpack) + " FILE | netfloor -");
        }
    }
    throw CaptureError(stream.name() + " is neither a pcap nor a pcapng capture. Other capture formats can be "
                                       "converted: editcap -F pcapng FILE NEWFILE");
}

CaptureDamage damageAt(const OctetStream &stream, std::uint64_t packetNumber, std::uint64_t firstOctet,
                       const std::string &reason) {
    return CaptureDamage{
        stream.name() + ": " + reason + " in packet " + std::to_string(packetNumber) + ", which begins at octet " +
        std::to_string(firstOctet) + (stream.isPacked() ? " of the unpacked capture" : " of the file") +
        (packetNumber == 1   ? "; there is no whole packet in front of it."
         : packetNumber == 2 ? "; the 1 packet in front of it is whole."
                             : "; the " + std::to_string(packetNumber - 1) + " packets in front of it are whole.")};
}

} // namespace netfloor::cli
