// SPDX-License-Identifier: MIT
// What must hold for any packet under any host, and what no sanitizer sees.
#pragma once

#include "host.h"

namespace netfloor::compare {

// Runs the four passes over the packet, and ends the process where one of these does not hold: the passes agree with
// one another; stacks, limits, texts and elements are in order at each call of the host; the working copy is restored;
// bits outside the packet make no difference. True where the MD pass ran to its end.
bool checkPasses(const Plugin &plugin, const Input &input);

// A plug-in sets its key fields up once for good. After this, it has not done so by an input.
void setKeyFieldsUp(const Plugin &plugin);

} // namespace netfloor::compare
