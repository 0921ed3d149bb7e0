// SPDX-License-Identifier: MIT
// Changes packets so that many of them stay plausible: pieces of the grammar come in, lengths follow.
#pragma once

#include <cstddef>
#include <cstdint>
#include <span>

#include "random.h"

namespace netfloor::compare {

// Changes an input, which fills the first `size` octets of `room`: its head, by `changeHead`, or the packet after that.
// Gives the new size.
std::size_t mutateInput(std::span<std::uint8_t> room, std::size_t size, std::size_t headOctets, unsigned seed,
                        void (*changeHead)(std::span<std::uint8_t> head, Random &random));

} // namespace netfloor::compare
