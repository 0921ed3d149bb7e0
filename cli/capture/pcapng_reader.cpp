// SPDX-License-Identifier: MIT
// pcapng files (draft-ietf-opsawg-pcapng). They are not left to libpcap because it gives up a file, before its
// first packet, whose interfaces differ in link type or snap length, as captures on "any" and merged captures do.
#include <algorithm>
#include <cmath>
#include <string>
#include <vector>

#include <pcap/dlt.h>

#include "capture/capture.h"

namespace netfloor::cli {

namespace {

constexpr std::uint32_t sectionHeader = 0x0a0d0d0a;
constexpr std::uint32_t interfaceDescription = 1;
constexpr std::uint32_t packetBlock = 2; // obsolete, still found
constexpr std::uint32_t simplePacket = 3;
constexpr std::uint32_t enhancedPacket = 6;

constexpr std::uint16_t optionTimeResolution = 9;
constexpr std::uint16_t optionTimeOffset = 14;

constexpr std::uint32_t mostBlockOctets = 2 * mostPacketOctets;
constexpr std::uint16_t linkTypeRaw = 101; // its number in files; DLT_RAW differs between systems

// A reader over one block's body, in the byte order of its section.
class BlockBody {
public:
    BlockBody(std::span<const std::uint8_t> octets, bool bigEndian) : octets_(octets), bigEndian_(bigEndian) {}

    [[nodiscard]] std::size_t size() const { return octets_.size(); }

    [[nodiscard]] std::uint32_t number(std::size_t offset, std::size_t width) const {
        std::uint32_t value = 0;
        for (std::size_t i = 0; i < width; ++i) {
            value = value << 8U | octets_[offset + (bigEndian_ ? i : width - 1 - i)];
        }
        return value;
    }
    [[nodiscard]] std::uint16_t u16(std::size_t offset) const { return static_cast<std::uint16_t>(number(offset, 2)); }
    [[nodiscard]] std::uint32_t u32(std::size_t offset) const { return number(offset, 4); }
    [[nodiscard]] std::uint64_t u64(std::size_t offset) const {
        const std::uint64_t first = u32(offset);
        const std::uint64_t second = u32(offset + 4);
        return bigEndian_ ? first << 32U | second : second << 32U | first;
    }
    [[nodiscard]] std::span<const std::uint8_t> part(std::size_t offset, std::size_t size) const {
        return octets_.subspan(offset, size);
    }

private:
    std::span<const std::uint8_t> octets_;
    bool bigEndian_;
};

struct Interface {
    int linkType = 0;
    std::uint32_t snapOctets = 0;
    std::uint8_t timeResolution = 6; // 10 to the minus this, or 2 to the minus this with the top bit set
    std::int64_t timeOffset = 0;     // seconds

    [[nodiscard]] CaptureTime timeOf(std::uint64_t units) const {
        const unsigned exponent = timeResolution & 0x7fU;
        const long double unitsPerSecond =
            (timeResolution & 0x80U) != 0 ? std::pow(2.0L, exponent) : std::pow(10.0L, exponent);
        // Resolutions that 64 bits can hold are exact; finer ones have no whole second in 64 bits.
        if (unitsPerSecond > 1e19L) {
            return {timeOffset, 0};
        }
        const auto perSecond = static_cast<std::uint64_t>(unitsPerSecond);
        const long double fraction = static_cast<long double>(units % perSecond) / unitsPerSecond;
        const auto nanoseconds = static_cast<std::uint32_t>(std::lround(std::floor(fraction * 1e9L + 0.01L)));
        return {static_cast<std::int64_t>(units / perSecond) + timeOffset, nanoseconds};
    }
};

Interface readInterface(const BlockBody &body) {
    Interface result;
    const std::uint16_t linkType = body.u16(0);
    result.linkType = linkType == linkTypeRaw ? DLT_RAW : linkType;
    result.snapOctets = body.u32(4);
    for (std::size_t at = 8; at + 4 <= body.size();) {
        const std::uint16_t code = body.u16(at);
        const std::uint16_t size = body.u16(at + 2);
        at += 4;
        if (code == 0 || at + size > body.size()) {
            break;
        }
        if (code == optionTimeResolution && size >= 1) {
            result.timeResolution = body.part(at, 1)[0];
        } else if (code == optionTimeOffset && size >= 8) {
            result.timeOffset = static_cast<std::int64_t>(body.u64(at));
        }
        at += (size + 3U) & ~std::size_t{3};
    }
    return result;
}

class PcapngReader final : public CaptureReader {
public:
    explicit PcapngReader(OctetStream &stream) : stream_(stream) {
        // The digits of all time stamps follow from the first interface that is described.
        while (!atEnd_ && interfaces_.empty() && pending_ == 0) {
            try {
                pending_ = readBlock();
            } catch (const CaptureDamage &damage) {
                throw CaptureError(std::string(damage.what()) + " Take the capture again, or name another file.");
            }
        }
        if (!interfaces_.empty()) {
            timeDigits_ = (interfaces_.front().timeResolution & 0x7fU) > 6 ? 9 : 6;
        }
    }

