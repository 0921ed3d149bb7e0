// SPDX-License-Identifier: MIT
#include "printers/page_tree.h"

#include <algorithm>

#include "netfloor-host/value_text.h"
#include "printers/field_text.h"
#include "text.h"

namespace netfloor::cli {

void PageTree::begin(Pass /*pass*/, std::span<const std::uint8_t> packet) {
    packet_ = packet;
    gaps_.reset();
    run_.octets = 0;
    lastDepth_ = 0;
    isReadToCut_ = false;
    lastOctets_ = {};
}

void PageTree::blockOpened(const BlockView &block) {
    endRun();
    writeGapsBefore(octetOf(block.firstBit), block.depth);
    items_.start(PageItems::Kind::block, depth_ + block.depth, withoutLeadingBlanks(block.name));
    items_.close();
    lastDepth_ = block.depth;
}

void PageTree::field(const FieldView &field) {
    if (run_.continues(field)) {
        return addToRun(field);
    }
    endRun();
    out_.mayFlush();
    const auto octets = octetsOf(field);
    const std::uint32_t passed = octetOf(field.cursor);
    writeGapsBefore(octets ? std::min(octets->first, passed) : passed, field.depth);
    if (octets) {
        gaps_.cover(*octets);
    }
    const OctetSpan span = octets.value_or(OctetSpan{});
    const bool isReadAgain = octets && field.text.view().empty() && span.first == lastOctets_.first &&
                             span.end == lastOctets_.end; // an address, for its key
    lastOctets_ = span;
    if (isReadAgain) {
        return;
    }
    run_.begin(field, out_.mark());
    writeField(field);
}

void PageTree::addToRun(const FieldView &field) {
    const std::uint32_t octet = run_.first + run_.octets;
    gaps_.cover({octet, octet + 1});
    ++run_.octets;
    if (run_.octets < DataRun::least) {
        writeField(field);
    } else if (run_.octets == DataRun::least) {
        out_.takeBack(run_.start);
    }
}

void PageTree::endRun() {
    if (run_.isOne()) {
        writeOctets(PageItems::Kind::field, withoutLeadingBlanks(run_.name), run_.span(), run_.depth);
    }
    run_.octets = 0;
}

void PageTree::writeGapsBefore(std::uint32_t octet, std::uint32_t depth) {
    if (const auto gap = gaps_.before(octet)) {
        writeOctets(PageItems::Kind::note, "in no field", {gap->firstOctet, gap->firstOctet + gap->octets}, depth);
    }
}

// The label is the text up to "=", or all of it.
void PageTree::writeField(const FieldView &field) {
    lastDepth_ = field.depth;
    std::string_view shown = withoutLeadingBlanks(field.text.view());
    shown = shown.empty() ? nameOf(field) : shown;
    const std::size_t equals = shown.find('=');
    items_.start(PageItems::Kind::field, depth_ + field.depth, shown.substr(0, equals));
    items_.value(valueOf(field, equals == std::string_view::npos ? "" : shown.substr(equals + 1)));
    // Some fields are read from their last octet on. Pieces that touch become one.
    for (std::size_t i = 0; i < field.ranges.size();) {
        std::uint32_t first = field.ranges[i].firstBit;
        std::uint32_t last = field.ranges[i].lastBit;
        for (++i; i < field.ranges.size(); ++i) {
            if (field.ranges[i].firstBit == last + 1) {
                last = field.ranges[i].lastBit;
            } else if (field.ranges[i].lastBit + 1 == first) {
                first = field.ranges[i].firstBit;
            } else {
                break;
            }
        }
        items_.bits(octet_ * bitsPerOctet + first, last - first + 1);
    }
    items_.close();
}

std::string_view PageTree::valueOf(const FieldView &field, std::string_view shown) {
    const std::uint32_t bits = bitCount(field.ranges);
    const std::string_view text = field.text.view();
    if (const auto address = ipv6Address(field, packet_)) {
        TextRoom room;
        return text_ = ipv6Text(*address, room);
    }
    if (bits > numberBits) {
        if (const auto octets = unshownOctets(field, bits, text)) {
            return text_ = countText(octets->end - octets->first, "octet");
        }
    }
    shown = withoutLeadingBlanks(shown);
    if ((bits == bitsPerOctet || bits == 2 * bitsPerOctet) && !showsItsNumber(text, field.value)) {
        return text_.assign(shown).append(shown.empty() ? "(" : " (").append(std::to_string(field.value)).append(")");
    }
    return shown;
}

void PageTree::writeOctets(PageItems::Kind kind, std::string_view label, OctetSpan octets, std::uint32_t depth) {
    const std::uint32_t count = octets.end - octets.first;
    items_.start(kind, depth_ + depth, label);
    items_.value(countText(count, "octet"));
    items_.bits((octet_ + octets.first) * bitsPerOctet + 1, count * bitsPerOctet);
    items_.close();
    lastDepth_ = depth;
}

void PageTree::writeNote(PageItems::Kind kind, std::uint32_t depth, std::string_view label, std::string_view text) {
    items_.start(kind, depth_ + depth, label);
    items_.value(text);
    items_.close();
}

void PageTree::notCaptured(const NotCaptured &first) {
    endRun();
    isReadToCut_ = true;
    writeNote(PageItems::Kind::note, lastDepth_, "not captured",
              text_.assign("from '").append(first.name).append("' on"));
}

void PageTree::handOff(const HandOff &handOff) {
    endRun();
    text_.assign("under key ").append(std::to_string(handOff.key));
    if (handOff.protocol != 0) {
        text_.append(" of protocol ").append(std::to_string(handOff.protocol));
    }
    writeNote(PageItems::Kind::note, lastDepth_, "handed on", text_);
}

void PageTree::end(const PassEnd &end) {
    endRun();
    if (!isReadToCut_) {
        writeGapsBefore(octetOf(end.state.cursor), lastDepth_);
    }
    if (end.bitsLeft != 0 && end.ending == Ending::complete && !isReadToCut_) {
        const auto octets = static_cast<std::uint32_t>(packet_.size());
        const std::uint32_t first = octetOf(octets * bitsPerOctet - end.bitsLeft + 1);
        if (first < octets) {
            writeOctets(PageItems::Kind::note, "not decoded", {first, octets}, 0);
        }
    }
    if (end.ending == Ending::cutOff) {
        text_.assign("the host has no room for more of the packet");
        for (const std::string &name : flagNames(end.state.flags)) {
            text_.append(", ").append(name);
        }
        writeNote(PageItems::Kind::damage, 0, "the pass was cut off", text_);
    }
}

} // namespace netfloor::cli
