// SPDX-License-Identifier: MIT
#include "packet_mutator.h"

#include <algorithm>

#include "inputs.h"

extern "C" std::size_t LLVMFuzzerMutate(std::uint8_t *data, std::size_t size, std::size_t mostOctets);

namespace netfloor::compare {
namespace {

using Span = std::span<std::uint8_t>;

void put16(Span octets, std::size_t at, std::size_t value) {
    octets[at] = static_cast<std::uint8_t>(value >> 8);
    octets[at + 1] = static_cast<std::uint8_t>(value);
}

void fitLengths(Span packet);

// A chunk that reaches past the end ends there.
void fitChunks(Span chunks) {
    while (chunks.size() >= 4) {
        const std::size_t length = std::size_t{chunks[2]} << 8 | chunks[3];
        if (length < 4 || length > chunks.size()) {
            put16(chunks, 2, chunks.size());
            return;
        }
        chunks = chunks.subspan(std::min((length + 3) / 4 * 4, chunks.size()));
    }
}

void fitPayload(std::uint8_t protocol, Span payload) {
    if (protocol == 4 || protocol == 41) {
        fitLengths(payload);
    } else if (protocol == 17 && payload.size() >= 8) {
        put16(payload, 4, payload.size());
    } else if (protocol == 132 && payload.size() > 12) {
        fitChunks(payload.subspan(12));
    }
}

// Makes the lengths of IP, UDP and SCTP those of the octets that are there.
void fitLengths(Span packet) {
    const int version = packet.empty() ? 0 : packet[0] >> 4;
    if (version == 4 && packet.size() >= 20) {
        put16(packet, 2, packet.size());
        const std::size_t header = std::size_t{packet[0] & 0xfu} * 4;
        fitPayload(packet[9], packet.subspan(std::clamp<std::size_t>(header, 20, packet.size())));
    }
    if (version == 6 && packet.size() >= 40) {
        put16(packet, 4, packet.size() - 40);
        fitPayload(packet[6], packet.subspan(40));
    }
}

std::size_t assign(Span room, const test::Octets &packet) {
    const std::size_t size = std::min(room.size(), packet.size());
    std::copy_n(packet.begin(), size, room.begin());
    return size;
}

// Puts a piece of the grammar in, mostly on a border of four octets.
std::size_t insertPart(Span room, std::size_t size, Random &random) {
    test::Octets packet(room.begin(), room.begin() + static_cast<std::ptrdiff_t>(size));
    const test::Octets part = generatedPart(random);
    std::size_t at = random.below(size + 1);
    at = random.oneIn(4) ? at : at / 4 * 4;
    packet.insert(packet.begin() + static_cast<std::ptrdiff_t>(at), part.begin(), part.end());
    return assign(room, packet);
}

std::size_t mutatePacket(Span room, std::size_t size, Random &random) {
    switch (random.below(8)) {
    case 0: size = assign(room, generatedPacket(random)); break;
    case 1:
    case 2: size = insertPart(room, size, random); break;
    case 3: size = random.below(size + 1); break;
    default: size = LLVMFuzzerMutate(room.data(), size, room.size()); break;
    }
    if (!random.oneIn(3)) {
        fitLengths(room.first(size));
    }
    return size;
}

} // namespace

std::size_t mutateInput(std::span<std::uint8_t> room, std::size_t size, std::size_t headOctets, unsigned seed,
                        void (*changeHead)(std::span<std::uint8_t> head, Random &random)) {
    if (size < headOctets || room.size() <= headOctets) {
        const auto head = room.first(std::min(headOctets, room.size()));
        std::ranges::fill(head, std::uint8_t{0});
        return head.size();
    }
    Random random(seed);
    if (random.oneIn(5)) {
        changeHead(room.first(headOctets), random);
        return size;
    }
    return headOctets + mutatePacket(room.subspan(headOctets), size - headOctets, random);
}

} // namespace netfloor::compare
