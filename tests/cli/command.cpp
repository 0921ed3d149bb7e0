// SPDX-License-Identifier: MIT
#include "cli/command.h"

#include <cstdlib>
#include <fstream>
#include <sstream>

#include <sys/wait.h>

namespace netfloor::test {

namespace {

std::string contents(const std::string &path) {
    std::ostringstream text;
    text << std::ifstream(path, std::ios::binary).rdbuf();
    return text.str();
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

} // namespace netfloor::test
