// SPDX-License-Identifier: MIT
// Where the values differ from tshark's, and why. Each row must be used on the captures.
#pragma once

#include <set>
#include <string_view>
#include <vector>

#include "peers/packet.h"

namespace netfloor::test {

struct KnownDifference {
    std::string_view why;
    std::vector<std::string_view> peers; // how the names of tshark's fields start
    bool (*applies)(const Packet &, const Difference &);
};

// Whether a header of IPv6 options has more than its first option.
inline bool optionsGoOn(const Packet &packet) {
    std::uint32_t optionOctets = 0; // by the lengths of the options headers
    for (const FieldReport &field : packet.md.fields) {
        switch (field.id) {
        case 222: optionOctets = field.value * 8 + 6; break;
        case 232: // Pad1
            if (optionOctets != 1) {
                return true;
            }
            break;
        case 227:
        case 239: // the length of PadN, or of an option that is skipped
            if (optionOctets != field.value + 2) {
                return true;
            }
            break;
        default: break;
        }
    }
    return false;
}

inline bool isLaterFragment(const Packet &packet) {
    return packet.value(294).value_or(0) > 0 || packet.value(198).value_or(0) > 0;
}

inline const std::vector<KnownDifference> knownDifferences = {
    {"a packet that the snap length has cut holds less than its length, and is not read past its end",
     {""},
     [](const Packet &packet, const Difference &difference) { return packet.isCut && difference.oursAreFewer(); }},
    {"tshark gives up where the header length is below 5, or the total length below the header length",
     {"ip.", "udp."},
     [](const Packet &packet, const Difference &difference) {
         const auto headerWords = packet.value(152);
         return headerWords && (headerWords < 5 || *packet.value(153) < *headerWords * 4) && difference.oursAreMore();
     }},
    {"tshark gives the last address of a source route as the destination",
     {"ip.dst"},
     [](const Packet &packet, const Difference &) { return packet.has(329) || packet.has(339); }},
    {"an IPv4 option of a type that the grammar does not know ends the options",
     {"ip.opt.type"},
     [](const Packet &, const Difference &difference) {
         static const std::set<unsigned long> known = {0, 1, 7, 68, 130, 131, 136, 137};
         return difference.oursAreFewer() && !known.contains(difference.firstMissing());
     }},
    {"after the last IPv4 option an octet 0 of the payload is read as End of Option List",
     {"ip.opt.type", "icmp."},
     [](const Packet &packet, const Difference &difference) {
         return packet.has(381) &&
                (difference.peer.starts_with("icmp.") ? difference.oursAreFewer() : difference.oursAreMore());
     }},
    {"a later fragment is read as if a header began there: in IPv6 always, in IPv4 where DF is set",
     {"udp.", "icmpv6."},
     [](const Packet &packet, const Difference &difference) {
         return isLaterFragment(packet) && difference.oursAreMore();
     }},
    {"after the addresses of the header that an ICMP message quotes, the octets are one field",
     {"icmp.", "udp.", "tcp.", "sctp."},
     [](const Packet &packet, const Difference &difference) { return packet.has(605) && difference.oursAreFewer(); }},
    {"an ICMP message that has one code only is not read with another",
     {"icmp."},
     [](const Packet &packet, const Difference &difference) {
         return packet.md.fields.back().id == 537 && difference.oursAreFewer();
     }},
    {"what GRE carries is octets",
     {"ip.", "gre.", "icmp.", "udp.", "tcp."},
     [](const Packet &packet, const Difference &difference) { return packet.has(698) && difference.oursAreFewer(); }},
    {"tshark shows the key of GRE version 1 (RFC 2637) as two fields",
     {"gre.key"},
     [](const Packet &packet, const Difference &difference) {
         return packet.value(697) == 1U && difference.oursAreMore();
     }},
    {"tshark shows nothing of a header that is cut short",
     {"gre.", "sctp."},
     [](const Packet &packet, const Difference &difference) {
         return !packet.has(698) && !packet.has(798) && difference.oursAreMore();
     }},
    {"a TCP option of a kind that the grammar does not know ends the options",
     {"tcp.option_kind"},
     [](const Packet &, const Difference &difference) {
         static const std::set<unsigned long> known = {0, 1, 2, 3, 4, 5, 8, 19};
         return difference.oursAreFewer() && !known.contains(difference.firstMissing());
     }},
    {"End of Option List is an option like the others, and those after it are read",
     {"tcp.option"},
     [](const Packet &packet, const Difference &difference) { return packet.has(441) && difference.oursAreMore(); }},
    {"the octets after the first option of an IPv6 header are read as the next header",
     {"ipv6.opt.", "ipv6.dstopts.", "ipv6.routing.", "ah.", "icmpv6.", "udp.", "tcp."},
     [](const Packet &packet, const Difference &) { return optionsGoOn(packet); }},
    {"a routing header of an unknown type with segments left ends the chain",
     {"ipv6.", "udp.", "tcp."},
     [](const Packet &packet, const Difference &difference) {
         return packet.value(188).value_or(0) > 0 && difference.oursAreFewer();
     }},
    {"an authentication header has its fixed fields even if its length says less",
     {"icmpv6."},
     [](const Packet &packet, const Difference &) { return packet.value(206) == 0U; }},
    {"compressed payload (protocol 108) is data; tshark unpacks it",
     {"ipv6.", "tcp."},
     [](const Packet &packet, const Difference &difference) {
         return packet.any([](const FieldReport &field) { return field.id == 220 && field.value == 108; }) &&
                difference.oursAreFewer();
     }},
    {"IPv6 carries no IPv4",
     {"ip.", "gre.", "udp."},
     [](const Packet &packet, const Difference &difference) {
         return packet.value(220) == 4U && difference.oursAreFewer();
     }},
    {"the packet that an ICMPv6 message quotes is octets",
     {"ipv6.", "ah.", "icmpv6.", "udp.", "tcp."},
     [](const Packet &packet, const Difference &difference) {
         return packet.has(247) && *packet.value(247) < 128 && difference.oursAreFewer();
     }},
    {"of ICMPv6 messages above 129 only the type is read",
     {"icmpv6.code"},
     [](const Packet &packet, const Difference &difference) {
         return packet.value(247).value_or(0) > 129 && difference.oursAreFewer();
     }},
    {"the padding after an SCTP parameter is read as the type of the next one",
     {"sctp.parameter_type"},
     [](const Packet &packet, const Difference &difference) {
         return packet.any([](const FieldReport &field) { return field.id == 848 && field.value % 4 != 0; }) &&
                !difference.oursAreMore();
     }},
};

} // namespace netfloor::test
