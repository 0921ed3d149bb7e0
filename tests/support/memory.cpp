// SPDX-License-Identifier: MIT
#include "support/memory.h"

#include <algorithm>
#include <cerrno>
#include <exception>
#include <new>
#include <system_error>

#include <pthread.h>
#include <sys/mman.h>
#include <unistd.h>

namespace netfloor::test {
namespace {

#ifdef __has_feature // clang; g++ has a macro for it
#if __has_feature(address_sanitizer)
#define NETFLOOR_LARGE_FRAMES
#endif
#elif defined(__SANITIZE_ADDRESS__)
#define NETFLOOR_LARGE_FRAMES
#endif

#ifdef NETFLOOR_LARGE_FRAMES
constexpr std::size_t smallStack = std::size_t{512} * 1024;
#else
constexpr std::size_t smallStack = std::size_t{64} * 1024;
#endif

struct Work {
    const std::function<void()> *call;
    std::exception_ptr thrown;
};

void *runWork(void *argument) {
    auto *const work = static_cast<Work *>(argument);
    try {
        (*work->call)();
    } catch (...) {
        work->thrown = std::current_exception();
    }
    return nullptr;
}

void check(int error, const char *what) {
    if (error != 0) {
        throw std::system_error(error, std::generic_category(), what);
    }
}

} // namespace

GuardedOctets::GuardedOctets(std::span<const std::uint8_t> octets) {
    const auto page = static_cast<std::size_t>(sysconf(_SC_PAGESIZE));
    const std::size_t open = (octets.size() + page) / page * page;
    mappedOctets_ = open + page;
    mapping_ = mmap(nullptr, mappedOctets_, PROT_READ | PROT_WRITE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0);
    if (mapping_ == MAP_FAILED) {
        throw std::bad_alloc();
    }
    auto *const start = static_cast<std::uint8_t *>(mapping_);
    check(mprotect(start + open, page, PROT_NONE) == 0 ? 0 : errno, "mprotect");
    octets_ = {start + open - octets.size(), octets.size()};
    std::copy(octets.begin(), octets.end(), octets_.begin());
}

GuardedOctets::~GuardedOctets() {
    munmap(mapping_, mappedOctets_);
}

void onSmallStack(const std::function<void()> &work) {
    Work argument{&work, nullptr};
    pthread_attr_t attributes;
    check(pthread_attr_init(&attributes), "pthread_attr_init");
    check(pthread_attr_setstacksize(&attributes, smallStack), "pthread_attr_setstacksize");
    pthread_t thread{};
    const int error = pthread_create(&thread, &attributes, runWork, &argument);
    pthread_attr_destroy(&attributes);
    check(error, "pthread_create");
    check(pthread_join(thread, nullptr), "pthread_join");
    if (argument.thrown) {
        std::rethrow_exception(argument.thrown);
    }
}

} // namespace netfloor::test
