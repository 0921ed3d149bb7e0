// SPDX-License-Identifier: MIT
#include "printers/tree.h"

#include <algorithm>
#include <string>

#include "netfloor-host/value_text.h"

namespace netfloor::cli {

namespace {

constexpr std::uint32_t addressBits = 128;
constexpr std::uint32_t octetsPerLine = 16; // of data
constexpr std::uint32_t mostDataLines = 4;  // without --all

} // namespace

void Tree::begin(Pass /*pass*/, std::span<const std::uint8_t> packet) {
    packet_ = packet;
    gaps_.reset();
    run_.octets = 0;
    depth_ = 0;
    isReadToCut_ = false;
    isOpenedShown_ = false;
    addressBit_ = 0;
}

void Tree::blockOpened(const BlockView &block) {
    endRun();
    writeGapsBefore(octetOf(block.firstBit), block.depth);
    depth_ = block.depth;
    out_.styledLine(Style::bold, withoutLeadingBlanks(block.name), indent(block.depth));
}

// Inside its callers, as nearly all lines come from here.
[[gnu::always_inline]] inline void Tree::writeField(const FieldView &field, std::uint32_t bits, std::string_view text) {
    addressBit_ = 0;
    if (bits > numberBits) {
        return writeWide(field, bits, text);
    }
    const bool mayBeNamed = bits == bitsPerOctet || bits == 2 * bitsPerOctet; // as types and codes are, no single bits
    if (mayBeNamed && !showsItsNumber(text, field.value)) {
        return writeWithNumber(field, text);
    }
    if (bits_) {
        writeText(field, text);
        return endField(field);
    }
    depth_ = field.depth;
    out_.untrustedLine(shownOf(field, text), indent(field.depth));
}

void Tree::writeWithNumber(const FieldView &field, std::string_view text) {
    writeText(field, text);
    (out_.start(Style::dim) << "  (" << field.value << ')').stop(Style::dim);
    endField(field);
}

void Tree::field(const FieldView &field) {
    if (run_.octets != 0) {
        if (run_.continues(field)) {
            return addToRun(field);
        }
        endRun();
    }
    // First, as after it most fields are written without another call, for which registers would be saved.
    const std::string_view text = field.text.view();
    out_.mayFlush();
    const auto [octets, bits] = extentOf(field);
    const std::uint32_t passed = octetOf(field.cursor);
    writeGapsBefore(bits != 0 ? std::min(octets.first, passed) : passed, field.depth);
    if (bits != 0) {
        gaps_.cover(octets);
        if (opened_ && octets.end > *opened_) {
            return writeOpened(field);
        }
    }
    if (text.empty() && isReadAgain(field)) {
        return;
    }
    if (bits == bitsPerOctet && !all_) {
        run_.begin(field, out_.mark());
    }
    writeField(field, bits, text);
}

void Tree::addToRun(const FieldView &field) {
    const std::uint32_t octet = run_.first + run_.octets;
    gaps_.cover({octet, octet + 1});
    ++run_.octets;
    if (run_.octets < DataRun::least) {
        writeField(field, bitsPerOctet, field.text.view());
    } else if (run_.octets == DataRun::least) {
        out_.takeBack(run_.start);
    }
}

void Tree::endRun() {
    if (run_.isOne()) {
        writeOctets(run_.name, run_.span(), run_.depth);
    }
    run_.octets = 0;
}

bool Tree::isReadAgain(const FieldView &field) const {
    return !all_ && addressBit_ != 0 && field.name == addressName_ && ipv6Address(field, packet_) &&
           field.ranges.front().firstBit == addressBit_;
}

void Tree::writeGaps(std::uint32_t octet, std::uint32_t depth) {
    if (const auto gap = gaps_.before(octet)) {
        newLine(depth);
        out_.start(Style::dim) << "[in no field: ";
        writePlace({gap->firstOctet, gap->firstOctet + gap->octets});
        (out_ << ']').stop(Style::dim) << '\n';
    }
}

void Tree::writePlace(OctetSpan octets) {
    writeOctetNumbers(out_, {firstOctet_ + octets.first, firstOctet_ + octets.end});
}

void Tree::writeOpened(const FieldView &field) {
    if (extentOf(field).octets.first < *opened_) { // it begins with the header of the tunnel
        const std::string_view text = withoutLeadingBlanks(field.text.view());
        newLine(field.depth);
        out_.untrusted(text.empty() ? nameOf(field) : text);
        out_ << '\n';
    }
    if (!isOpenedShown_) {
        isOpenedShown_ = true;
        newLine(field.depth);
        out_.start(Style::dim) << "[shown below: ";
        writePlace({*opened_, static_cast<std::uint32_t>(packet_.size())});
        (out_ << ']').stop(Style::dim) << '\n';
    }
}

void Tree::writeWide(const FieldView &field, std::uint32_t bits, std::string_view text) {
    const auto address = bits == addressBits && field.id != 0 ? ipv6Address(field, packet_) : std::nullopt;
    if (address) {
        addressName_ = field.name;
        addressBit_ = field.ranges.front().firstBit;
        writeText(field, text);
        TextRoom room;
        (out_.start(Style::good) << "  (" << ipv6Text(*address, room) << ')').stop(Style::good);
        return endField(field);
    }
    const bool isPayload = field.id == 0 && !text.empty(); // the host's own line on it
    if (!isPayload) {
        if (const auto octets = unshownOctets(field, bits, text)) {
            return writeOctets(nameOf(field), *octets, field.depth);
        }
    }
    writeText(field, text);
    endField(field);
}

void Tree::writeFieldBits(const FieldView &field) {
    out_.start(Style::dim) << "  [";
    writeBits(out_, field.ranges, firstOctet_ * bitsPerOctet);
    (out_ << ']').stop(Style::dim);
}

// Octets as they stand in the packet.
void Tree::writeOctets(std::string_view name, OctetSpan octets, std::uint32_t depth) {
    const std::uint32_t size = octets.end - octets.first;
    newLine(depth);
    (out_ << name << ": ").count(size, "octet");
    if (bits_) {
        out_.start(Style::dim) << "  [" << (firstOctet_ + octets.first) * bitsPerOctet + 1 << '-'
                               << (firstOctet_ + octets.end) * bitsPerOctet;
        (out_ << ']').stop(Style::dim);
    }
    out_ << '\n';
    const std::uint32_t end = all_ ? octets.end : std::min(octets.end, octets.first + mostDataLines * octetsPerLine);
    for (std::uint32_t line = octets.first; line < end; line += octetsPerLine) {
        out_.mayFlush();
        newLine(depth, 1);
        for (std::uint32_t octet = line; octet < std::min(end, line + octetsPerLine); ++octet) {
            if (octet != line) {
                out_ << ' ';
            }
            out_.octet(packet_[octet]);
        }
        out_ << '\n';
    }
    if (end < octets.end) {
        newLine(depth, 1);
        (out_.start(Style::dim) << "and ").count(octets.end - end, "octet") << " more (--all shows them)";
        out_.stop(Style::dim) << '\n';
    }
}

void Tree::notCaptured(const NotCaptured &first) {
    endRun();
    isReadToCut_ = true;
    newLine(depth_);
    (out_.start(Style::warning) << "[not captured: from '" << first.name << "' on]").stop(Style::warning) << '\n';
}

void Tree::handOff(const HandOff &handOff) {
    endRun();
    newLine(depth_);
    out_.start(Style::dim) << "[handed on under key " << handOff.key;
    if (handOff.protocol != 0) {
        out_ << " of protocol " << handOff.protocol;
    }
    (out_ << ']').stop(Style::dim) << '\n';
}

void Tree::layer(const LayerRecord &layer) {
    endRun();
    out_.mayFlush();
    if (layer.lastBit < layer.firstBit) {
        return;
    }
    newLine(0);
    out_.start(Style::dim) << "[layer " << layer.layerNumber << ", ";
    writePlace({octetOf(layer.firstBit), octetOf(layer.lastBit) + 1});
    (out_ << ']').stop(Style::dim) << '\n';
}

void Tree::end(const PassEnd &end) {
    endRun();
    if (!isReadToCut_) {
        writeGapsBefore(octetOf(end.state.cursor), depth_);
    }
    if (end.bitsLeft != 0 && end.ending == Ending::complete) {
        const std::uint32_t total = static_cast<std::uint32_t>(packet_.size()) * bitsPerOctet;
        out_.start(Style::dim) << "  not decoded: ";
        writePlace({octetOf(total - end.bitsLeft + 1), octetOf(total) + 1});
        out_.stop(Style::dim) << '\n';
    }
    if (end.ending == Ending::cutOff) {
        out_.start(Style::bad) << "  the pass was cut off";
        for (const std::string &name : flagNames(end.state.flags)) {
            out_ << ", " << name;
        }
        out_.stop(Style::bad) << '\n';
    }
}

} // namespace netfloor::cli
