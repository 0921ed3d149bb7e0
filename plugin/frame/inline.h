// SPDX-License-Identifier: MIT
// For what runs for nearly every field: it is inlined whatever the compiler thinks of it, so that the reader stays in
// registers. Not under AddressSanitizer, which has no use for that and would take minutes to compile it.
#pragma once

#ifdef __has_feature
#if __has_feature(address_sanitizer)
#define NETFLOOR_SANITIZED
#endif
#endif
#ifdef __SANITIZE_ADDRESS__
#define NETFLOOR_SANITIZED
#endif

#ifdef NETFLOOR_SANITIZED
#define NETFLOOR_INLINE
#else
#define NETFLOOR_INLINE __attribute__((always_inline))
#endif
