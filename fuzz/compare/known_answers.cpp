// SPDX-License-Identifier: MIT
#include "known_answers.h"

namespace netfloor::compare {

void runGroup(Plugin &plugin, const Inputs &inputs, std::uint64_t first, Trace::Keeps keeps, const Ran &ran) {
    Trace trace(keeps);
    bool isAsLoaded = false;
    for (std::uint64_t number = first; number < first + packetsTogether; ++number) {
        const Input input = inputs.input(number);
        const bool ownKeys = input.plan.keyStatus != 1;
        if (number == first || (ownKeys && !isAsLoaded)) {
            plugin.loadAnew();
        }
        for (const Pass pass : {Pass::md, Pass::to, Pass::mv, Pass::xtr}) {
            const bool good = run(plugin, pass, input, trace);
            ran(number, input, pass, trace, good);
        }
        isAsLoaded = ownKeys;
        if (ownKeys) {
            plugin.loadAnew();
        }
    }
}

std::uint64_t groupDigest(Plugin &plugin, const Inputs &inputs, std::uint64_t first) {
    std::uint64_t digest = 0;
    runGroup(plugin, inputs, first, Trace::Keeps::octets,
             [&](std::uint64_t, const Input &, Pass, const Trace &trace, bool good) {
                 digest = trace.digest(digest ^ static_cast<std::uint64_t>(good));
             });
    return digest;
}

std::uint64_t exportsDigest(const Plugin &plugin) {
    Trace exports;
    traceExports(plugin, exports);
    return exports.digest(0);
}

} // namespace netfloor::compare
