// SPDX-License-Identifier: MIT
#include "interrupt.h"

#include <array>
#include <cerrno>
#include <csignal>

#include <fcntl.h>
#include <unistd.h>

namespace netfloor::cli {

namespace {

constexpr std::array watched = {SIGINT, SIGTERM};

volatile std::sig_atomic_t signalThatCame = 0;
int nothingToRead = -1;

// The reader may wait for standard input, and starts again when a signal wakes it. It finds the end there.
extern "C" void netfloorInterrupted(int signal) {
    const int before = errno;
    signalThatCame = signal;
    (void)::dup2(nothingToRead, STDIN_FILENO);
    errno = before;
}

} // namespace

void watchForInterrupt() {
    nothingToRead = ::open("/dev/null", O_RDONLY | O_CLOEXEC);
    struct sigaction action = {};
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

void endIfInterrupted() {
    if (isInterrupted()) {
        (void)std::signal(signalThatCame, SIG_DFL);
        (void)std::raise(signalThatCame);
    }
}

} // namespace netfloor::cli
