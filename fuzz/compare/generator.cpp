// SPDX-License-Identifier: MIT
#include "inputs.h"

#include <algorithm>
#include <cctype>
#include <cstdlib>
#include <iterator>
#include <map>
#include <sstream>
#include <string>

namespace netfloor::compare {
namespace {

using test::be16;
using test::Octets;
using test::operator+;

constexpr std::uint32_t mostDepth = 4; // of packets in packets

// What stands on the wire, with '|' between the forms that something has. Of a form:
//
//     0a2b       octets                       ?3 ~20      3 drawn octets; 0 to 20 of them
//     Port       a form of Port               Chunk*4     0 to 4 forms of Chunk
//     =2         the length of this form in 2 octets; =1/8-1: in 1 octet, in units of 8 octets, less 1
//     %4         the length ends here; zeros up to a multiple of 4
//     N          the next header              Packet      a packet that this one carries or quotes
const std::map<std::string, const char *> rules = {
    {"Port", "0035|0050|03ff|0400|0d7c|2327|2328|9c40|?2"},
    {"Small", "00|01|02|03|04|?1"},
    {"Ipv4Option", "00|01|01|07 =1 Small ?8|83 =1 04 ?4|89 =1 08 ?8|44 =1 05 Small ?8|44 =1 05 00 ?16|44 =1 0d 01 ?8|"
                   "82 =1 ?9|88 =1 ?2|94 =1 ?2|85 =1 ?4|?1 =1 ~6"},
    {"TcpOption", "00|01|01|01|02 =1 ?2|03 =1 ?1|04 =1|05 =1 ?8|05 =1 ?24|08 =1 ?8|13 =1 ?16|fe =1 ~6|?1 =1 ~6"},
    {"TcpOptions", "TcpOption*5 %4"},
    {"Ipv4Options", "Ipv4Option*4 %4"},
    {"1", "03 Small ?2 ?4 Packet|04 00 ?6 Packet|05 Small ?6 Packet|0b Small ?6 Packet|0c 00 ?6 Packet|00 00 ?6 ~20|"
          "08 00 ?6 ~20|09 00 ?2 02 02 0708 ?16|09 00 ?2 Small Small ?2 ~40|0a 00 ?6|0d 00 ?18|0e 00 ?18|0f 00 ?6|"
          "10 00 ?6|11 00 ?10|12 00 ?10|?4 ~30"},
    {"17", "Port Port =2 ?2 ~40"},
    {"47", "00 ?1 0800 Frame|80 ?1 880b ?4 Frame|20 ?1 86dd ?4 Frame|10 ?1 6558 ?4 Frame|b0 ?1 ?2 ?12 Frame|?4 ~30"},
    {"Frame", "~24|7e ~24 7e ~4|7e ~24"},
    {"58", "01 Small ?6 Packet|02 00 ?6 Packet|03 Small ?6 Packet|04 Small ?6 Packet|80 00 ?6 ~30|81 00 ?6 ~30|?4 ~30"},
    {"132", "Port Port ?8 Chunk*4"},
    {"Chunk", "00 ?1 =2 ?12 ~20 %4|01 ?1 =2 ?16 Parameter*4 %4|02 ?1 =2 ?16 Parameter*4 %4|03 00 =2 ?8 0000 0000 %4|"
              "03 00 =2 ?8 0002 0001 ?12 %4|03 00 =2 ?8 00 Small 00 Small ~20 %4|04 00 =2 Information|"
              "05 00 =2 Information|06 ?1 =2 Cause*4 %4|06 ?1 =2 Cause*4 %4|07 00 =2 ?4|08 00 =2|09 00 =2 Cause*4 %4|"
              "09 00 =2 Cause*4 %4|0a 00 =2 ~12 %4|0b 00 =2|0c 00 =2 ?4|0d 00 =2 ?4|0e ?1 =2|c1 00 =2 ~12 %4|"
              "?2 =2 ~20 %4"},
    {"Information", "0001 =2 ~12 %4"},
    {"Parameter", "0001 =2 ~12 %4|0005 =2 ?4|0006 =2 ?16|0007 =2 ~12 %4|0008 =2 Parameter %4|0008 =2 ~8 %4|0009 =2 ?4|"
                  "000b =2 ~12 %4|000c =2 0005 0006 000b %4|8000 =2 ~4 %4|c000 =2 ~8 %4|c0 Small =2 ~8 %4|?2 =2 ~8 %4"},
    {"Cause", "0001 =2 ?4|0002 =2 00000001 ?2 %4|0002 =2 000000 Small ~8 %4|0003 =2 ?4|0004 =2|0005 =2 ~12 %4|"
              "0006 =2 Chunk %4|0007 =2|0008 =2 Parameter %4|0009 =2 ?4|000a =2|000b =2 ~8 %4|00 ?1 =2 ~8 %4"},
    {"0", "N =1/8-1 Ipv6Option*4 +8"},
    {"60", "N =1/8-1 Ipv6Option*4 +8"},
    {"Ipv6Option", "00|00|01 =1-2 ~6|05 =1-2 ?2|1e =1-2 ~6|4b =1-2 ~6|8a =1-2 ~6|c2 =1-2 ?4|?1 =1-2 ~6"},
    {"43", "N =1/8-1 00 01 ?4 ?16|N =1/8-1 00 02 ?4 ?32|N =1/8-1 02 01 ?4 ?16|N =1/8-1 04 Small ?4 ~40 +8|N =1/8-1 ?6"},
    {"44", "N 00 0000 ?4|N 00 ?2 ?4|N ?1 0001 ?4"},
    {"50", "?8"},
    {"51", "N =1/4-2 ?10 ?8|N =1/4-2 ?10|N =1/4-2 ?10 ~20 +4"},
    {"55", "N 80 ?2 ?8|N 00 ?2 ?4"},
};

// The forms of each rule, as tokens.
using Forms = std::map<std::string, std::vector<std::vector<std::string>>>;

Forms parsedRules() {
    Forms parsed;
    for (const auto &[name, text] : rules) {
        std::istringstream forms(text);
        for (std::string form; std::getline(forms, form, '|');) {
            std::istringstream tokens(form);
            parsed[name].emplace_back(std::istream_iterator<std::string>(tokens), std::istream_iterator<std::string>());
        }
    }
    return parsed;
}

void append(Octets &front, const Octets &back) {
    front.insert(front.end(), back.begin(), back.end());
}

class Generator {
public:
    explicit Generator(Random &random) : random_(random) {}

