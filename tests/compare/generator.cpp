// SPDX-License-Identifier: MIT
#include "generator.h"

namespace netfloor::compare {
namespace {

using test::be16;
using test::be32;
using test::Octets;
using test::operator+;

constexpr std::uint32_t mostDepth = 4; // of packets in packets

class Generator {
public:
    explicit Generator(Random &random) : random_(random) {}

    Octets packet(std::uint32_t depth) { return random_.oneIn(3) ? ipv6(depth) : ipv4(depth); }

private:
    Octets octets(std::size_t count) {
        Octets drawn(count);
        for (std::uint8_t &octet : drawn) {
            octet = random_.octet();
        }
        return drawn;
    }

    Octets some(std::uint32_t most) { return octets(random_.below(most + 1)); }

    // The length that is right, or one that is not.
    std::uint32_t length(std::size_t right) {
        const auto sane = static_cast<std::uint32_t>(right);
        return random_.oneIn(8)
                   ? random_.pick({0u, 1u, 3u, sane - 1, sane + 1, sane - 4, sane + 4, sane * 2, 0xffu, 0xffffu})
                   : sane;
    }

    // Some of what `draw` gives.
    template <class Draw>
    Octets several(std::uint32_t most, Draw draw) {
        Octets all;
        for (std::uint32_t count = random_.below(most + 1); count > 0; --count) {
            all = all + draw();
        }
        return all;
    }

    Octets shortOption(std::uint8_t kind, const Octets &value) {
        return Octets{kind, static_cast<std::uint8_t>(length(value.size() + 2))} + value;
    }

    Octets longOption(std::uint32_t type, const Octets &value) {
        Octets option = be16(type) + be16(length(value.size() + 4)) + value;
        option.resize((option.size() + 3) / 4 * 4);
        return option;
    }

    Octets ipv4Options() {
        Octets all = several(4, [&] {
            const auto kind = random_.pick<std::uint8_t>({0, 1, 7, 68, 130, 131, 133, 136, 137, 148, random_.octet()});
            switch (kind) {
            case 0:
            case 1: return Octets{kind};
            case 7:
            case 131:
            case 137: return shortOption(kind, Octets{random_.pick<std::uint8_t>({4, 8, 3})} + octets(4));
            case 68: {
                const auto form = random_.pick<std::uint8_t>({0, 1, 3, random_.octet()});
                return shortOption(kind, Octets{5, form} + octets(random_.pick({4u, 8u, 16u})));
            }
            case 130: return shortOption(kind, octets(9));
            case 136: return shortOption(kind, octets(2));
            default: return shortOption(kind, some(6));
            }
        });
        all.resize((all.size() + 3) / 4 * 4);
        return all.size() > 40 ? Octets{} : all;
    }

    Octets ipv4(std::uint32_t depth) {
        const auto protocol = random_.pick<std::uint8_t>({1, 1, 4, 6, 6, 17, 17, 41, 47, 50, 55, 132, 132, 132, 58});
        test::Ipv4 header{.protocol = protocol, .payload = carried(protocol, depth)};
        header.options = random_.oneIn(3) ? ipv4Options() : Octets{};
        header.typeOfService = random_.octet();
        header.fragment = random_.oneIn(5) ? static_cast<std::uint16_t>(random_.next()) : std::uint16_t{0x4000};
        header.source = random_.below(0x100000000);
        if (random_.oneIn(8)) {
            header.headerWords = random_.octet() & 0xf;
        }
        header.totalLength = static_cast<std::uint16_t>(length(20 + header.options.size() + header.payload.size()));
        return test::ipv4(header);
    }

    Octets ipv6(std::uint32_t depth) {
        test::Ipv6 header{};
        header.trafficClass = random_.octet();
        for (std::uint8_t &octet : header.source) {
            octet = random_.octet();
        }
        header.nextHeader = random_.pick<std::uint8_t>({58, 58, 4, 6, 17, 41, 132, 59});
        header.payload = carried(header.nextHeader, depth);
        for (std::uint32_t count = random_.pick({0u, 0u, 1u, 2u, 4u}); count > 0; --count) {
            const auto type = random_.pick<std::uint8_t>({0, 43, 44, 50, 51, 60, 135});
            header.payload = extensionHeader(type, header.nextHeader) + header.payload;
            header.nextHeader = type;
        }
        header.payloadLength = static_cast<std::uint16_t>(length(header.payload.size()));
        return test::ipv6(header);
    }

