// SPDX-License-Identifier: MIT
// The checks of SCTP.
#include <algorithm>
#include <array>

#ifdef NETFLOOR_HAS_CRC32C
#include <isa-l/crc.h>
#endif

#include "packet_walk.h"

namespace netfloor {

namespace {

constexpr std::size_t commonHeader = 12;
constexpr std::size_t itemHead = 4; // of a chunk, a parameter or a cause

std::size_t padded(std::size_t octets) {
    return (octets + 3) & ~std::size_t{3};
}

// The least octets of the chunk types from 0 on.
constexpr std::array<std::size_t, 15> leastChunk = {17, 20, 20, 16, 4, 4, 4, 8, 4, 4, 4, 4, 8, 8, 4};

#ifdef NETFLOOR_HAS_CRC32C
std::uint32_t crc32c(std::uint32_t start, std::span<const std::uint8_t> octets) {
    // The library reads through a pointer that is not const.
    return ::crc32_iscsi(const_cast<unsigned char *>(octets.data()), static_cast<int>(octets.size()), start); // NOLINT
}

// RFC 2960 had this one (RFC 1950).
std::uint32_t adler32(std::span<const std::uint8_t> head, std::span<const std::uint8_t> rest) {
    constexpr std::uint32_t base = 65521;
    std::uint32_t low = 1;
    std::uint32_t high = 0;
    const auto add = [&](std::uint8_t octet) {
        low = (low + octet) % base;
        high = (high + low) % base;
    };
    std::ranges::for_each(head, add);
    for (int i = 0; i < 4; ++i) {
        add(0);
    }
    std::ranges::for_each(rest, add);
    return high << 16U | low;
}
#endif

} // namespace

void PacketWalk::sctp(const Payload &payload) {
    if (!hasHeader("SCTP", payload.at, payload.end, commonHeader)) {
        return;
    }
    sctpChecksum(payload);
    if (payload.isFragment) {
        return;
    }
    std::size_t at = payload.at + commonHeader;
    while (at < payload.end) {
        if (!hasHeader("SCTP chunk", at, payload.end, itemHead)) {
            return;
        }
        const std::size_t octets = u16(at + 2);
        if (octets < itemHead) {
            return damage("SCTP", "chunk # has a length of #", at, u8(at), octets);
        }
        if (at + octets > payload.end) {
            return damage("SCTP", "chunk # ends # octets after the packet", at, u8(at), at + octets - payload.end);
        }
        if (has(at, octets)) {
            sctpChunk(at, at + octets);
        }
        const std::size_t next = at + padded(octets);
        if (u8(at) != 0 && padded(octets) != octets && next < payload.end) {
            add(FaultKind::misread, "SCTP", "the plug-in reads the padding after chunk # as the next chunk",
                at + octets, u8(at));
        }
        at = next;
    }
}

void PacketWalk::sctpChecksum(const Payload &payload) {
    if (payload.isFragment || !has(payload.at, payload.end - payload.at)) {
        return;
    }
#ifndef NETFLOOR_HAS_CRC32C
    note("SCTP", "the checksum is not checked: this build has no CRC-32c", payload.at + 8);
#else
    constexpr std::array<std::uint8_t, 4> zero = {};
    const std::size_t field = payload.at + 8;
    const auto head = part(payload.at, field);
    const auto rest = part(payload.at + commonHeader, payload.end);
    const std::uint32_t computed = ~crc32c(crc32c(crc32c(~std::uint32_t{0}, head), zero), rest);
    const std::uint32_t stored = u32(field);
    if (stored == __builtin_bswap32(computed)) {
        return;
    }
    if (stored == 0) {
        return note("SCTP", "the checksum is left to the network card", field);
    }
    if (stored == adler32(head, rest)) {
        return note("SCTP", "the checksum is the one of RFC 2960, Adler-32", field);
    }
    damage("SCTP", "the checksum is wrong", field);
#endif
}

void PacketWalk::sctpChunk(std::size_t at, std::size_t end) {
    const std::uint32_t type = u8(at);
    const std::size_t octets = end - at;
    if (type < leastChunk.size() && octets < leastChunk[type]) {
        return damage("SCTP", "chunk # has a length of #, which is too short for its fields", at, type, octets);
    }
    switch (type) {
    case 1:
    case 2:
        return sctpItems(at + 20, end, "parameter # has a length of #", "parameter # ends # octets after its chunk",
                         true);
    case 3: {
        const std::size_t listed = 16 + 4 * (std::size_t{u16(at + 12)} + u16(at + 14));
        if (listed != octets) {
            damage("SCTP", "the SACK has # octets, and its blocks and duplicates need #", at, octets, listed);
        }
        return;
    }
    case 6:
    case 9:
        return sctpItems(at + itemHead, end, "cause # has a length of #", "cause # ends # octets after its chunk",
                         false);
    default: return;
    }
}

void PacketWalk::sctpItems(std::size_t at, std::size_t end, std::string_view tooShort, std::string_view tooLong,
                           bool arePadded) {
    while (at < end) {
        if (at + itemHead > end) {
            return damage("SCTP", "# octets after the last parameter or cause are none", at, end - at);
        }
        const std::size_t octets = u16(at + 2);
        if (octets < itemHead) {
            return damage("SCTP", tooShort, at, u16(at), octets);
        }
        if (at + octets > end) {
            return damage("SCTP", tooLong, at, u16(at), at + octets - end);
        }
        if (arePadded && padded(octets) != octets && at + padded(octets) < end) {
            add(FaultKind::misread, "SCTP", "the plug-in reads the padding after parameter # as the next one",
                at + octets, u16(at));
        }
        at += padded(octets);
    }
}

} // namespace netfloor
