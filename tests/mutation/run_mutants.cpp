// SPDX-License-Identifier: MIT
// Runs the mutants of a rewritten plug-in, each until an answer differs from the known one.
//
//     run_mutants PLUGIN ANSWERS MUTANTS PRESENT [EVERY [PACKETS [JOBS]]]
//
// ANSWERS is digests.txt, MUTANTS the list of rewrite.py, PRESENT the numbers of the mutants that the compiler has left
// in the program. With EVERY, each so many-th is run; with PACKETS, on the first so many. Prints those that are not
// noticed. The exit code is 0; 2 when the plug-in without a mutant does not give the answers.
#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <iterator>
#include <map>
#include <set>
#include <stdexcept>
#include <string>
#include <vector>

#include <sys/wait.h>
#include <unistd.h>

#include "known_answers.h"
#include "mutant.h"

namespace netfloor::compare {
namespace {

constexpr unsigned mostSeconds = 120; // a mutant may not end

struct Mutant {
    int number;
    std::string text;
};

std::vector<Mutant> mutantsOf(const char *path) {
    std::ifstream file(path);
    std::vector<Mutant> mutants;
    for (std::string line; std::getline(file, line);) {
        mutants.push_back({std::stoi(line), line});
    }
    return mutants;
}

std::set<int> numbersIn(const char *path) {
    std::ifstream file(path, std::ios::binary);
    std::set<int> numbers;
    for (int number = 0; file.read(reinterpret_cast<char *>(&number), sizeof number);) {
        numbers.insert(number);
    }
    return numbers;
}

std::vector<std::uint64_t> answersOf(const char *path) {
    std::ifstream file(path);
    std::vector<std::uint64_t> answers;
    for (std::string name, digest; file >> name >> digest;) {
        answers.push_back(std::stoull(digest, nullptr, 16));
    }
    return answers;
}

bool givesAnswers(Plugin &plugin, const Inputs &inputs, const std::vector<std::uint64_t> &answers,
                  std::uint64_t packets) {
    std::size_t at = 0;
    if (answers.size() != 1 + answeredPackets / packetsTogether || exportsDigest(plugin) != answers[at++]) {
        return false;
    }
    for (std::uint64_t first = 0; first < packets; first += packetsTogether) {
        if (groupDigest(plugin, inputs, first) != answers[at++]) {
            return false;
        }
    }
    return true;
}

class Runs {
public:
    Runs(char **arguments, int every, std::uint64_t packets, std::size_t jobs)
        : plugin_(arguments[0]),
          answers_(answersOf(arguments[1])),
          mutants_(mutantsOf(arguments[2])),
          present_(numbersIn(arguments[3])),
          every_(every),
          packets_(packets),
          jobs_(jobs) {}

    void run() {
        if (!givesAnswers(plugin_, inputs_, answers_, packets_)) {
            throw std::runtime_error("the plug-in without a mutant gives other answers");
        }
        std::size_t constants = 0;
        std::size_t unreached = 0;
        for (std::size_t i = 0; i < mutants_.size(); i += static_cast<std::size_t>(every_)) {
            const Mutant &mutant = mutants_[i];
            if (!present_.contains(mutant.number)) {
                ++constants;
            } else if (netfloorMutantReached[mutant.number] == 0) {
                ++unreached;
                std::printf("never run\t%s\n", mutant.text.c_str());
            } else {
                start(mutant);
            }
        }
        while (!running_.empty()) {
            takeOne();
        }
        std::printf("%zu mutants: %zu noticed, %zu not noticed, %zu never run; %zu are constants of the compiler\n",
                    started_ + unreached, started_ - unnoticed_, unnoticed_, unreached, constants);
    }

private:
    void start(const Mutant &mutant) {
        if (running_.size() == jobs_) {
            takeOne();
        }
        ++started_;
        std::fflush(stdout);
        const pid_t child = fork();
        if (child == 0) {
            alarm(mostSeconds);
            netfloorMutant = mutant.number;
            _exit(givesAnswers(plugin_, inputs_, answers_, packets_) ? 0 : 1);
        }
        running_[child] = &mutant;
    }

    // A signal is noticed like another answer.
    void takeOne() {
        int status = 0;
        const pid_t child = wait(&status);
        if (WIFEXITED(status) && WEXITSTATUS(status) == 0) {
            ++unnoticed_;
            std::printf("not noticed\t%s\n", running_.at(child)->text.c_str());
        }
        running_.erase(child);
    }

    Plugin plugin_;
    const Inputs inputs_{{NETFLOOR_CAPTURES}, 1};
    const std::vector<std::uint64_t> answers_;
    const std::vector<Mutant> mutants_;
    const std::set<int> present_;
    int every_;
    std::uint64_t packets_;
    std::size_t jobs_;
    std::map<pid_t, const Mutant *> running_;
    std::size_t started_ = 0;
    std::size_t unnoticed_ = 0;
};

} // namespace
} // namespace netfloor::compare

int main(int count, char **arguments) {
    try {
        if (count < 5) {
            throw std::runtime_error("usage: run_mutants PLUGIN ANSWERS MUTANTS PRESENT [EVERY [PACKETS [JOBS]]]");
        }
        const int every = count > 5 ? std::stoi(arguments[5]) : 1;
        const std::uint64_t packets = count > 6 ? std::stoull(arguments[6]) : netfloor::compare::answeredPackets;
        const std::size_t jobs = count > 7 ? std::stoul(arguments[7]) : 2;
        netfloor::compare::Runs(arguments + 1, every, packets, jobs).run();
        return 0;
    } catch (const std::exception &error) {
        std::fprintf(stderr, "run_mutants: %s\n", error.what());
        return 2;
    }
}
