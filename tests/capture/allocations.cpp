// SPDX-License-Identifier: MIT
#include "capture/allocations.h"

#include <cstddef>

#ifdef __SANITIZE_ADDRESS__

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
