// SPDX-License-Identifier: MIT
// Ctrl-C, and SIGTERM: the first one ends the reading, so that totals follow. A second one ends the process.
#pragma once

namespace netfloor::cli {

void watchForInterrupt();

[[nodiscard]] bool isInterrupted();

// An interrupt wakes the thread that called this last, if it waits for standard input.
void readsInThisThread();

// Ends the process by the signal that interrupted it, which a shell that runs a script looks for. Does nothing where
// there was none.
void endIfInterrupted();

} // namespace netfloor::cli
