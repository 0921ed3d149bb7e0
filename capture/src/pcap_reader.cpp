// SPDX-License-Identifier: MIT
// pcap files (draft-ietf-opsawg-pcap). libpcap does not read them here: it copies each packet and gives no positions,
// and a program without a filter starts faster without it.
#include "records.h"

namespace netfloor {

namespace {

constexpr std::size_t fileHeaderOctets = 24;

constexpr std::uint32_t magicMicroseconds = 0xa1b2c3d4;
constexpr std::uint32_t magicNanoseconds = 0xa1b23c4d;
constexpr std::uint32_t magicLongRecords = 0xa1b2cd34; // microseconds, and 8 more octets in each record's header

bool isMagic(std::uint32_t number) {
    return number == magicMicroseconds || number == magicNanoseconds || number == magicLongRecords;
}

class PcapReader final : public RecordReader {
public:
    explicit PcapReader(OctetStream &stream) : stream_(stream) {
        const auto octets = stream.peek(fileHeaderOctets);
        if (octets.size() < fileHeaderOctets) {
            refuse("it ends after " + std::to_string(octets.size()) + " octets");
        }
        bigEndian_ = !isMagic(NumberView(octets, false).u32(0));
        const NumberView header(octets, bigEndian_);
        const std::uint32_t magic = header.u32(0);
        nanosecondsPerUnit_ = magic == magicNanoseconds ? 1 : 1000;
        headOctets_ = magic == magicLongRecords ? 24 : 16;
        if (header.u16(4) < 2) {
            refuse("version " + std::to_string(header.u16(4)) + "." + std::to_string(header.u16(6)) +
                   " of the format has no known form");
        }
        swaps_ = header.u16(4) == 2 && header.u16(6) < 3;
        maySwap_ = header.u16(4) == 2 && header.u16(6) == 3;
        most_ = mostOctetsFor(header.u32(16));
        linkType_ = static_cast<int>(header.u32(20) & 0x03ffffffU); // above it: the length of a frame check sequence
        stream.take(fileHeaderOctets);
    }

    bool next(CapturedPacket &packet) override {
        const std::uint64_t position = stream_.position();
        const auto octets = stream_.peek(headOctets_);
        if (isPastShard(stream_, number_, octets.empty() && stream_.error().empty())) {
            return false;
        }
        if (octets.size() < headOctets_) {
            throw cutAt(stream_, number_ + 1, position);
        }
        const NumberView head(octets, bigEndian_);
        const std::uint32_t seconds = head.u32(0);
        const std::uint32_t units = head.u32(4);
        const auto [captured, onWire] = lengthsIn(head);
        if (captured > most_) {
            throw damageAt(stream_, number_ + 1, position,
                           "a length of " + std::to_string(captured) + " octets, where " + std::to_string(most_) +
                               " is the limit,");
        }
        checkFits(stream_, number_, headOctets_ + captured);
        const auto record = stream_.peek(headOctets_ + captured);
        if (record.size() < headOctets_ + captured) {
            throw cutAt(stream_, number_ + 1, position);
        }
        stream_.take(record.size());
        packet.number = ++number_;
        packet.position = position;
        packet.time = timeOf(seconds, units);
        packet.timeDigits = nanosecondsPerUnit_ == 1 ? 9 : 6;
        packet.interfaceNumber = 0;
        packet.linkType = linkType_;
        packet.wireOctets = onWire;
        packet.octets = record.subspan(headOctets_);
        packet.interfaceName = {};
        packet.comments = {};
        return true;
    }

    [[nodiscard]] ReadingPlace place() const override { return {.position = stream_.position(), .packets = number_}; }

    void goTo(const ReadingPlace &place, const SectionBlocks & /*section*/) override {
        stream_.seek(place.position);
        number_ = place.packets;
    }

    [[nodiscard]] bool isNextIn(std::span<const std::uint8_t> octets) const override {
        if (octets.size() < headOctets_) {
            return false;
        }
        return octets.size() - headOctets_ >= lengthsIn({octets, bigEndian_}).captured;
    }

private:
    struct Lengths {
        std::uint32_t captured;
        std::uint32_t onWire;
    };

    // Old versions have the two in the other order.
    [[nodiscard]] Lengths lengthsIn(const NumberView &head) const {
        Lengths lengths = {head.u32(8), head.u32(12)};
        if (swaps_ || (maySwap_ && lengths.captured > lengths.onWire)) {
            std::swap(lengths.captured, lengths.onWire);
        }
        return lengths;
    }

    [[noreturn]] void refuse(const std::string &reason) const {
        throw CaptureError(stream_.file().name() + " has no usable capture header: " + reason +
                           ". Take the capture again, or name another file.");
    }

    // Some programs write a second or more into the fraction.
    [[nodiscard]] CaptureTime timeOf(std::uint32_t seconds, std::uint32_t units) const {
        const std::uint64_t fraction = std::uint64_t{units} * nanosecondsPerUnit_;
        if (fraction < nanosecondsPerSecond) {
            return {seconds, static_cast<std::uint32_t>(fraction)};
        }
        return {static_cast<std::int64_t>(seconds + fraction / nanosecondsPerSecond),
                static_cast<std::uint32_t>(fraction % nanosecondsPerSecond)};
    }

    OctetStream &stream_;
    std::uint64_t number_ = 0;
    std::size_t headOctets_ = 16;
    std::uint32_t nanosecondsPerUnit_ = 1000;
    std::uint32_t most_ = mostPacketOctets;
    int linkType_ = 0;
    bool bigEndian_ = false;
    bool swaps_ = false;
    bool maySwap_ = false;
};

} // namespace

std::unique_ptr<RecordReader> readPcap(OctetStream &stream) {
    return std::make_unique<PcapReader>(stream);
}

} // namespace netfloor
