// SPDX-License-Identifier: MIT
// Known answers: what the plug-in does with captured, cut, changed and generated packets, under ordinary and unusual
// hosts, as a digest of all host calls and results for each group of packets.
//
//     digests PLUGIN           prints them, a line a group
//     digests PLUGIN FILE      compares them with those of FILE
//
// The exit code is 0 when they are the same, 1 when they are not, 2 when they could not be made.
#include <cstdio>
#include <exception>
#include <fstream>
#include <iterator>
#include <sstream>
#include <stdexcept>
#include <string>

#include "known_answers.h"

namespace netfloor::compare {
namespace {

std::string line(const std::string &name, std::uint64_t digest) {
    char text[32];
    std::snprintf(text, sizeof text, " %016llx\n", static_cast<unsigned long long>(digest));
    return name + text;
}

std::string digests(const Plugin &plugin) {
    std::string text = line("exports", exportsDigest(plugin));
    const Inputs inputs({NETFLOOR_CAPTURES}, 1);
    for (std::uint64_t first = 0; first < answeredPackets; first += packetsTogether) {
        text += line(std::to_string(first), groupDigest(plugin, inputs, first));
    }
    return text;
}

std::string content(const char *path) {
    std::ifstream file(path);
    std::string text((std::istreambuf_iterator<char>(file)), std::istreambuf_iterator<char>());
    if (text.empty()) {
        throw std::runtime_error(std::string(path) + " cannot be read");
    }
    return text;
}

// False, with the first line that differs, when they are not the same.
bool same(const std::string &known, const std::string &now) {
    if (known == now) {
        return true;
    }
    std::istringstream knownLines(known);
    std::istringstream lines(now);
    std::string old;
    for (std::string one; std::getline(lines, one); old.clear()) {
        if (!std::getline(knownLines, old) || old != one) {
            std::printf("DIFFERENCE\nknown: %s\nnow:   %s\n", old.c_str(), one.c_str());
            break;
        }
    }
    std::puts("scripts/first-difference.sh shows the first call that differs, and what to do.");
    return false;
}

} // namespace
} // namespace netfloor::compare

int main(int count, char **arguments) {
    using namespace netfloor::compare;
    try {
        if (count < 2) {
            throw std::runtime_error("usage: digests PLUGIN [FILE]");
        }
        const std::string now = digests(Plugin(arguments[1]));
        if (count > 2) {
            return same(content(arguments[2]), now) ? 0 : 1;
        }
        std::fputs(now.c_str(), stdout);
        return 0;
    } catch (const std::exception &error) {
        std::fprintf(stderr, "digests: %s\n", error.what());
        return 2;
    }
}
