// SPDX-License-Identifier: MIT
#include "support/memory.h"

#include <algorithm>
#include <exception>
#include <new>
#include <system_error>

#define WIN32_LEAN_AND_MEAN
#include <windows.h>

namespace netfloor::test {
namespace {

// Windows reserves stacks in steps of 64 KiB, and takes a part of the first for itself.
constexpr std::size_t smallStack = std::size_t{128} * 1024;

struct Work {
    const std::function<void()> *call;
    std::exception_ptr thrown;
};

DWORD WINAPI runWork(void *argument) {
    auto *const work = static_cast<Work *>(argument);
    try {
        (*work->call)();
    } catch (...) {
        work->thrown = std::current_exception();
    }
    return 0;
}

void check(bool done, const char *what) {
    if (!done) {
        throw std::system_error(static_cast<int>(GetLastError()), std::system_category(), what);
    }
}

} // namespace

GuardedOctets::GuardedOctets(std::span<const std::uint8_t> octets) {
    SYSTEM_INFO system = {};
    GetSystemInfo(&system);
    const std::size_t page = system.dwPageSize;
    const std::size_t open = (octets.size() + page) / page * page;
    mappedOctets_ = open + page;
    mapping_ = VirtualAlloc(nullptr, mappedOctets_, MEM_RESERVE | MEM_COMMIT, PAGE_READWRITE);
    if (mapping_ == nullptr) {
        throw std::bad_alloc();
    }
    auto *const start = static_cast<std::uint8_t *>(mapping_);
    DWORD before = 0;
    check(VirtualProtect(start + open, page, PAGE_NOACCESS, &before) != 0, "VirtualProtect");
    octets_ = {start + open - octets.size(), octets.size()};
    std::copy(octets.begin(), octets.end(), octets_.begin());
}

GuardedOctets::~GuardedOctets() {
    VirtualFree(mapping_, 0, MEM_RELEASE);
}

void onSmallStack(const std::function<void()> &work) {
    Work argument{&work, nullptr};
    HANDLE const thread =
        CreateThread(nullptr, smallStack, runWork, &argument, STACK_SIZE_PARAM_IS_A_RESERVATION, nullptr);
    check(thread != nullptr, "CreateThread");
    WaitForSingleObject(thread, INFINITE);
    CloseHandle(thread);
    if (argument.thrown) {
        std::rethrow_exception(argument.thrown);
    }
}

} // namespace netfloor::test