    Octets packet() {
        if (depth_ == mostDepth) {
            return drawn(random_.below(40));
        }
        ++depth_;
        Octets packet = random_.oneIn(3) ? ipv6() : ipv4();
        --depth_;
        return packet;
    }

    Octets part() {
        const auto rule = std::next(rules.begin(), random_.below(rules.size()));
        return form(rule->first, random_.pick<std::uint8_t>({6, 17, 43, 44, 51, 60, 132}));
    }

private:
    // The length that is right, or one that is not.
    std::uint32_t length(std::size_t right) {
        const auto sane = static_cast<std::uint32_t>(right);
        return random_.oneIn(10) ? random_.pick({0u, 1u, 3u, sane - 1, sane + 1, sane - 4, sane + 4, sane * 2, 0xffffu})
                                 : sane;
    }

    Octets drawn(std::size_t count) {
        Octets octets(count);
        for (std::uint8_t &octet : octets) {
            octet = random_.octet();
        }
        return octets;
    }

    Octets form(const std::string &rule, std::uint8_t next = 0) {
        static const Forms forms = parsedRules();
        const auto &all = forms.at(rule);
        Octets octets;
        std::string lengthToken;
        std::size_t lengthPlace = 0;
        const auto endLength = [&] {
            writeLength(octets, lengthPlace, lengthToken);
            lengthToken.clear();
        };
        for (const std::string &token : all[random_.below(all.size())]) {
            const std::size_t number = std::strtoul(token.c_str() + 1, nullptr, 10);
            switch (token[0]) {
            case '?': octets = octets + drawn(number); break;
            case '~': octets = octets + drawn(random_.below(number + 1)); break;
            case 'N': octets.push_back(next); break;
            case '=':
                lengthToken = token;
                lengthPlace = octets.size();
                octets.resize(octets.size() + number);
                break;
            case '%': endLength(); [[fallthrough]];
            case '+': octets.resize((octets.size() + number - 1) / number * number); break;
            default: octets = octets + (std::isupper(token[0]) != 0 ? named(token) : test::hex(token)); break;
            }
        }
        endLength();
        return octets;
    }

