// SPDX-License-Identifier: MIT
// The page of `netfloor html` without its data, made from the files of this folder by embed.cmake.
#pragma once

#include <string_view>

namespace netfloor::cli {

[[nodiscard]] std::string_view pageStart(); // the data of the packets follow, see printers/page_data.h
[[nodiscard]] std::string_view pageEnd();

} // namespace netfloor::cli
