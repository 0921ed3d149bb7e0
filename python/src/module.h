// SPDX-License-Identifier: MIT
#pragma once

#include <nanobind/nanobind.h>

namespace netfloor::python {

// The parts of the module.
void addScan(nanobind::module_ &module);
void addShards(nanobind::module_ &module);
void addPackets(nanobind::module_ &module);

} // namespace netfloor::python
