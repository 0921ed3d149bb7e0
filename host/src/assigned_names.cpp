// SPDX-License-Identifier: MIT
#include "netfloor-host/assigned_names.h"

#include <array>

#include "number_names.h"

namespace netfloor {
namespace {

constexpr std::array chunkNames = {NumberName{15, "AUTH"},        NumberName{64, "I-DATA"},
                                   NumberName{128, "ASCONF ACK"}, NumberName{130, "RE-CONFIG"},
                                   NumberName{132, "PAD"},        NumberName{192, "FORWARD TSN"},
                                   NumberName{193, "ASCONF"},     NumberName{194, "I-FORWARD TSN"}};

constexpr std::array payloadProtocols = {NumberName{1, "IUA"},
                                         NumberName{2, "M2UA"},
                                         NumberName{3, "M3UA"},
                                         NumberName{4, "SUA"},
                                         NumberName{5, "M2PA"},
                                         NumberName{18, "S1AP"},
                                         NumberName{19, "RUA"},
                                         NumberName{20, "HNBAP"},
                                         NumberName{27, "X2AP"},
                                         NumberName{46, "Diameter"},
                                         NumberName{50, "WebRTC control"},
                                         NumberName{60, "NGAP"},
                                         NumberName{61, "XnAP"}};

constexpr std::array icmpv6Messages = {
    NumberName{130, "multicast listener query"},    NumberName{131, "multicast listener report"},
    NumberName{132, "multicast listener done"},     NumberName{133, "router solicitation"},
    NumberName{134, "router advertisement"},        NumberName{135, "neighbor solicitation"},
    NumberName{136, "neighbor advertisement"},      NumberName{137, "redirect"},
    NumberName{143, "multicast listener report v2"}};

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
