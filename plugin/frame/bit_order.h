// SPDX-License-Identifier: MIT
// A part of the grammar in which the bits of each octet are read in reverse order.
#pragma once

#include <algorithm>
#include <cstdint>
#include <cstring>

#include "frame/reader.h"

namespace netfloor::plugin {

struct BitOrderVariables {
    bool copyRestored; // the working copy was restored as a whole since the host last had the packet
};

// Whether the host is told that the bits of a field were reversed.
enum class Report : bool { plain, toldToHost };

// Reverses the working copy from the cursor on as long as it lives, and restores it then from the source, with
// whatever a lower layer has changed in it. The passes that report nothing, where no host has a field to look at
// meanwhile, reverse no more than the one address that is read, and restore the whole once; a host that looks while
// storage grows sees that. In the form that tells the host, fields are reported with a bit order of 8.
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
        reader_.writer.flush(reader_, *reader_.state, reader_.data);
        start_ = (reader_.cursor - 1) / bitsPerOctet;
        end_ = reader_.state->totalBits / bitsPerOctet;
        if (!Pass::reportsFields) {
            // Off an octet border an address reaches into one octet more.
            end_ = std::min(end_, start_ + addressBits / bitsPerOctet + 1);
        }
        reverseOctets(reader_.data, reader_.cursor, end_ * bitsPerOctet);
    }

    // After it the cursor is on a whole octet, counted from the start of the innermost block.
    ~ReversedBits() {
        if (reader_.ended()) {
            return;
        }
        reader_.writer.flush(reader_, *reader_.state, reader_.data);
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
    void restore() {
        bool &copyRestored = reader_.variables().copyRestored;
        const bool whole = Pass::reportsFields || !copyRestored;
        const std::uint32_t from = whole ? 0 : std::min(start_, end_);
        const std::uint32_t to = whole ? reader_.state->totalBits / bitsPerOctet : end_;
        std::memcpy(reader_.data + from, reader_.state->sourceData + from, to - from);
        copyRestored = true;
    }

    Reader<Pass> &reader_;
    std::uint32_t outerOrder_;
    std::uint32_t start_ = 0; // the octets that are reversed
    std::uint32_t end_ = 0;
};

} // namespace netfloor::plugin
