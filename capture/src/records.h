// SPDX-License-Identifier: MIT
// What the readers of the two formats have in common.
#pragma once

#include <algorithm>
#include <bit>
#include <cstdint>
#include <cstring>
#include <memory>
#include <span>
#include <string>
#include <string_view>

#include "netfloor-capture/errors.h"
#include "netfloor-capture/packet.h"
#include "netfloor-capture/shards.h"
#include "octet_stream.h"

namespace netfloor {

class RecordReader {
public:
    RecordReader() = default;
    RecordReader(const RecordReader &) = delete;
    RecordReader &operator=(const RecordReader &) = delete;
    virtual ~RecordReader() = default;

    [[nodiscard]] virtual bool next(CapturedPacket &packet) = 0;

    // The place after the packet that came last, and what its section has described by then.
    [[nodiscard]] virtual ReadingPlace place() const = 0;
    [[nodiscard]] virtual SectionBlocks section() const { return {}; }

    // Goes on at a place that a reader of the same capture gave, with what its section described.
    virtual void goTo(const ReadingPlace &place, const SectionBlocks &section) = 0;
    // Reads no further than the shard goes. What does not fit into it is damage.
    void endAt(const Shard &shard) { shard_ = shard; }

    // Whether these octets, which come next, hold a whole packet.
    [[nodiscard]] virtual bool isNextIn(std::span<const std::uint8_t> octets) const = 0;

    // See CaptureFile::note.
    [[nodiscard]] virtual std::string note() const { return {}; }

protected:
    // Whether the next record, or the end of the capture, is past the shard, of which so many packets have come.
    [[nodiscard]] bool isPastShard(const OctetStream &stream, std::uint64_t packets, bool isAtEnd) const;
    // Throws CaptureDamage for a record of the shard that ends past it.
    void checkFits(const OctetStream &stream, std::uint64_t packets, std::uint64_t octets) const {
        if (shard_ && shard_->end && octets > *shard_->end - stream.position()) {
            throw shardDamage(stream, packets);
        }
    }

private:
    [[nodiscard]] CaptureDamage shardDamage(const OctetStream &stream, std::uint64_t packets) const;

    std::optional<Shard> shard_; // none: the whole capture
};

// Finds out the format. The stream is borrowed.
[[nodiscard]] std::unique_ptr<RecordReader> readRecords(OctetStream &stream);

// What the file is now. Does not take octets.
[[nodiscard]] FileState fileState(OctetStream &stream);

// The formats.
[[nodiscard]] std::unique_ptr<RecordReader> readPcap(OctetStream &stream);
[[nodiscard]] std::unique_ptr<RecordReader> readPcapng(OctetStream &stream);

// Numbers in octets of a known byte order.
class NumberView {
public:
    NumberView(std::span<const std::uint8_t> octets, bool bigEndian)
        : octets_(octets), swaps_(bigEndian != (std::endian::native == std::endian::big)) {}

    [[nodiscard]] std::size_t size() const { return octets_.size(); }
    [[nodiscard]] std::uint8_t u8(std::size_t offset) const { return octets_[offset]; }
    [[nodiscard]] std::uint16_t u16(std::size_t offset) const {
        const auto number = raw<std::uint16_t>(offset);
        return swaps_ ? __builtin_bswap16(number) : number;
    }
    [[nodiscard]] std::uint32_t u32(std::size_t offset) const {
        const auto number = raw<std::uint32_t>(offset);
        return swaps_ ? __builtin_bswap32(number) : number;
    }
    [[nodiscard]] NumberView from(std::size_t offset) const {
        NumberView rest = *this;
        rest.octets_ = octets_.subspan(offset);
        return rest;
    }
    [[nodiscard]] std::string_view text(std::size_t offset, std::size_t size) const {
        return {reinterpret_cast<const char *>(octets_.data() + offset), size};
    }
    [[nodiscard]] std::uint64_t u64(std::size_t offset) const {
        const auto number = raw<std::uint64_t>(offset);
        return swaps_ ? __builtin_bswap64(number) : number;
    }

private:
    template <typename Number>
    [[nodiscard]] Number raw(std::size_t offset) const {
        Number number = 0;
        std::memcpy(&number, octets_.data() + offset, sizeof number);
        return number;
    }

    std::span<const std::uint8_t> octets_;
    bool swaps_;
};

// The most octets that a packet can have been captured with; a length above it is damage. Some programs write a snap
// length of 0 or of all bits for "any".
constexpr std::uint32_t mostPacketOctets = std::uint32_t{16} * 1024 * 1024;
constexpr std::uint32_t usualSnapOctets = 262144;
[[nodiscard]] constexpr std::uint32_t mostOctetsFor(std::uint32_t snapOctets) {
    return snapOctets == 0 ? mostPacketOctets : std::clamp(snapOctets, usualSnapOctets, mostPacketOctets);
}

// "NAME: REASON in packet 7, which begins at octet 910 ..."; `packetNumber` is the number of the lost packet.
[[nodiscard]] CaptureDamage damageAt(const OctetStream &stream, std::uint64_t packetNumber, std::uint64_t position,
                                     const std::string &reason);

// The same where the capture ends too early.
[[nodiscard]] CaptureDamage cutAt(const OctetStream &stream, std::uint64_t packetNumber, std::uint64_t position);

} // namespace netfloor
