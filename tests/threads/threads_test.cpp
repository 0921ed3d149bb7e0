// SPDX-License-Identifier: MIT
// Hosts in several threads. The preset `threads` runs this under the thread sanitizer.
#include <atomic>
#include <thread>
#include <vector>

#include <gtest/gtest.h>

#include "netfloor-host/plugin_host.h"
#include "support/packets.h"

namespace netfloor::test {
namespace {

constexpr int rounds = 40; // the thread sanitizer takes seconds for them
constexpr Pass allPasses[] = {Pass::md, Pass::to, Pass::mv, Pass::xtr};

// Packets that differ in every pass.
std::vector<Octets> packets() {
    return {
        ipv4({.protocol = 17, .payload = udp(40000, 53, hex("61*12"))}),
        ipv6({.nextHeader = 58, .payload = hex("87 00 0000 00*20")}),
        ipv4({.protocol = 4, .payload = ipv4({.protocol = 17, .payload = udp(1, 2, hex("00*9"))})}),
        ipv4({.protocol = 6, .payload = hex("0050 9c40 00000001 00000000 5002 0100 0000 0000")}),
    };
}

// Texts, names, values and keys in one.
std::string told(const Report &report) {
    std::string text = std::to_string(report.result) + ' ' + std::to_string(report.flags);
    for (const FieldReport &field : report.fields) {
        text += '|' + field.name + '=' + field.text + '#' + std::to_string(field.value);
    }
    for (const auto &key : report.keys) {
        text += '|' + key.name + '=' + std::to_string(key.number);
    }
    return text;
}

std::vector<std::string> expected(Host &host) {
    std::vector<std::string> reports;
    for (const Octets &packet : packets()) {
        for (const Pass pass : allPasses) {
            reports.push_back(told(host.run(pass, packet)));
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
    const std::vector<Octets> all = packets();
    for (int round = 0; round < rounds; ++round) {
        std::size_t next = 0;
        for (const Octets &packet : all) {
            for (const Pass pass : allPasses) {
                const std::string &wanted = reports[next++];
                try {
                    ++(told(host.run(pass, packet)) == wanted ? counts.right : counts.wrong);
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
            opened += copy.run(Pass::xtr, packets().front()).ending == Ending::complete ? 1 : 0;
        });
    }
    for (std::thread &thread : threads) {
        thread.join();
    }
    EXPECT_EQ(opened, 2);
}

} // namespace
} // namespace netfloor::test
