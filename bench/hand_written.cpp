// SPDX-License-Identifier: MIT
#include "hand_written.h"

#include <array>
#include <charconv>
#include <cstring>
#include <string_view>

#include <netfloor/host.h>

#include "null_host.h"

namespace netfloor::bench {
namespace {

constexpr std::array<std::string_view, 8> precedences = {
    "Routine",         "Priority", "Immediate", "Flash", "Flash Override", "CRITIC/ECP", "Internetwork Control",
    "Network Control",
};
constexpr std::array<std::string_view, 2> delays = {"Normal Delay", "Low Delay"};
constexpr std::array<std::string_view, 2> throughputs = {"Normal Throughput", "High Throughput"};
constexpr std::array<std::string_view, 2> reliabilities = {"Normal Reliability", "High Reliability"};
constexpr std::array<std::string_view, 2> dontFragments = {"May Fragment", "Don't Fragment"};
constexpr std::array<std::string_view, 2> moreFragments = {"Last Fragment", "More Fragments"};

// The digits of every octet.
struct OctetText {
    std::array<char, 4> digits; // zeros after them
    std::uint32_t size;
};

constexpr auto octetTexts = [] {
    std::array<OctetText, 256> texts{};
    for (std::uint32_t octet = 0; octet < texts.size(); ++octet) {
        OctetText &text = texts[octet];
        for (std::uint32_t unit = octet >= 100 ? 100 : octet >= 10 ? 10 : 1; unit > 0; unit /= 10) {
            text.digits[text.size++] = static_cast<char>('0' + octet / unit % 10);
        }
    }
    return texts;
}();

std::uint32_t load16(const std::uint8_t *octets) {
    return static_cast<std::uint32_t>(octets[0] << 8 | octets[1]);
}

std::uint32_t load32(const std::uint8_t *octets) {
    return load16(octets) << 16 | load16(octets + 2);
}

// Not a member of the writer, so that the members can stay in registers. Large enough for every line.
std::array<char, 256> line;

// Writes the line of a field and reports it.
class Reporter {
public:
    [[gnu::always_inline]] Reporter(PreDecodeContext &context, const std::uint8_t *packet)
        : context_(context), record_(context.decodeState->fieldRecord), ranges_(record_.ranges), packet_(packet) {}

    // A field inside one octet: the bits `low` to `high` of it, counted from the least significant.
    [[gnu::always_inline]] std::uint32_t bits(std::uint32_t octet, std::uint32_t low, std::uint32_t high) {
        const std::uint32_t value = packet_[octet] >> low & ((1u << (high - low + 1)) - 1);
        BitRange &range = ranges_[0];
        range.value = value;
        range.firstBit = octet * 8 + low + 1;
        range.lastBit = octet * 8 + high + 1;
        range.flagWord = 0;
        record_.value = value;
        record_.rangeCount = 1;
        return value;
    }

    // A field of whole octets, a range for each.
    template <std::uint32_t count>
    [[gnu::always_inline]] std::uint32_t octets(std::uint32_t octet) {
        std::uint32_t value = 0;
        for (std::uint32_t i = 0; i < count; ++i) {
            BitRange &range = ranges_[i];
            range.value = packet_[octet + i];
            range.firstBit = (octet + i) * 8 + 1;
            range.lastBit = (octet + i) * 8 + 8;
            value = value << 8 | range.value;
        }
        record_.value = value;
        record_.rangeCount = count;
        return value;
    }

    [[gnu::always_inline]] std::uint32_t fragmentOffset(std::uint32_t octet) {
        const std::uint32_t high = packet_[octet] & 0x1fu;
        const std::uint32_t low = packet_[octet + 1];
        ranges_[0] = {high, octet * 8 + 1, octet * 8 + 5, 0, {}};
        ranges_[1] = {low, octet * 8 + 9, octet * 8 + 16, 0, {}};
        record_.value = (high << 8 | low) * 8;
        record_.rangeCount = 2;
        return record_.value;
    }

    template <std::size_t size>
    [[gnu::always_inline]] Reporter &text(const char (&literal)[size]) {
        std::memcpy(end_, literal, size - 1);
        end_ += size - 1;
        return *this;
    }

    [[gnu::always_inline]] Reporter &text(std::string_view name) {
        std::memcpy(end_, name.data(), name.size());
        end_ += name.size();
        return *this;
    }

    [[gnu::always_inline]] Reporter &octetNumber(std::uint32_t octet) {
        const OctetText &text = octetTexts[octet];
        std::memcpy(end_, text.digits.data(), text.digits.size());
        end_ += text.size;
        return *this;
    }

    [[gnu::always_inline]] Reporter &decimal(std::uint32_t value) {
        if (value < octetTexts.size()) {
            return octetNumber(value);
        }
        end_ = std::to_chars(end_, line.data() + line.size(), value).ptr;
        return *this;
    }

    // Up to four digits.
    [[gnu::always_inline]] Reporter &hexadecimal(std::uint32_t value) {
        for (int shift = value > 0xfff ? 12 : value > 0xff ? 8 : value > 0xf ? 4 : 0; shift >= 0; shift -= 4) {
            *end_++ = "0123456789abcdef"[value >> shift & 0xf];
        }
        return *this;
    }

