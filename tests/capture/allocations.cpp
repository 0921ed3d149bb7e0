// SPDX-License-Identifier: MIT
#include "capture/allocations.h"

#include <cstddef>

namespace {

thread_local std::uint64_t count = 0;

} // namespace

#ifndef __SANITIZE_ADDRESS__

// The C library lets a program have its own malloc(), which all libraries then use.
extern "C" {

void *__libc_malloc(std::size_t size);
void *__libc_calloc(std::size_t count, std::size_t size);
void *__libc_realloc(void *block, std::size_t size);

void *malloc(std::size_t size) {
    ++count;
    return __libc_malloc(size);
}

void *calloc(std::size_t number, std::size_t size) {
    ++count;
    return __libc_calloc(number, size);
}

void *realloc(void *block, std::size_t size) {
    ++count;
    return __libc_realloc(block, size);
}
}

#endif

namespace netfloor::test {

std::optional<std::uint64_t> allocations() {
#ifdef __SANITIZE_ADDRESS__
    return std::nullopt;
#else
    return count;
#endif
}

} // namespace netfloor::test