    Octets extensionHeader(std::uint8_t type, std::uint8_t next) {
        if (type == 44) {
            return Octets{next, 0} + be16(random_.oneIn(2) ? random_.below(0x10000) : 0) + octets(4);
        }
        if (type == 51) {
            const std::uint32_t words = random_.below(5);
            return Octets{next, static_cast<std::uint8_t>(length(words + 1))} + octets(10 + words * 4);
        }
        Octets body;
        if (type == 43) {
            const std::uint32_t addresses = random_.below(3);
            body = Octets{random_.pick<std::uint8_t>({0, 0, 2, 4}), static_cast<std::uint8_t>(addresses)} + octets(4) +
                   octets(addresses * 16);
        } else {
            body = several(4, [&] {
                const auto kind = random_.pick<std::uint8_t>({0, 1, 5, 0x1e, 0x4b, 0x8a, 0xc2, random_.octet()});
                const Octets value = some(6);
                return kind == 0 ? Octets{0} : Octets{kind, static_cast<std::uint8_t>(length(value.size()))} + value;
            });
        }
        body.resize((body.size() + 2 + 7) / 8 * 8 - 2);
        return Octets{next, static_cast<std::uint8_t>(length((body.size() + 2) / 8 - 1))} + body;
    }

    Octets carried(std::uint8_t protocol, std::uint32_t depth) {
        switch (protocol) {
        case 1: return icmp(depth);
        case 4:
        case 41: return depth < mostDepth ? packet(depth + 1) : some(30);
        case 6: return tcp();
        case 17: return udp();
        case 47: return gre();
        case 55: {
            const auto inner = random_.pick<std::uint8_t>({1, 6, 17, 4, 132});
            const bool withSource = random_.oneIn(2);
            return Octets{inner, static_cast<std::uint8_t>(withSource ? 0x80 : 0)} + be16(0xabcd) +
                   octets(withSource ? 8 : 4) + carried(inner, depth + 1);
        }
        case 58: return icmpv6(depth);
        case 132: return sctp();
        default: return some(40);
        }
    }

    Octets icmp(std::uint32_t depth) {
        const auto type = random_.pick<std::uint8_t>(
            {0, 3, 3, 4, 5, 5, 8, 9, 10, 11, 11, 12, 13, 14, 15, 16, 17, 18, 30, random_.octet()});
        const Octets head = Octets{type, static_cast<std::uint8_t>(random_.below(16))} + be16(0xbeef);
        switch (type) {
        case 3:
        case 4:
        case 5:
        case 11:
        case 12: return head + octets(4) + (depth < mostDepth ? packet(mostDepth) : some(30));
        case 9: {
            const std::uint32_t routers = random_.below(4);
            return head + Octets{static_cast<std::uint8_t>(length(routers)), 2} + be16(1800) + octets(routers * 8);
        }
        default: return head + octets(random_.pick({4u, 8u, 12u, 16u, 20u}));
        }
    }

    Octets icmpv6(std::uint32_t depth) {
        const auto type = random_.pick<std::uint8_t>({1, 2, 3, 4, 128, 129, 130, 134, 135, 143, random_.octet()});
        return Octets{type, static_cast<std::uint8_t>(random_.below(8))} + be16(0xbeef) + octets(4) +
               (type < 5 && depth < mostDepth ? packet(mostDepth) : some(30));
    }

    std::uint16_t port() {
        return random_.pick<std::uint16_t>(
            {53, 80, 1023, 1024, 3452, 8999, 9000, 40000, static_cast<std::uint16_t>(random_.next())});
    }

