// SPDX-License-Identifier: MIT
// Changes packets so that many of them stay plausible: pieces of the grammar come in, lengths follow.
#pragma once

#include <cstddef>
#include <cstdint>
#include <span>

namespace netfloor::compare {

// Changes the packet that fills the first `size` octets of `room`. Gives its new size.
std::size_t mutatePacket(std::span<std::uint8_t> room, std::size_t size, std::uint64_t seed);

} // namespace netfloor::compare
