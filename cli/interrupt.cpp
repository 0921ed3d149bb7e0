// SPDX-License-Identifier: MIT
#include "interrupt.h"

#include <array>
#include <atomic>
#include <cerrno>
#include <csignal>

#include <fcntl.h>
#include <pthread.h>
#include <unistd.h>

namespace netfloor::cli {

namespace {

constexpr std::array watched = {SIGINT, SIGTERM};

constexpr int wakingSignal = SIGURG; // does nothing where nobody waits

std::atomic<int> signalThatCame = 0;
std::atomic<pthread_t> reader;
static_assert(decltype(signalThatCame)::is_always_lock_free && decltype(reader)::is_always_lock_free);
int nothingToRead = -1;

// The reader may wait for standard input, and starts again when a signal wakes it. It finds the end there.
extern "C" void netfloorInterrupted(int signal) {
    const int before = errno;
    signalThatCame = signal;
    (void)::dup2(nothingToRead, STDIN_FILENO);
    (void)::pthread_kill(reader, wakingSignal);
    errno = before;
}

extern "C" void netfloorWoken(int /*signal*/) {}

} // namespace

void watchForInterrupt() {
    nothingToRead = ::open("/dev/null", O_RDONLY | O_CLOEXEC);
    readsInThisThread();
    struct sigaction action = {};
    action.sa_handler = netfloorWoken;
    (void)::sigaction(wakingSignal, &action, nullptr);
    action.sa_handler = netfloorInterrupted;
    action.sa_flags = static_cast<int>(SA_RESETHAND); // and not SA_RESTART
    for (const int signal : watched) {
        struct sigaction old = {};
        // What the parent ignores, such as Ctrl-C for a job in the background, stays ignored.
        if (::sigaction(signal, nullptr, &old) == 0 && old.sa_handler != SIG_IGN) {
            (void)::sigaction(signal, &action, nullptr);
        }
    }
}

bool isInterrupted() {
    return signalThatCame != 0;
}

void readsInThisThread() {
    reader = ::pthread_self();
}

void endIfInterrupted() {
    if (isInterrupted()) {
        (void)std::signal(signalThatCame, SIG_DFL);
        (void)std::raise(signalThatCame);
    }
}

} // namespace netfloor::cli
