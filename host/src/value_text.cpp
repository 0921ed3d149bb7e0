// SPDX-License-Identifier: MIT
#include "netfloor-host/value_text.h"

#include <algorithm>
#include <charconv>
#include <cstddef>
#include <cstring>
#include <string_view>

#include <netfloor/records.h>

namespace netfloor {
namespace {

constexpr std::size_t groupCount = 8;
constexpr int decimal = 10;
constexpr int hexadecimal = 16;

struct NamedFlag {
    std::uint32_t bit;
    std::string_view name;
};

constexpr NamedFlag namedFlags[] = {
    {NETFLOOR_FLAG_EXPECTATION, "expectation not met"},
    {NETFLOOR_FLAG_LIMIT_TOO_LONG, "length reaches past the bits left"},
    {NETFLOOR_FLAG_BITS_LEFT_OVER, "bits left over inside a length"},
    {NETFLOOR_FLAG_NO_LAYER_FRAMES, "no storage for layer frames"},
    {NETFLOOR_FLAG_NO_STACK, "no storage for a stack"},
    {NETFLOOR_FLAG_NO_RANGES, "no storage for bit ranges"},
};

// Writes a text into its room.
class TextWriter {
public:
    explicit TextWriter(TextRoom &room) : room_(room), end_(room.data()) {}

    void character(char character) { *end_++ = character; }
    // All of the array is copied, and so many of it count: a copy of known size needs no call.
    template <std::size_t Size>
    void text(const std::array<char, Size> &text, std::size_t count) {
        std::memcpy(end_, text.data(), Size);
        end_ += count;
    }
    void takeBack(std::size_t count) { end_ -= count; }
    void text(std::string_view text) { end_ += text.copy(end_, static_cast<std::size_t>(limit() - end_)); }
    void number(std::uint32_t number, int base) { end_ = std::to_chars(end_, limit(), number, base).ptr; }

    [[nodiscard]] std::string_view written() const { return {room_.data(), end_}; }

private:
    [[nodiscard]] char *limit() const { return room_.data() + room_.size(); }

