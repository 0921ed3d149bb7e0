// SPDX-License-Identifier: MIT
#include "known_answers.h"

namespace netfloor::compare {
namespace {

std::uint64_t digestOf(const Plugin &plugin, const Input &input, std::uint64_t before) {
    static Trace trace;
    const bool ownKeys = input.plan.keyStatus != 1;
    if (ownKeys) {
        plugin.setVariables(plugin.asLoaded);
    }
    std::uint64_t digest = before;
    for (const Pass pass : {Pass::md, Pass::to, Pass::mv, Pass::xtr}) {
        const bool good = run(plugin, pass, input, false, trace);
        digest = trace.digest(digest ^ static_cast<std::uint64_t>(good));
    }
    if (ownKeys) {
        plugin.setVariables(plugin.asLoaded);
    }
    return digest;
}

} // namespace

std::uint64_t groupDigest(const Plugin &plugin, const Inputs &inputs, std::uint64_t first) {
    plugin.setVariables(plugin.asLoaded);
    std::uint64_t digest = 0;
    for (std::uint64_t number = first; number < first + packetsTogether; ++number) {
        digest = digestOf(plugin, inputs.input(number), digest);
    }
    return digest;
}

std::uint64_t exportsDigest(const Plugin &plugin) {
    Trace exports;
    traceExports(plugin, exports);
    return exports.digest(0);
}

} // namespace netfloor::compare
