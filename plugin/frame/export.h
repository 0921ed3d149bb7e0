// SPDX-License-Identifier: MIT
// Marks a function as an export of the library; all else is hidden.
#pragma once

#ifdef _WIN32
#define NETFLOOR_EXPORT __declspec(dllexport)
#else
#define NETFLOOR_EXPORT [[gnu::visibility("default")]]
#endif