    TextRoom &room_;
    char *end_;
};

std::string unnamedFlag(std::uint32_t bit) {
    TextRoom room;
    TextWriter text(room);
    text.text("flag 0x");
    text.number(bit, hexadecimal);
    return std::string(text.written());
}

std::string flagName(std::uint32_t bit) {
    const auto *const found = std::ranges::find(namedFlags, bit, &NamedFlag::bit);
    return found != std::end(namedFlags) ? std::string(found->name) : unnamedFlag(bit);
}

// A run of groups that are 0.
struct ZeroRun {
    std::size_t first = 0;
    std::size_t count = 0;
};

using Groups = std::array<std::uint32_t, groupCount>;

// RFC 5952, 4.2: the longest run of two groups or more is shortened, the first of several of one length.
ZeroRun longestZeroRun(const Groups &groups) {
    ZeroRun longest;
    for (std::size_t first = 0; first < groupCount; ++first) {
        std::size_t count = 0;
        while (first + count < groupCount && groups[first + count] == 0) {
            ++count;
        }
        if (count > longest.count) {
            longest = {first, count};
        }
    }
    return longest.count < 2 ? ZeroRun{} : longest;
}

void writeGroups(const Groups &groups, std::size_t first, std::size_t end, TextWriter &text) {
    for (std::size_t group = first; group < end; ++group) {
        if (group != first) {
            text.character(':');
        }
        text.number(groups[group], hexadecimal);
    }
}

// An octet in decimal, with a dot after it.
struct OctetText {
    std::array<char, 4> characters;
    std::uint8_t size;
};
constexpr auto octetTexts = [] {
    std::array<OctetText, 256> texts = {};
    for (std::uint32_t octet = 0; octet < texts.size(); ++octet) {
        OctetText &text = texts[octet];
        for (std::uint32_t unit = octet < 10 ? 1 : octet < 100 ? 10 : 100; unit != 0; unit /= 10) {
            text.characters[text.size++] = static_cast<char>('0' + octet / unit % 10);
        }
        text.characters[text.size++] = '.';
    }
    return texts;
}();

void writeIpv4(std::uint32_t address, TextWriter &text) {
    for (std::uint32_t shift = 32; shift != 0; shift -= bitsPerOctet) {
        const OctetText &octet = octetTexts[address >> (shift - bitsPerOctet) & 0xff];
        text.text(octet.characters, octet.size);
    }
    text.takeBack(1);
}

// The bits of a field whose ranges follow one another without a gap.
struct ContiguousBits {
    std::uint32_t firstBit;
    std::uint32_t bits;
};

template <typename Range>
std::optional<ContiguousBits> contiguousBits(std::span<const Range> ranges, std::uint32_t bitsEach) {
    const std::uint32_t firstBit = ranges.front().firstBit;
    std::uint32_t next = firstBit;
    for (const Range &range : ranges) {
        if (range.firstBit != next || range.lastBit - range.firstBit + 1 != bitsEach) {
            return std::nullopt;
        }
        next = range.lastBit + 1;
    }
    return ContiguousBits{firstBit, next - firstBit};
}

// The bits in each range of a field that is an address of so many ranges, or 0.
std::uint32_t addressRangeBits(std::size_t rangeCount) {
    constexpr std::uint32_t addressBits = 128;
    switch (rangeCount) {
    case 1:
    case groupCount:
    case 4 * groupCount: return addressBits / static_cast<std::uint32_t>(rangeCount);
    default: return 0;
    }
}

template <typename Range>
std::optional<Ipv6Octets> addressOf(std::span<const Range> ranges, std::span<const std::uint8_t> packet) {
    const std::uint32_t bitsEach = addressRangeBits(ranges.size());
    if (bitsEach == 0) {
        return std::nullopt;
    }
    const std::optional<ContiguousBits> bits = contiguousBits(ranges, bitsEach);
    if (!bits || (bits->firstBit - 1) % bitsPerOctet != 0) {
        return std::nullopt;
    }
    const std::size_t first = (bits->firstBit - 1) / bitsPerOctet;
    Ipv6Octets octets = {};
    if (first > packet.size() || packet.size() - first < octets.size()) {
        return std::nullopt;
    }
    std::copy_n(packet.begin() + static_cast<std::ptrdiff_t>(first), octets.size(), octets.begin());
    return octets;
}

} // namespace

std::vector<std::string> flagNames(std::uint32_t flags) {
    std::vector<std::string> names;
    for (std::uint32_t bit = 1; bit != 0; bit <<= 1) {
        if ((flags & bit) != 0) {
            names.push_back(flagName(bit));
        }
    }
    return names;
}

std::string_view passName(Pass pass) {
    switch (pass) {
    case Pass::md: return "MD";
    case Pass::to: return "TO";
    case Pass::mv: return "MV";
    case Pass::xtr: return "XTR";
    }
    return "";
}

std::string_view ipv6Text(const Ipv6Octets &octets, TextRoom &room) {
    Groups groups = {};
    for (std::size_t group = 0; group < groupCount; ++group) {
        groups[group] = static_cast<std::uint32_t>(octets[2 * group] << bitsPerOctet | octets[2 * group + 1]);
    }
    TextWriter text(room);
    // RFC 5952, 5: IPv4-mapped addresses (RFC 4291, 2.5.5.2) show their last four octets in dotted form.
    constexpr Ipv6Octets mapped = {0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0xff, 0xff};
    if (std::equal(mapped.begin(), mapped.begin() + 12, octets.begin())) {
        text.text("::ffff:");
        writeIpv4(groups[6] << 16 | groups[7], text);
        return text.written();
    }
    const ZeroRun zeros = longestZeroRun(groups);
    if (zeros.count == 0) {
        writeGroups(groups, 0, groupCount, text);
        return text.written();
    }
    writeGroups(groups, 0, zeros.first, text);
    text.text("::");
    writeGroups(groups, zeros.first + zeros.count, groupCount, text);
    return text.written();
}

std::string_view ipv4Text(std::uint32_t address, TextRoom &room) {
    TextWriter text(room);
    writeIpv4(address, text);
    return text.written();
}

std::string ipv6Text(const Ipv6Octets &octets) {
    TextRoom room;
    return std::string(ipv6Text(octets, room));
}

std::string ipv4Text(std::uint32_t address) {
    TextRoom room;
    return std::string(ipv4Text(address, room));
}

std::optional<Ipv6Octets> ipv6Address(const FieldReport &field, std::span<const std::uint8_t> packet) {
    return addressOf(std::span<const ReportedRange>(field.ranges), packet);
}

std::optional<Ipv6Octets> ipv6Address(const FieldView &field, std::span<const std::uint8_t> packet) {
    return addressOf(field.ranges, packet);
}

std::optional<Ipv6Octets> ipv6Address(const KeyView &key) {
    Ipv6Octets octets = {};
    if (key.type != KeyType::ipv6Address || key.octets.size() != octets.size()) {
        return std::nullopt;
    }
    std::ranges::transform(key.octets, octets.begin(),
                           [](std::uint8_t octet) { return static_cast<std::uint8_t>(octet << 4 | octet >> 4); });
    return octets;
}

std::string_view keyText(const KeyView &key, TextRoom &room) {
    switch (key.type) {
    case KeyType::ipv4Address: return ipv4Text(key.number, room);
    case KeyType::ipv6Address: {
        const std::optional<Ipv6Octets> octets = ipv6Address(key);
        return octets ? ipv6Text(*octets, room) : std::string_view();
    }
    default: {
        TextWriter text(room);
        text.number(key.number, decimal);
        return text.written();
    }
    }
}

std::string keyText(const KeyView &key) {
    TextRoom room;
    return std::string(keyText(key, room));
}

} // namespace netfloor