    bool next(CapturedPacket &packet) override {
        while (!atEnd_) {
            const std::uint32_t type = pending_ != 0 ? pending_ : readBlock();
            pending_ = 0;
            if (type == enhancedPacket || type == packetBlock || type == simplePacket) {
                takePacket(type, packet);
                packet.number = ++number_;
                return true;
            }
        }
        return false;
    }

    [[nodiscard]] int timeDigits() const override { return timeDigits_; }

private:
    [[nodiscard]] CaptureDamage damage(const std::string &reason) const {
        return damageAt(stream_, number_ + 1, blockStart_, reason);
    }

    [[nodiscard]] CaptureDamage cut() const {
        if (!stream_.error().empty()) {
            return damage(stream_.error());
        }
        return damage("the capture is cut off at octet " + std::to_string(stream_.position()) + ",");
    }

    // Reads one block into block_. Sections and interfaces are taken note of here. Returns its type, or 0 for
    // a block that is no packet.
    std::uint32_t readBlock() {
        blockStart_ = stream_.position();
        const auto start = stream_.peek(12);
        if (start.empty() && stream_.error().empty()) {
            atEnd_ = true;
            return 0;
        }
        if (start.size() < 12) {
            throw cut();
        }
        // The first word of a section header reads the same in both orders; the third tells the order.
        const bool isSection = BlockBody(start, true).u32(0) == sectionHeader;
        if (isSection) {
            const std::uint32_t order = BlockBody(start, true).u32(8);
            if (order != 0x1a2b3c4d && order != 0x4d3c2b1a) {
                throw damage("a section header without a byte order");
            }
            bigEndian_ = order == 0x1a2b3c4d;
            interfaces_.clear();
        }
        const BlockBody head(start, bigEndian_);
        const std::uint32_t type = head.u32(0);
        const std::uint32_t size = head.u32(4);
        if (size < 12 || size % 4 != 0 || size > mostBlockOctets) {
            throw damage("a block of " + std::to_string(size) + " octets");
        }
        block_.resize(size);
        if (stream_.read(block_) != size) {
            throw cut();
        }
        if (BlockBody(block_, bigEndian_).u32(size - 4) != size) {
            throw damage("a block whose two lengths differ");
        }
        if (type == interfaceDescription) {
            if (body().size() < 8) {
                throw damage("an interface description that is too short");
            }
            interfaces_.push_back(readInterface(body()));
        }
        const bool isPacket = type == enhancedPacket || type == packetBlock || type == simplePacket;
        return isPacket ? type : 0;
    }

    [[nodiscard]] BlockBody body() const { return {std::span(block_).subspan(8, block_.size() - 12), bigEndian_}; }

    void takePacket(std::uint32_t type, CapturedPacket &packet) {
        const BlockBody block = body();
        const std::size_t headOctets = type == simplePacket ? 4 : 20;
        if (block.size() < headOctets) {
            throw damage("a packet block that is too short");
        }
        const std::uint32_t which = type == simplePacket ? 0 : type == packetBlock ? block.u16(0) : block.u32(0);
        if (which >= interfaces_.size()) {
            throw damage("an interface that is not described");
        }
        const Interface &from = interfaces_[which];
        std::uint32_t captured = 0;
        if (type == simplePacket) {
            packet.time.reset();
            packet.wireOctets = block.u32(0);
            captured =
                std::min<std::uint32_t>(packet.wireOctets, static_cast<std::uint32_t>(block.size() - headOctets));
            if (from.snapOctets != 0) {
                captured = std::min(captured, from.snapOctets);
            }
        } else {
            packet.time = from.timeOf(std::uint64_t{block.u32(4)} << 32U | block.u32(8));
            captured = block.u32(12);
            packet.wireOctets = block.u32(16);
        }
        if (captured > block.size() - headOctets) {
            throw damage("a packet larger than its block");
        }
        packet.linkType = from.linkType;
        packet.octets = block.part(headOctets, captured);
    }

    OctetStream &stream_;
    std::vector<Interface> interfaces_; // of the section
    std::vector<std::uint8_t> block_;
    std::uint64_t blockStart_ = 0;
    std::uint64_t number_ = 0;
    std::uint32_t pending_ = 0; // type of a packet block that was read, and not yet given out
    int timeDigits_ = 6;
    bool bigEndian_ = false;
    bool atEnd_ = false;
};

} // namespace

std::unique_ptr<CaptureReader> openPcapng(OctetStream &stream) {
    return std::make_unique<PcapngReader>(stream);
}

} // namespace netfloor::cli
