// SPDX-License-Identifier: MIT
// netfloor: decodes the packets of a capture file, and lists what it can tell of them.
#include <csignal>
#include <exception>
#include <iostream>
#include <variant>

#include "capture/capture.h"
#include "decode.h"
#include "exit_code.h"
#include "fields/fields.h"
#include "netfloor-host/plugin_host.h"
#include "options.h"
#include "output.h"

namespace netfloor::cli {

namespace {

int number(ExitCode code) {
    return static_cast<int>(code);
}

int fail(ExitCode code, const std::exception &error) {
    std::cerr << "netfloor: " << error.what() << '\n';
    return number(code);
}

int runCommand(int argumentCount, char **arguments) {
    // A closed pipe is told by write(), not by a signal.
    (void)std::signal(SIGPIPE, SIG_IGN);
    try {
        const auto parsed = parseOptions(argumentCount, arguments);
        if (const auto *const answered = std::get_if<ExitCode>(&parsed)) {
            return number(*answered);
        }
        const auto &options = std::get<Options>(parsed);
        if (options.command == Command::fields) {
            showFields(options);
            return number(ExitCode::good);
        }
        return number(decodeCapture(options));
    } catch (const OutputClosed &) {
        return number(ExitCode::good);
    } catch (const UsageError &error) {
        return fail(ExitCode::usage, error);
    } catch (const CaptureError &error) {
        return fail(ExitCode::noCapture, error);
    } catch (const PluginError &error) {
        return fail(ExitCode::noPlugin, error);
    } catch (const std::exception &error) {
        return fail(ExitCode::noOutput, error);
    }
}

} // namespace

} // namespace netfloor::cli

int main(int argumentCount, char **arguments) {
    return netfloor::cli::runCommand(argumentCount, arguments);
}
