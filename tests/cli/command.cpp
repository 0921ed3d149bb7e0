// SPDX-License-Identifier: MIT
#include "cli/command.h"

#include <algorithm>
#include <cstdlib>
#include <fstream>
#include <sstream>

#include <gtest/gtest.h>
#include <sys/wait.h>

namespace netfloor::test {

namespace {

std::string contents(const std::string &path) {
    std::ostringstream text;
    text << std::ifstream(path, std::ios::binary).rdbuf();
    return text.str();
}

// Each part stands in the text after the one before.
void expectParts(const std::string &text, std::string_view parts) {
    EXPECT_EQ(text.empty(), parts.empty()) << text;
    constexpr std::string_view divider = "...";
    std::size_t from = 0;
    while (!parts.empty()) {
        const std::string_view part = parts.substr(0, parts.find(divider));
        const std::size_t at = text.find(part, from);
        ASSERT_NE(at, std::string::npos) << "no '" << part << "' in:\n" << text.substr(from);
        from = at + part.size();
        parts.remove_prefix(std::min(parts.size(), part.size() + divider.size()));
    }
}

} // namespace

Outcome shell(const std::string &line) {
    const std::string script = folder() + "/script";
    std::ofstream(script) << "C='" NETFLOOR_CAPTURES "'\nP='" NETFLOOR_PLUGIN "'\nT='" << folder()
                          << "'\nN='" NETFLOOR_COMMAND "'\nnetfloor() { \"$N\" \"$@\"; }\n"
                          << line << '\n';
    const int status = std::system(("bash " + script + " >" + script + ".out 2>" + script + ".err").c_str());
    return {WEXITSTATUS(status), contents(script + ".out"), contents(script + ".err")};
}

void check(const std::vector<Case> &cases) {
    for (const Case &one : cases) {
        SCOPED_TRACE(one.line);
        const Outcome outcome = shell(one.line);
        EXPECT_EQ(outcome.exitCode, one.exitCode) << outcome.err;
        expectParts(outcome.out, one.out);
        expectParts(outcome.err, one.err);
        if (*one.absent != '\0') {
            EXPECT_EQ((outcome.out + outcome.err).find(one.absent), std::string::npos) << one.absent;
        }
        if (one.lines >= 0) {
            EXPECT_EQ(std::ranges::count(outcome.out, '\n'), one.lines) << outcome.out;
        }
    }
}

void checkExact(const std::vector<ExactCase> &cases) {
    for (const auto &[line, out] : cases) {
        const Outcome outcome = shell(line);
        EXPECT_EQ(outcome.out, out) << line << '\n' << outcome.err;
    }
}

std::size_t countOf(std::string_view text, std::string_view part) {
    std::size_t count = 0;
    for (std::size_t at = text.find(part); at != std::string_view::npos; at = text.find(part, at + 1)) {
        ++count;
    }
    return count;
}

} // namespace netfloor::test
