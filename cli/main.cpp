// SPDX-License-Identifier: MIT
// netfloor: decodes the packets of a capture file, and lists what it can tell of them.
#include <cerrno>
#include <csignal>
#include <cstring>
#include <exception>
#include <iostream>
#include <new>
#include <string>
#include <string_view>
#include <variant>

#include <fcntl.h>
#include <unistd.h>

#include "decode.h"
#include "exit_code.h"
#include "fields/fields.h"
#include "interrupt.h"
#include "messages.h"
#include "netfloor-capture/errors.h"
#include "netfloor-host/plugin_host.h"
#include "options.h"
#include "output.h"
#include "plan.h"
#include "printers/json_schema.h"

namespace netfloor::cli {

namespace {

int number(ExitCode code) {
    return static_cast<int>(code);
}

int fail(ExitCode code, std::string_view sentence) {
    std::cerr << "netfloor: " << sentence << '\n';
    return number(code);
}

// The next file that is opened would become the standard output.
void refuseClosedOutput() {
    if (::fcntl(STDOUT_FILENO, F_GETFD) < 0) {
        throw OutputError("standard output is closed.");
    }
}

// Help and version are written by the parser of options.
void endAnswer() {
    errno = 0;
    if (std::cout.flush()) {
        return;
    }
    if (errno == EPIPE) {
        throw OutputClosed();
    }
    throw OutputError(std::string("the output cannot be written: ") + std::strerror(errno) + ".");
}

int runCommand(int argumentCount, char **arguments) {
    // A closed pipe is told by write(), not by a signal.
    (void)std::signal(SIGPIPE, SIG_IGN);
    const PrintableErrors printable;
    try {
        refuseClosedOutput();
        const auto parsed = parseOptions(argumentCount, arguments);
        if (const auto *const answered = std::get_if<ExitCode>(&parsed)) {
            endAnswer();
            return number(*answered);
        }
        const auto &options = std::get<Options>(parsed);
        if (options.command == Command::fields) {
            showFields(options);
            return number(ExitCode::good);
        }
        if (options.schema) {
            showPacketSchema();
            return number(ExitCode::good);
        }
        if (options.command == Command::plan) {
            return number(showPlan(options));
        }
        watchForInterrupt();
        const ExitCode code = decodeCapture(options);
        endIfInterrupted();
        return number(code);
    } catch (const OutputClosed &) {
        return number(ExitCode::good);
    } catch (const UsageError &error) {
        return fail(ExitCode::usage, error.what());
    } catch (const FilterError &error) {
        return fail(ExitCode::usage, error.what());
    } catch (const CaptureError &error) {
        return fail(ExitCode::noCapture, error.what());
    } catch (const CaptureWriteError &error) {
        return fail(ExitCode::noOutput, error.what());
    } catch (const PluginError &error) {
        return fail(ExitCode::noPlugin, error.what());
    } catch (const OutputError &error) {
        return fail(ExitCode::noOutput, error.what());
    } catch (const std::bad_alloc &) {
        return fail(ExitCode::noMemory, "memory ran out. A limit (ulimit -v) may be too low.");
    } catch (const std::exception &error) {
        return fail(ExitCode::fault, std::string("a fault of netfloor itself: ") + error.what() +
                                         ". Please report it, with the command line and the capture.");
    }
}

} // namespace

} // namespace netfloor::cli

int main(int argumentCount, char **arguments) {
    return netfloor::cli::runCommand(argumentCount, arguments);
}
