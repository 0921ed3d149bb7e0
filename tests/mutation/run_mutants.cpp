// SPDX-License-Identifier: MIT
// Runs the mutants of a rewritten plug-in, each until an answer differs from the known one.
//
//     run_mutants PLUGIN ANSWERS MUTANTS PRESENT [EVERY [PACKETS [JOBS]]]
//
// ANSWERS is digests.txt, MUTANTS the list of rewrite.py, PRESENT the numbers of the mutants that the compiler has left
// in the program. With EVERY, each so many-th is run; with PACKETS, on the first so many. Prints those that are not
// noticed. The exit code is 0; 2 when the plug-in without a mutant does not give the answers.
#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <iterator>
#include <map>
#include <set>
#include <stdexcept>
#include <string>
#include <vector>

#include <sys/time.h>
#include <sys/wait.h>
#include <unistd.h>

#include "known_answers.h"
#include "mutant.h"

namespace netfloor::compare {
namespace {

constexpr int mostSeconds = 1; // of CPU for a group of packets, which takes 0.02 without a change

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

// The known answers: number 0 is that of the exports, each other one that of a group of packets.
class Answers {
public:
    Answers(const char *plugin, const char *answers, std::uint64_t packets)
        : plugin_(plugin), answers_(answersOf(answers)), count_(1 + packets / packetsTogether) {
        if (answers_.size() != 1 + answeredPackets / packetsTogether || count_ > answers_.size()) {
            throw std::runtime_error("these are not the answers of so many packets");
        }
    }

    [[nodiscard]] std::size_t count() const { return count_; }

    [[nodiscard]] bool isGiven(std::size_t number) {
        if (number == 0) {
            return exportsDigest(plugin_) == answers_[0];
        }
        return groupDigest(plugin_, inputs_, (number - 1) * packetsTogether) == answers_[number];
    }

private:
    Plugin plugin_;
    const Inputs inputs_{{NETFLOOR_CAPTURES}, 1};
    const std::vector<std::uint64_t> answers_;
    std::size_t count_;
};

class Runs {
public:
    Runs(char **arguments, int every, std::uint64_t packets, std::size_t jobs)
        : answers_(arguments[0], arguments[1], packets),
          mutants_(mutantsOf(arguments[2])),
          present_(numbersIn(arguments[3])),
          every_(every),
          jobs_(jobs) {}

    void run() {
        findReached();
        std::size_t constants = 0;
        std::size_t unreached = 0;
        for (std::size_t i = 0; i < mutants_.size(); i += static_cast<std::size_t>(every_)) {
            const Mutant &mutant = mutants_[i];
            if (!present_.contains(mutant.number)) {
                ++constants;
            } else if (!reachedBy_.contains(mutant.number)) {
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
    // A mutant changes only the answers that reach it.
    void findReached() {
        for (std::size_t answer = 0; answer < answers_.count(); ++answer) {
            std::fill(std::begin(netfloorMutantReached), std::end(netfloorMutantReached), 0);
            if (!answers_.isGiven(answer)) {
                throw std::runtime_error("the plug-in without a mutant gives other answers");
            }
            for (const Mutant &mutant : mutants_) {
                if (netfloorMutantReached[mutant.number] != 0) {
                    reachedBy_[mutant.number].push_back(answer);
                }
            }
        }
    }

    void start(const Mutant &mutant) {
        if (running_.size() == jobs_) {
            takeOne();
        }
        ++started_;
        std::fflush(stdout);
        const pid_t child = fork();
        if (child == 0) {
            netfloorMutant = mutant.number;
            _exit(isNoticed(mutant) ? 1 : 0);
        }
        running_[child] = &mutant;
    }

    // A mutant may not end.
    [[nodiscard]] bool isNoticed(const Mutant &mutant) {
        return std::ranges::any_of(reachedBy_.at(mutant.number), [&](std::size_t answer) {
            const itimerval limit = {.it_interval = {}, .it_value = {.tv_sec = mostSeconds, .tv_usec = 0}};
            setitimer(ITIMER_VIRTUAL, &limit, nullptr);
            return !answers_.isGiven(answer);
        });
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

    Answers answers_;
    const std::vector<Mutant> mutants_;
    const std::set<int> present_;
    int every_;
    std::size_t jobs_;
    std::map<int, std::vector<std::size_t>> reachedBy_; // mutant -> answers
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
