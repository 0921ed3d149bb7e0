// SPDX-License-Identifier: MIT
#include "capture/allocations.h"

#include <cstddef>

#ifdef __has_feature // clang; g++ has macros for them
#if __has_feature(address_sanitizer) || __has_feature(thread_sanitizer)
#define NETFLOOR_OTHER_HEAP
#endif
#elif defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
#define NETFLOOR_OTHER_HEAP
#endif

#ifdef NETFLOOR_OTHER_HEAP

std::optional<std::uint64_t> netfloor::test::allocations() {
    return std::nullopt;
}

#else

namespace {

thread_local std::uint64_t given = 0;

} // namespace

// The C library lets a program have its own malloc(), which all libraries then use.
extern "C" {

void *__libc_malloc(std::size_t size);
void *__libc_calloc(std::size_t count, std::size_t size);
void *__libc_realloc(void *block, std::size_t size);

void *malloc(std::size_t size) {
    ++given;
    return __libc_malloc(size);
}

void *calloc(std::size_t count, std::size_t size) {
    ++given;
    return __libc_calloc(count, size);
}

void *realloc(void *block, std::size_t size) {
    ++given;
    return __libc_realloc(block, size);
}
}

std::optional<std::uint64_t> netfloor::test::allocations() {
    return given;
}

#endif