    Octets tcp() {
        Octets options = several(5, [&] {
            const auto kind = random_.pick<std::uint8_t>({0, 1, 1, 2, 3, 4, 5, 8, 8, 19, random_.octet()});
            switch (kind) {
            case 0:
            case 1: return Octets{kind};
            case 2: return shortOption(kind, octets(2));
            case 3: return shortOption(kind, octets(1));
            case 4: return shortOption(kind, {});
            case 5: return shortOption(kind, octets(random_.pick({8u, 16u, 24u})));
            case 8: return shortOption(kind, octets(8));
            case 19: return shortOption(kind, octets(16));
            default: return shortOption(kind, some(6));
            }
        });
        options.resize((options.size() + 3) / 4 * 4);
        const auto offset = static_cast<std::uint8_t>(length(5 + options.size() / 4) << 4);
        return be16(port()) + be16(port()) + octets(8) + Octets{offset} + octets(7) + options + some(40);
    }

    Octets udp() {
        const Octets payload = some(40);
        return be16(port()) + be16(port()) + be16(length(8 + payload.size())) + be16(0) + payload;
    }

    Octets gre() {
        const std::uint8_t flags = random_.octet();
        const std::size_t parts = (flags >> 7 & 1u) + (flags >> 5 & 1u) + (flags >> 4 & 1u);
        Octets frame = some(24);
        if (random_.oneIn(2)) {
            frame = Octets{0x7e} + frame + Octets{0x7e} + some(4);
        }
        return Octets{flags, random_.octet()} + be16(random_.pick({0x800u, 0x86ddu, 0x880bu, 0x6558u})) +
               octets(parts * 4) + frame;
    }

    Octets sctp() {
        Octets packet = be16(port()) + be16(port()) + octets(8);
        return packet + several(4, [&] { return chunk(); });
    }

    Octets chunk() {
        const auto type = random_.pick<std::uint8_t>(
            {0, 0, 1, 1, 2, 2, 3, 4, 5, 6, 6, 7, 8, 9, 9, 10, 11, 12, 13, 14, 0x80, 0xc1, random_.octet()});
        Octets chunk = Octets{type, random_.octet()};
        Octets value;
        switch (type) {
        case 0: value = octets(12) + some(20); break;
        case 1:
        case 2: value = octets(16) + several(4, [&] { return parameter(); }); break;
        case 3: {
            const std::uint32_t gaps = random_.below(4);
            const std::uint32_t repeats = random_.below(3);
            value = octets(8) + be16(length(gaps)) + be16(length(repeats)) + octets((gaps + repeats) * 4);
            break;
        }
        case 4:
        case 5: value = longOption(1, some(12)); break;
        case 6:
        case 9: value = several(4, [&] { return cause(); }); break;
        case 7:
        case 12:
        case 13: value = octets(4); break;
        case 8:
        case 11:
        case 14: break;
        default: value = some(20); break;
        }
        chunk = chunk + be16(length(value.size() + 4)) + value;
        chunk.resize((chunk.size() + 3) / 4 * 4);
        return chunk;
    }

    Octets parameter() {
        const auto type = random_.pick({1u, 5u, 6u, 7u, 8u, 9u, 11u, 12u, 0x8000u, 0xc000u, 0xc001u, 0xc006u, 99u});
        switch (type) {
        case 5:
        case 9: return longOption(type, octets(4));
        case 6: return longOption(type, octets(16));
        case 12: return longOption(type, several(3, [&] { return be16(random_.pick({5u, 6u, 11u, 77u})); }));
        case 8: return longOption(type, random_.oneIn(2) ? parameter() : some(8));
        default: return longOption(type, some(12));
        }
    }

    Octets cause() {
        const std::uint32_t code = random_.below(15);
        switch (code) {
        case 1:
        case 3:
        case 9: return longOption(code, octets(4));
        case 2: {
            const std::uint32_t missing = random_.below(4);
            return longOption(code, be32(length(missing)) + octets(missing * 2));
        }
        case 4:
        case 7:
        case 10: return longOption(code, {});
        case 8: return longOption(code, parameter());
        default: return longOption(code, some(12));
        }
    }

    Random &random_;
};

} // namespace

test::Octets generatedPacket(Random &random) {
    return Generator(random).packet(0);
}

} // namespace netfloor::compare
