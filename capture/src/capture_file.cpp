// SPDX-License-Identifier: MIT
#include "netfloor-capture/capture_file.h"

#include <algorithm>
#include <array>
#include <string>
#include <string_view>
#include <utility>

#include "octet_stream.h"
#include "records.h"

namespace netfloor {

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

// Packed files that users give by mistake, and the program that unpacks them.
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

std::unique_ptr<RecordReader> readRecords(OctetStream &stream) {
    const std::string &name = stream.file().name();
    const auto peeked = stream.peek(8);
    const std::string start(peeked.begin(), peeked.end());
    if (start.empty()) {
        throw CaptureError(name + (stream.error().empty() ? " is empty." : ": " + stream.error() + ".") +
                           " Take the capture again, or name another file.");
    }
    for (const Magic &magic : magics) {
        if (start.starts_with(magic.octets)) {
            return magic.format == Format::pcap ? readPcap(stream) : readPcapng(stream);
        }
    }
    for (const Packing &packing : packings) {
        if (start.starts_with(packing.octets)) {
            throw CaptureError(name + " is packed with " + std::string(packing.name) +
                               ". Unpack it on the way: " + std::string(packing.unpack) + " FILE | netfloor -");
        }
    }
    throw CaptureError(name + " is neither a pcap nor a pcapng capture. Other capture formats can be "
                              "converted: editcap -F pcapng FILE NEWFILE");
}

namespace {

// Gives the stream if the file is what it was.
OctetStream &checked(OctetStream &stream, const FileState *before) {
    const FileState now = fileState(stream);
    if (before == nullptr || now == *before) {
        return stream;
    }
    throw CaptureError(stream.file().name() + " is not what it was when it was planned: " +
                       (now.octets != before->octets ? "it had " + std::to_string(before->octets) + " octets and has " +
                                                           std::to_string(now.octets)
                        : now.start != before->start ? "it begins with other octets"
                                                     : "it has another time of change") +
                       ". Plan it again.");
}

} // namespace

// The reader borrows the stream, which must not move with the capture.
struct CaptureFile::Parts {
    explicit Parts(const std::string &path, const FileState *before = nullptr)
        : stream(path), reader(readRecords(checked(stream, before))) {}

    OctetStream stream;
    std::unique_ptr<RecordReader> reader;
};

CaptureFile::CaptureFile(const std::string &path) : parts_(std::make_unique<Parts>(path)) {}
CaptureFile::CaptureFile(const CapturePlan &plan, std::size_t shard)
    : parts_(std::make_unique<Parts>(plan.path, &plan.file)) {
    const Shard &wanted = plan.shards.at(shard);
    RecordReader &reader = *parts_->reader;
    if (wanted.begin.packets != 0) {
        const auto section = std::ranges::find(plan.sections, wanted.begin.section, &SectionBlocks::begin);
        try {
            reader.goTo(wanted.begin, section == plan.sections.end() ? SectionBlocks() : *section);
        } catch (const CaptureDamage &damage) {
            throw CaptureError(damage.what());
        }
    }
    if (plan.damage.empty() || wanted.end) {
        reader.endAt(wanted);
    }
}
CaptureFile::~CaptureFile() = default;
CaptureFile::CaptureFile(CaptureFile &&) noexcept = default;
CaptureFile &CaptureFile::operator=(CaptureFile &&) noexcept = default;

bool CaptureFile::next(CapturedPacket &packet) {
    return parts_->reader->next(packet);
}

bool CaptureFile::isNextHere() const {
    const OctetStream &stream = parts_->stream;
    return !isLive() || parts_->reader->isNextIn(stream.unread()) || !stream.file().isWaiting();
}

const std::string &CaptureFile::name() const {
    return parts_->stream.file().name();
}

std::string CaptureFile::note() const {
    return parts_->reader->note();
}

bool CaptureFile::isLive() const {
    return parts_->stream.file().isLive();
}

std::optional<double> CaptureFile::progress() const {
    return parts_->stream.file().progress();
}

} // namespace netfloor
