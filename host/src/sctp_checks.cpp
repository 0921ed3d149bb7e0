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

// The least octets of a chunk, a parameter or a cause with its head, as the RFCs of SCTP give them.
struct ItemLength {
    std::uint32_t type;
    std::size_t octets;
};
constexpr std::array chunkLengths = {
    ItemLength{0, 17},  ItemLength{1, 20},  ItemLength{2, 20},  ItemLength{3, 16},  ItemLength{7, 8},
    ItemLength{12, 8},  ItemLength{13, 8},  ItemLength{15, 8},  ItemLength{16, 20}, ItemLength{64, 20},
    ItemLength{128, 8}, ItemLength{192, 8}, ItemLength{193, 8}, ItemLength{194, 8},
};
constexpr std::array parameterLengths = {
    ItemLength{5, 8},      ItemLength{6, 20},     ItemLength{9, 8},      ItemLength{13, 16},    ItemLength{14, 8},
    ItemLength{15, 8},     ItemLength{16, 12},    ItemLength{17, 12},    ItemLength{18, 12},    ItemLength{0xc001, 8},
    ItemLength{0xc002, 8}, ItemLength{0xc003, 8}, ItemLength{0xc004, 8}, ItemLength{0xc005, 8}, ItemLength{0xc006, 8},
};
// Where a parameter begins that another one holds, or 0.
constexpr std::size_t placeOfInner(std::uint32_t type) {
    switch (type) {
    case 8: return itemHead; // it was not recognised
    case 0xc001:
    case 0xc002:
    case 0xc004: return 2 * itemHead; // an address, after a number
    default: return 0;
    }
}

constexpr std::array causeLengths = {ItemLength{1, 8}, ItemLength{2, 8}, ItemLength{3, 8}, ItemLength{9, 8}};

template <std::size_t count>
std::size_t leastOctets(const std::array<ItemLength, count> &lengths, std::uint32_t type) {
    const auto *const row = std::ranges::find(lengths, type, &ItemLength::type);
    return row == lengths.end() ? itemHead : row->octets;
}

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
    if (end - at < leastOctets(chunkLengths, type)) {
        return damage("SCTP", "chunk # has a length of #, which is too short for its fields", at, type, end - at);
    }
    switch (type) {
    case 1:
    case 2: return sctpParameters(at + 20, end, ParameterPlace::init);
    case 3:
    case 16: return sctpSack(at, end);
    case 4:
    case 5: return sctpParameters(at + itemHead, end, ParameterPlace::chunk);
    case 6:
    case 9: return sctpCauses(at + itemHead, end);
    case 128:
    case 193: return sctpParameters(at + 2 * itemHead, end, ParameterPlace::chunk);
    case 130: return sctpParameters(at + itemHead, end, ParameterPlace::chunk);
    default: return;
    }
}

// Also one with gaps that are not to be renounced.
void PacketWalk::sctpSack(std::size_t at, std::size_t end) {
    const bool isPlain = u8(at) == 3;
    const std::size_t head = isPlain ? 16 : 20;
    const std::size_t gaps = u16(at + 12);
    const std::size_t others = isPlain ? u16(at + 14) : std::size_t{u16(at + 14)} + u16(at + 16);
    if (head + 4 * (gaps + others) != end - at) {
        return damage("SCTP", "the SACK has # octets, and its blocks and duplicates need #", at, end - at,
                      head + 4 * (gaps + others));
    }
    std::uint32_t last = 0;
    for (std::size_t gap = at + head; gap < at + head + 4 * gaps; gap += 4) {
        if (u16(gap) > u16(gap + 2)) {
            return damage("SCTP", "a gap block goes from # to #", gap, u16(gap), u16(gap + 2));
        }
        if (u16(gap) <= last) {
            return note("SCTP", "a gap block begins at #, and the one before ends at #", gap, u16(gap), last);
        }
        last = u16(gap + 2);
    }
}

void PacketWalk::sctpParameters(std::size_t at, std::size_t end, ParameterPlace place) {
    while (at < end) {
        if (at + itemHead > end) {
            return damage("SCTP", "# octets after the last parameter are none", at, end - at);
        }
        const std::uint32_t type = u16(at);
        const std::size_t octets = u16(at + 2);
        if (octets < leastOctets(parameterLengths, type)) {
            return damage("SCTP", "parameter # has a length of #", at, type, octets);
        }
        if (at + octets > end) {
            return damage("SCTP", "parameter # ends # octets after its chunk", at, type, at + octets - end);
        }
        if (const std::size_t inner = placeOfInner(type); inner != 0 && place != ParameterPlace::parameter) {
            sctpParameters(at + inner, at + octets, ParameterPlace::parameter);
        }
        if (place == ParameterPlace::init && padded(octets) != octets && at + padded(octets) < end) {
            add(FaultKind::misread, "SCTP", "the plug-in reads the padding after parameter # as the next one",
                at + octets, type);
        }
        at += padded(octets);
    }
}

void PacketWalk::sctpCauses(std::size_t at, std::size_t end) {
    while (at < end) {
        if (at + itemHead > end) {
            return damage("SCTP", "# octets after the last cause are none", at, end - at);
        }
        const std::size_t octets = u16(at + 2);
        if (octets < leastOctets(causeLengths, u16(at))) {
            return damage("SCTP", "cause # has a length of #", at, u16(at), octets);
        }
        if (at + octets > end) {
            return damage("SCTP", "cause # ends # octets after its chunk", at, u16(at), at + octets - end);
        }
        at += padded(octets);
    }
}

} // namespace netfloor
