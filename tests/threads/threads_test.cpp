// SPDX-License-Identifier: MIT
// Hosts in several threads. The preset `threads` runs this under the thread sanitizer.
#include <atomic>
#include <thread>
#include <vector>

#include <gtest/gtest.h>

#include "support/corpus.h"
#include "support/runs.h"

namespace netfloor::test {
namespace {

constexpr int rounds = 2; // the thread sanitizer takes seconds for them
constexpr Pass allPasses[] = {Pass::md, Pass::to, Pass::mv, Pass::xtr};

// All that the passes report, a text a run.
std::vector<std::string> expected(Host &host) {
    std::vector<std::string> reports;
    for (const Octets &packet : packetsOfAllFields()) {
        for (const Pass pass : allPasses) {
            reports.push_back(lines(host.run(pass, packet)));
        }
    }
    return reports;
}

struct Counts {
    std::atomic<int> right = 0;
    std::atomic<int> wrong = 0;
    std::atomic<int> busy = 0;
};

// Runs all passes over all packets, and compares.
void work(Host &host, const std::vector<std::string> &reports, Counts &counts) {
    const std::vector<Octets> all = packetsOfAllFields();
    for (int round = 0; round < rounds; ++round) {
        std::size_t next = 0;
        for (const Octets &packet : all) {
            for (const Pass pass : allPasses) {
                const std::string &wanted = reports[next++];
                try {
                    ++(lines(host.run(pass, packet)) == wanted ? counts.right : counts.wrong);
                } catch (const PluginBusy &) {
                    ++counts.busy;
                }
            }
        }
    }
}

void workInTwoThreads(Host &first, Host &second, Counts &counts) {
    const std::vector<std::string> reports = expected(first);
    ASSERT_EQ(expected(second), reports);
    std::thread other([&] { work(second, reports, counts); });
    work(first, reports, counts);
    other.join();
}

TEST(Threads, runCopiesSideBySide) {
    Host first(PluginLibrary::openCopy(NETFLOOR_PLUGIN));
    Host second(PluginLibrary::openCopy(NETFLOOR_PLUGIN));
    Counts counts;
    workInTwoThreads(first, second, counts);
    EXPECT_EQ(counts.wrong, 0);
    EXPECT_EQ(counts.busy, 0);
}

// One load: a run gives the right report, or says that the plug-in is busy.
TEST(Threads, neverMixTwoPacketsInOneLoad) {
    const PluginLibrary library = PluginLibrary::openCopy(NETFLOOR_PLUGIN);
    Host first(library);
    Host second(library);
    Counts counts;
    workInTwoThreads(first, second, counts);
    EXPECT_EQ(counts.wrong, 0);
    EXPECT_GT(counts.right, 0);
}

TEST(Threads, openTheSamePluginAtOnce) {
    std::atomic<int> opened = 0;
    std::vector<std::thread> threads;
    for (int i = 0; i < 2; ++i) {
        threads.emplace_back([&] {
            Host copy(PluginLibrary::openCopy(NETFLOOR_PLUGIN));
            const PluginLibrary shared = PluginLibrary::open(NETFLOOR_PLUGIN);
            opened += copy.run(Pass::xtr, packetsOfAllFields().front()).ending == Ending::complete ? 1 : 0;
        });
    }
    for (std::thread &thread : threads) {
        thread.join();
    }
    EXPECT_EQ(opened, 2);
}

} // namespace
} // namespace netfloor::test
