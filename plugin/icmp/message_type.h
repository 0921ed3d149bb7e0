// SPDX-License-Identifier: MIT
// The type of an ICMP message (RFC 792, RFC 950, RFC 1256), with which every message starts.
#pragma once

#include <array>
#include <cstdint>

#include "frame/field.h"
#include "frame/field_list.h"
#include "frame/field_step.h"
#include "ip/outer_protocol.h"

namespace netfloor::plugin::icmp {

enum : std::uint32_t {
    typeEchoReply = 0,
    typeDestinationUnreachable = 3,
    typeSourceQuench = 4,
    typeRedirect = 5,
    typeEcho = 8,
    typeRouterAdvertisement = 9,
    typeRouterSolicitation = 10,
    typeTimeExceeded = 11,
    typeParameterProblem = 12,
    typeTimestamp = 13,
    typeTimestampReply = 14,
    typeInformationRequest = 15,
    typeInformationReply = 16,
    typeAddressMaskRequest = 17,
    typeAddressMaskReply = 18,
};

// clang-format off
inline constexpr std::array typeRows = {
    ValueName{typeEchoReply,              "Echo Reply Message",                "ERM"},
    ValueName{typeDestinationUnreachable, "Destination Unreachable Message",   "DUM"},
    ValueName{typeSourceQuench,           "Source Quench Message",             "SQM"},
    ValueName{typeRedirect,               "Redirect Message",                  "RM"},
    ValueName{typeEcho,                   "Echo Message",                      "EM"},
    ValueName{typeRouterAdvertisement,    "ICMP Router Advertisement Message", "IRAM"},
    ValueName{typeRouterSolicitation,     "ICMP Router Solicitation Message",  "RSM"},
    ValueName{typeTimeExceeded,           "Time Exceeded Message",             "TEM"},
    ValueName{typeParameterProblem,       "Parameter Problem Message",         "PPM"},
    ValueName{typeTimestamp,              "Timestamp Message",                 "TM"},
    ValueName{typeTimestampReply,         "Timestamp Reply Message",           "TRM"},
    ValueName{typeInformationRequest,     "Information Request Message",       "IReqM"},
    ValueName{typeInformationReply,       "Information Reply Message",         "IRepM"},
    ValueName{typeAddressMaskRequest,     "Address Mask Request Message",      "MReq"},
    ValueName{typeAddressMaskReply,       "Address Mask Reply Message",        "MRep"},
};
inline constexpr ValueNames typeNames{typeRows, "Reserved", "Rsvd", true};

inline constexpr Field typeInIpInIp  {531, "ICMP Message Type", octets(1), "%n=%-S", &typeNames, "IPinIP - ICMP - %-s (%u)"};
inline constexpr Field typeInMinimal {535, "ICMP Message Type", octets(1), "%n=%-S", &typeNames, "MIPinIP - ICMP - %-s (%u)"};
inline constexpr Field type          {537, "ICMP Message Type", octets(1), "%n=%-S", &typeNames, "ICMP - %-s (%u)"};
// clang-format on

struct MessageVariables {
    std::uint32_t icmpType;
};

template <class Pass>
NETFLOOR_INLINE inline void messageType(Reader<Pass> &reader) {
    readByOuterProtocol<typeInIpInIp, typeInMinimal, type>(reader, &reader.variables().icmpType);
}

using TypeRows = Rows<FieldList<typeInIpInIp, typeInMinimal, type>, FieldList<typeInIpInIp, typeInMinimal, type>>;

} // namespace netfloor::plugin::icmp
