// SPDX-License-Identifier: MIT
// What another program writes, line by line.
#pragma once

#include <cstdio>
#include <cstdlib>
#include <memory>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace netfloor::test {

[[nodiscard]] inline std::vector<std::string> linesOf(const std::string &command) {
    std::vector<std::string> lines;
    const std::unique_ptr<FILE, int (*)(FILE *)> pipe(popen(command.c_str(), "r"), pclose);
    std::string line;
    for (int letter = 0; pipe != nullptr && (letter = std::fgetc(pipe.get())) != EOF;) {
        if (letter == '\n') {
            lines.push_back(std::exchange(line, {}));
        } else {
            line += static_cast<char>(letter);
        }
    }
    return lines;
}

[[nodiscard]] inline std::vector<std::string> split(std::string_view text, char separator) {
    std::vector<std::string> parts(text.empty() ? 0 : 1);
    for (const char character : text) {
        if (character == separator) {
            parts.emplace_back();
        } else {
            parts.back() += character;
        }
    }
    return parts;
}

[[nodiscard]] inline bool isInstalled(const std::string &program) {
    return std::system((program + " --version >/dev/null 2>&1").c_str()) == 0;
}

} // namespace netfloor::test
