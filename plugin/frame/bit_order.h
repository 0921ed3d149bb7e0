// SPDX-License-Identifier: MIT
// Addresses that are read with the bits of each octet reversed.
//
// The working copy is reversed from the address up to the end of the packet, and restored from the source afterwards. A
// host sees that where it is called in between: as the address is reported, and as storage grows. The grammar itself
// reads the octets as they are, so that nothing is reversed where no call comes: a packet can hold 3,000 addresses, and
// 16,000 that do not fit.
#pragma once

#include <algorithm>
#include <array>
#include <cstdint>
#include <cstring>

#include "frame/reader.h"

namespace netfloor::plugin {

struct BitOrderVariables {
    std::uint32_t reversedFrom;     // bit at which an address of reversed bits starts; 0 outside
    bool copyRestored;              // the working copy is the source, as far as the host has not had the packet since
    bool copyReversed;              // it is reversed, for a report
    const std::uint8_t *keptPacket; // the packet that is kept reversed, and its octets; null: none
    std::uint32_t keptOctets;
};

enum class Report : bool { plain, toldToHost };

// The octets of a packet with their bits reversed, so that they are reversed once for all addresses. As many as the
// length of an IP header can tell; of a longer packet none are kept.
template <class Pass>
struct ReversedPacket {
    static constexpr std::uint32_t most = 40 + 65535;
    static inline constinit std::array<std::uint8_t, most> octets{};
};

// Reverses the working copy for the report of an address.
template <class Pass>
void reverseForReport(Reader<Pass> &reader) {
    const DecodeState &state = *reader.state;
    BitOrderVariables &variables = reader.variables();
    variables.copyReversed = true;
    const std::uint32_t start = (variables.reversedFrom - 1) / bitsPerOctet;
    const std::uint32_t end = state.totalBits / bitsPerOctet;
    const bool isSource =
        variables.copyRestored || std::memcmp(reader.data + start, state.sourceData + start, end - start) == 0;
    if (!isSource || !onOctetBorder(variables.reversedFrom) || end > ReversedPacket<Pass>::most) {
        return reverseOctets(reader.data, variables.reversedFrom, state.totalBits);
    }
    std::uint8_t *const reversed = ReversedPacket<Pass>::octets.data();
    if (variables.keptPacket != state.sourceData || variables.keptOctets != end) {
        copyWithBitsReversed(reversed, state.sourceData, end);
        variables.keptPacket = state.sourceData;
        variables.keptOctets = end;
    }
    std::memcpy(reader.data + start, reversed + start, end - start);
}

// Off an octet border the last octet may reach into one that the packet holds in part. That one is not reversed, and so
// the address shows it reversed.
inline void reverseLastOctet(FieldRecord &record) {
    std::uint32_t &group = record.ranges[addressGroupCount - 1].value;
    const std::uint32_t change = (group & 0xff) ^ reversedOctets[group & 0xff];
    group ^= change;
    record.value ^= change;
}

// Completes the record of an address that was read at `start`, and reverses the working copy where the host is told.
template <class Pass>
void finishReversedAddress(Reader<Pass> &reader, std::uint32_t start) {
    if (!onOctetBorder(start) && (start - 1 + addressBits) / bitsPerOctet >= reader.state->totalBits / bitsPerOctet) {
        reader.writer.flush(reader, *reader.state, reader.data);
        reverseLastOctet(reader.state->fieldRecord);
    }
    if constexpr (Pass::reportsFields) {
        reverseForReport(reader);
    }
}

// An address of reversed bits starts at the cursor, as long as this lives. In the form that tells the host, fields are
// reported with a bit order of 8.
template <class Pass>
class [[nodiscard]] ReversedBits {
public:
    ReversedBits(Reader<Pass> &reader, Report report) : reader_(reader), outerOrder_(reader.bitOrder) {
        if (reader_.ended()) {
            return;
        }
        if (report == Report::toldToHost) {
            reader_.bitOrder = bitsPerOctet;
        }
        reader_.variables().reversedFrom = reader_.cursor;
    }

    // After the address the cursor stands on a whole octet, counted from the start of the innermost block.
    ~ReversedBits() {
        if (reader_.ended()) {
            return;
        }
        restore();
        const std::uint32_t blockStart = reader_.state->blockStarts.base[reader_.blockDepth];
        if (const std::uint32_t odd = (reader_.cursor - blockStart) % bitsPerOctet; odd != 0) {
            const std::uint32_t rest = std::min(bitsPerOctet - odd, reader_.left);
            reader_.cursor += rest;
            reader_.left -= rest;
        }
        reader_.bitOrder = outerOrder_;
    }

    ReversedBits(const ReversedBits &) = delete;
    ReversedBits &operator=(const ReversedBits &) = delete;

private:
    // The first address restores all octets, as a lower layer may have changed any of them.
    void restore() {
        BitOrderVariables &variables = reader_.variables();
        const DecodeState &state = *reader_.state;
        const std::uint32_t end = state.totalBits / bitsPerOctet;
        if (!variables.copyRestored) {
            reader_.writer.flush(reader_, *reader_.state, reader_.data);
            std::memcpy(reader_.data, state.sourceData, end);
        } else if (variables.copyReversed) {
            const std::uint32_t start = (variables.reversedFrom - 1) / bitsPerOctet;
            std::memcpy(reader_.data + start, state.sourceData + start, end - start);
        }
        variables.reversedFrom = 0;
        variables.copyRestored = true;
        variables.copyReversed = false;
    }

    Reader<Pass> &reader_;
    std::uint32_t outerOrder_;
};

} // namespace netfloor::plugin