    // "=2/4-1": 2 octets, in units of 4 octets, less 1.
    void writeLength(Octets &octets, std::size_t place, const std::string &token) {
        if (token.empty()) {
            return;
        }
        const std::size_t slash = token.find('/');
        const std::size_t minus = token.find('-');
        const std::size_t unit = slash == std::string::npos ? 1 : std::stoul(token.substr(slash + 1));
        const std::size_t less = minus == std::string::npos ? 0 : std::stoul(token.substr(minus + 1));
        const Octets value = be16(length(octets.size() / unit - less));
        std::copy(token[1] == '2' ? value.begin() : value.begin() + 1, value.end(),
                  octets.begin() + static_cast<std::ptrdiff_t>(place));
    }

    Octets named(const std::string &token) {
        if (token == "Packet") {
            return packet();
        }
        const std::size_t star = token.find('*');
        std::uint32_t count = star == std::string::npos ? 1 : random_.below(std::stoul(token.substr(star + 1)) + 1);
        Octets octets;
        for (; count > 0; --count) {
            octets = octets + form(token.substr(0, star));
        }
        return octets;
    }

    Octets carried(std::uint8_t protocol) {
        if (protocol == 4 || protocol == 41) {
            return packet();
        }
        if (protocol == 6) {
            // One statement each: compilers evaluate the operands of a sum in different orders.
            const Octets options = form("TcpOptions");
            Octets segment = form("Port");
            append(segment, form("Port"));
            append(segment, drawn(8));
            segment.push_back(static_cast<std::uint8_t>(length(5 + options.size() / 4) << 4));
            append(segment, drawn(7));
            append(segment, options);
            append(segment, drawn(random_.below(40)));
            return segment;
        }
        if (protocol == 55) {
            const auto inner = random_.pick<std::uint8_t>({1, 4, 6, 17, 47, 132});
            Octets packet = form("55", inner);
            append(packet, carried(inner));
            return packet;
        }
        const std::string rule = std::to_string(protocol);
        return rules.contains(rule) ? form(rule) : drawn(random_.below(40));
    }

    Octets ipv4() {
        test::Ipv4 header;
        header.protocol = random_.pick<std::uint8_t>({1, 1, 4, 6, 6, 17, 41, 47, 50, 55, 132, 132, 132, 58, 99});
        header.payload = carried(header.protocol);
        header.options = random_.oneIn(3) ? form("Ipv4Options") : Octets{};
        header.options.resize(std::min<std::size_t>(header.options.size(), 40));
        header.typeOfService = random_.octet();
        header.fragment = random_.oneIn(5) ? static_cast<std::uint16_t>(random_.next()) : std::uint16_t{0x4000};
        if (random_.oneIn(10)) {
            header.headerWords = random_.octet() & 0xf;
        }
        header.totalLength = static_cast<std::uint16_t>(length(20 + header.options.size() + header.payload.size()));
        return test::ipv4(header);
    }

    Octets ipv6() {
        test::Ipv6 header;
        header.trafficClass = random_.octet();
        header.nextHeader = random_.pick<std::uint8_t>({58, 58, 4, 6, 17, 41, 132, 59});
        header.payload = carried(header.nextHeader);
        for (std::uint32_t count = random_.pick({0u, 0u, 1u, 2u, 4u}); count > 0; --count) {
            const auto type = random_.pick<std::uint8_t>({0, 43, 44, 50, 51, 60});
            header.payload = form(std::to_string(type), header.nextHeader) + header.payload;
            header.nextHeader = type;
        }
        header.payloadLength = static_cast<std::uint16_t>(length(header.payload.size()));
        return test::ipv6(header);
    }

    Random &random_;
    std::uint32_t depth_ = 0;
};

} // namespace

Octets generatedPacket(Random &random) {
    return Generator(random).packet();
}

Octets generatedPart(Random &random) {
    return Generator(random).part();
}

} // namespace netfloor::compare
