// SPDX-License-Identifier: MIT
#include "netfloor-host/assigned_names.h"

#include <algorithm>
#include <array>
#include <span>
#include <utility>

namespace netfloor {
namespace {

using Name = std::pair<std::uint32_t, std::string_view>;

constexpr std::array chunkNames = {Name{15, "AUTH"},       Name{64, "I-DATA"},        Name{128, "ASCONF ACK"},
                                   Name{130, "RE-CONFIG"}, Name{132, "PAD"},          Name{192, "FORWARD TSN"},
                                   Name{193, "ASCONF"},    Name{194, "I-FORWARD TSN"}};

constexpr std::array payloadProtocols = {Name{1, "IUA"},
                                         Name{2, "M2UA"},
                                         Name{3, "M3UA"},
                                         Name{4, "SUA"},
                                         Name{5, "M2PA"},
                                         Name{18, "S1AP"},
                                         Name{19, "RUA"},
                                         Name{20, "HNBAP"},
                                         Name{27, "X2AP"},
                                         Name{46, "Diameter"},
                                         Name{50, "WebRTC control"},
                                         Name{60, "NGAP"},
                                         Name{61, "XnAP"}};

constexpr std::array icmpv6Messages = {Name{130, "multicast listener query"},    Name{131, "multicast listener report"},
                                       Name{132, "multicast listener done"},     Name{133, "router solicitation"},
                                       Name{134, "router advertisement"},        Name{135, "neighbor solicitation"},
                                       Name{136, "neighbor advertisement"},      Name{137, "redirect"},
                                       Name{143, "multicast listener report v2"}};

std::string_view nameIn(std::span<const Name> names, std::uint32_t number) {
    const auto found = std::ranges::find(names, number, &Name::first);
    return found == names.end() ? std::string_view() : found->second;
}

} // namespace

std::string_view laterChunkName(std::uint32_t type) {
    return nameIn(chunkNames, type);
}

std::string_view payloadProtocolName(std::uint32_t identifier) {
    return nameIn(payloadProtocols, identifier);
}

std::string_view icmpv6MessageName(std::uint32_t type) {
    return nameIn(icmpv6Messages, type);
}

} // namespace netfloor
