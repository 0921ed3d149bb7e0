// SPDX-License-Identifier: MIT
#include "printers/json_fields.h"

#include "json_text.h"
#include "netfloor-host/inner_packets.h"
#include "netfloor-host/value_text.h"
#include "printers/field_text.h"
#include "text.h"

namespace netfloor::cli {

namespace {

constexpr std::uint32_t leastRun = 5; // fewer octets of data are a field each

bool isOneOctet(const FieldView &field) {
    return field.ranges.size() == 1 && field.ranges[0].firstBit % bitsPerOctet == 1 &&
           field.ranges[0].lastBit - field.ranges[0].firstBit + 1 == bitsPerOctet;
}

} // namespace

void JsonFields::write(const PacketInput &packet) {
    isFirst_ = true;
    if (!packet.network.isIp()) {
        return;
    }
    RunOptions options = packet.runOptions();
    for (InnerPackets at(packet.network.octets, options.wireOctets); !at.ended(); at.next()) {
        packet_ = at.octets();
        offset_ = at.firstOctet();
        options.wireOctets = at.wireOctets();
        host_.run(Pass::md, packet_, *this, options);
    }
}

void JsonFields::field(const FieldView &field) {
    const bool continues = continuesRun(field);
    if (continues && ++run_.octets >= leastRun) {
        if (run_.octets == leastRun) {
            out_.takeBack(run_.value);
        }
        return;
    }
    if (!continues) {
        endRun();
        out_.mayFlush();
    }
    const FieldDescription *const description = tables_.find(field.id);
    out_ << (isFirst_ ? "{\"id\":" : ",{\"id\":") << field.id << ",\"name\":";
    isFirst_ = false;
    writeJsonText(out_, withoutLeadingBlanks(field.name));
    if (const std::string_view block = withoutLeadingBlanks(field.blockName.view()); !block.empty()) {
        out_ << ",\"block\":";
        writeJsonText(out_, block);
    }
    if (!continues && isOneOctet(field)) {
        run_ = {field.id, field.name, (field.ranges[0].firstBit - 1) / bitsPerOctet, 1, out_.mark()};
    }
    writeValue(field, description);
    const std::uint32_t bits = bitCount(field.ranges);
    const std::string_view text = withoutLeadingBlanks(field.text.view());
    const bool repeatsValue = bits > numberBits && unshownOctets(field, bits, text);
    if (!text.empty() && !repeatsValue) {
        out_ << ",\"text\":";
        writeJsonText(out_, text);
    }
    const auto octets = octetsOf(field);
    if (bits > numberBits && (octets->end - octets->first) * bitsPerOctet == bits) {
        writeBits(*octets); // which may be read from the last one on
    } else {
        writeBits(field.ranges);
    }
}

void JsonFields::end(const PassEnd & /*end*/) {
    endRun();
}

bool JsonFields::continuesRun(const FieldView &field) const {
    return run_.octets != 0 && field.id == run_.id && isOneOctet(field) &&
           (field.ranges[0].firstBit - 1) / bitsPerOctet == run_.first + run_.octets && field.name == run_.name;
}

void JsonFields::endRun() {
    if (run_.octets >= leastRun) {
        out_ << ",\"octets\":";
        writeJsonOctets(out_, packet_.subspan(run_.first, run_.octets));
        writeBits(OctetSpan{run_.first, run_.first + run_.octets});
    }
    run_.octets = 0;
}

// By the width in the tables, so that a field has the same type in each packet.
void JsonFields::writeValue(const FieldView &field, const FieldDescription *description) {
    if (description != nullptr && description->width && *description->width <= numberBits) {
        out_ << ",\"value\":" << field.value;
        return;
    }
    if (const auto address = ipv6Address(field, packet_)) {
        TextRoom room;
        out_ << R"(,"value":")" << ipv6Text(*address, room) << '"';
    } else if (const auto octets = octetsOf(field)) {
        out_ << ",\"value\":";
        writeJsonOctets(out_, packet_.subspan(octets->first, octets->end - octets->first));
    }
}

// Ends the object, as the next one does.
void JsonFields::writeBits(OctetSpan octets) {
    const std::uint32_t before = offset_ * bitsPerOctet;
    out_ << ",\"bits\":[[" << before + octets.first * bitsPerOctet + 1 << ',' << before + octets.end * bitsPerOctet
         << "]]}";
}

// Pieces that follow one another as one.
void JsonFields::writeBits(std::span<const BitRange> ranges) {
    const std::uint32_t before = offset_ * bitsPerOctet;
    out_ << ",\"bits\":[";
    for (std::size_t first = 0; first < ranges.size();) {
        std::size_t last = first;
        while (last + 1 < ranges.size() && ranges[last + 1].firstBit == ranges[last].lastBit + 1) {
            ++last;
        }
        out_ << (first == 0 ? "[" : ",[") << before + ranges[first].firstBit << ',' << before + ranges[last].lastBit
             << ']';
        first = last + 1;
    }
    out_ << "]}";
}

} // namespace netfloor::cli