    template <std::size_t size>
    [[gnu::always_inline]] void report(std::uint32_t id, const char (&name)[size]) {
        std::memcpy(record_.fieldName, name, size);
        record_.valueText[0] = '\0';
        record_.rawFlag = 0;
        record_.outputRangeCount = record_.rangeCount;
        record_.fieldId = id;
        std::uint8_t *const decoded = context_.fieldRecords + std::size_t{context_.fieldRecordCount} * 1000;
        decoded[0] = context_.layerNumber;
        decoded[1] = 0;
        decoded[2] = 0;
        *end_ = '\0';
        end_ = line.data();
        hs_AddDecodedFieldsData(&context_, record_.rangeCount, ranges_, line.data(), 0, record_.fieldName, id, 0, 0);
    }

private:
    PreDecodeContext &context_;
    FieldRecord &record_;
    BitRange *ranges_;
    const std::uint8_t *packet_;
    char *end_ = line.data();
};

[[gnu::always_inline]] inline void reportAddress(Reporter &field, std::uint32_t address) {
    field.octetNumber(address >> 24).text(".").octetNumber(address >> 16 & 0xff).text(".");
    field.octetNumber(address >> 8 & 0xff).text(".").octetNumber(address & 0xff);
}

[[gnu::always_inline]] inline void reportIpv4(Reporter &field) {
    field.text("Version=").octetNumber(field.bits(0, 4, 7)).report(150, "Version");
    field.text("Internet Header Length=")
        .octetNumber(field.bits(0, 0, 3))
        .text("*4 octets")
        .report(152, "Internet Header Length");
    field.text("Precedence=").text(precedences[field.bits(1, 5, 7)]).report(286, "Precedence");
    field.text("Delay=").text(delays[field.bits(1, 4, 4)]).report(287, "Delay");
    field.text("Throughput=").text(throughputs[field.bits(1, 3, 3)]).report(288, "Throughput");
    field.text("Reliability=").text(reliabilities[field.bits(1, 2, 2)]).report(289, "Reliability");
    field.text("Reserved=").hexadecimal(field.bits(1, 0, 1)).report(290, "Reserved");
    field.text("Total Length=").decimal(field.octets<2>(2)).text(" octets").report(153, "Total Length");
    field.text("Identification=").hexadecimal(field.octets<2>(4)).report(156, "Identification");
    field.text("Reserved=").hexadecimal(field.bits(6, 7, 7)).report(291, "Reserved");
    field.text("DF=").text(dontFragments[field.bits(6, 6, 6)]).report(292, "DF");
    field.text("MF=").text(moreFragments[field.bits(6, 5, 5)]).report(293, "MF");
    field.text("Fragment Offset=").decimal(field.fragmentOffset(6)).text(" octets").report(294, "Fragment Offset");
    field.text("Time to Live=").octetNumber(field.octets<1>(8)).report(157, "Time to Live");
    field.octets<1>(9);
    field.text("Protocol=UDP").report(295, "Protocol");
    field.text("Header Checksum=").hexadecimal(field.octets<2>(10)).report(158, "Header Checksum");
    reportAddress(field.text("Source Address= "), field.octets<4>(12));
    field.report(159, "Source Address");
    reportAddress(field.text("Destination Address= "), field.octets<4>(16));
    field.report(160, "Destination Address");
}

[[gnu::always_inline]] inline void reportPort(Reporter &field, std::uint32_t port) {
    field.decimal(port).text(" (").decimal(port).text(")");
}

[[gnu::always_inline]] inline void reportUdp(Reporter &field) {
    reportPort(field.text("  UDP Source Port="), field.octets<2>(20));
    field.report(479, "UDP Source Port");
    reportPort(field.text("  UDP Destination Port="), field.octets<2>(22));
    field.report(488, "UDP Destination Port");
    field.text("  UDP Length=").decimal(field.octets<2>(24)).text(" octet(s)").report(489, "UDP Length");
    field.text("  Checksum=").hexadecimal(field.octets<2>(26)).report(490, "Checksum");
}

template <class Value>
void storeKey(std::uint8_t *keyRecord, std::size_t row, std::uint32_t number) {
    keyRecord[presencePlace(row)] = static_cast<std::uint8_t>(keyRecord[presencePlace(row)] | presenceMask(row));
    const auto value = static_cast<Value>(number);
    std::memcpy(keyRecord + valuePlace(row), &value, sizeof value);
}

} // namespace

void reportByHand(PreDecodeContext &context, const std::uint8_t *packet) {
    Reporter field(context, packet);
    reportIpv4(field);
    reportUdp(field);
}

void storeKeysByHand(std::uint8_t *keyRecord, const std::uint8_t *packet) {
    storeKey<std::uint8_t>(keyRecord, 0, packet[0] >> 4u);
    storeKey<std::uint16_t>(keyRecord, 1, load16(packet + 2));
    storeKey<std::uint16_t>(keyRecord, 2, load16(packet + 4));
    storeKey<std::uint8_t>(keyRecord, 7, packet[6] >> 6u & 1u);
    storeKey<std::uint8_t>(keyRecord, 8, packet[6] >> 5u & 1u);
    storeKey<std::uint16_t>(keyRecord, 9, (load16(packet + 6) & 0x1fffu) * 8);
    storeKey<std::uint8_t>(keyRecord, 3, packet[8]);
    storeKey<std::uint8_t>(keyRecord, 4, packet[9]);
    storeKey<std::uint32_t>(keyRecord, 5, load32(packet + 12));
    storeKey<std::uint32_t>(keyRecord, 6, load32(packet + 16));
    storeKey<std::uint16_t>(keyRecord, 59, load16(packet + 20));
    storeKey<std::uint16_t>(keyRecord, 62, load16(packet + 22));
}

} // namespace netfloor::bench
