// SPDX-License-Identifier: MIT
// Names of assigned numbers for which a plug-in has none. All are empty for a number without a name.
#pragma once

#include <cstdint>
#include <string_view>

namespace netfloor {

// SCTP chunk types past those of RFC 9260: "ASCONF".
[[nodiscard]] std::string_view laterChunkName(std::uint32_t type);

// Payload protocol identifiers of SCTP: "M3UA".
[[nodiscard]] std::string_view payloadProtocolName(std::uint32_t identifier);

// ICMPv6 messages of neighbour discovery and multicast: "router advertisement".
[[nodiscard]] std::string_view icmpv6MessageName(std::uint32_t type);

} // namespace netfloor
