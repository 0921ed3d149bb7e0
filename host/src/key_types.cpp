// SPDX-License-Identifier: MIT
#include "key_types.h"

#include <algorithm>
#include <iterator>

namespace netfloor {
namespace {

struct NamedType {
    std::string_view name;
    KeyType type;
};

using enum KeyType;

// By name, in the order of their characters; a name that is not here is a number of 16 bits.
constexpr NamedType namedTypes[] = {
    {"Acknowledgement Number", number32},
    {"Address Mask", ipv4Address},
    {"Checksum Present", number8},
    {"Code", number8},
    {"Code ", number8},
    {"Cumulative TSN Ack", number32},
    {"DF", number8},
    {"Data Offset", number8},
    {"Destination Address", ipv4Address},
    {"Destination IP Address", ipv6Address},
    {"Embedded IP Protocols", number8},
    {"FIN", number8},
    {"GRE Key", number32},
    {"Header Extention length", number8},
    {"ICMP Message Type", number8},
    {"IP Address", ipv6Address},
    {"IPinIP Protocol", number8},
    {"Initial Transmission Sequence Number(I_TSN)", number32},
    {"Key Present", number8},
    {"M Flag", number8},
    {"MF", number8},
    {"MIPinIP Protocol", number8},
    {"Next Header", number8},
    {"Opt Data Length", number8},
    {"Option Type", number8},
    {"Original Dest Address", ipv4Address},
    {"Original Internet Header Length", number8},
    {"Original Src Address", ipv4Address},
    {"Payload Protocol Identifier", number32},
    {"Protocol", number8},
    {"RST", number8},
    {"SCTP Chunk Type", number8},
    {"SPI", number32},
    {"SYN", number8},
    {"Sequence Number", number32},
    {"Sequence Number Present", number8},
    {"Sequency Number", number32},
    {"Source Address", ipv4Address},
    {"Source IP Address", ipv6Address},
    {"TSN", number32},
    {"Time to Live", number8},
    {"Version", number8},
};

static_assert(std::ranges::is_sorted(namedTypes, {}, &NamedType::name));

} // namespace

KeyType keyTypeOf(std::string_view fieldName) {
    const auto *const found = std::ranges::lower_bound(namedTypes, fieldName, {}, &NamedType::name);
    return found != std::end(namedTypes) && found->name == fieldName ? found->type : number16;
}

} // namespace netfloor
