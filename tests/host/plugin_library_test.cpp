// SPDX-License-Identifier: MIT
// Loading a plug-in: what is refused, and with which message.
#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "netfloor-host/plugin_host.h"
#include "support/temporary_folder.h"

#ifdef _WIN32
#define WIN32_LEAN_AND_MEAN
#include <windows.h>
#else
#include <sys/stat.h>
#endif

namespace netfloor::test {
namespace {

std::string contentOfPlugin() {
    std::ifstream file(NETFLOOR_PLUGIN, std::ios::binary);
    return {std::istreambuf_iterator<char>(file), std::istreambuf_iterator<char>()};
}

// The plug-in's file with one name in its tables changed to another of the same length.
std::string pluginWith(const std::string &name, const std::string &changed) {
    std::string content = contentOfPlugin();
    const std::string whole = '\0' + name + '\0';
    std::size_t found = 0;
    for (std::size_t at = content.find(whole); at != std::string::npos; at = content.find(whole, at + 1)) {
        content.replace(at + 1, name.size(), changed);
        ++found;
    }
    EXPECT_GE(found, 1U) << name;
    return content;
}

#ifdef _WIN32
constexpr const char *keyOptionsLibrary = "hx_KeyOptions.dll", *otherLibrary = "hx_NoOptionsX.dll";
constexpr const char *otherLibraryMessage = "that this process does not have";
constexpr const char *cutMessage = "the loader refuses it";

// The machine is in the second header, whose place is at 0x3c.
std::string forOtherMachine(std::string content) {
    const auto header = static_cast<unsigned char>(content.at(0x3c));
    content.at(header + 4) = content.at(header + 5) = 0x17;
    return content;
}
#else
constexpr const char *keyOptionsLibrary = "libhx_KeyOptions.so", *otherLibrary = "libhx_NoOptions.so.";
constexpr const char *otherLibraryMessage = "libhx_NoOptions.so";
constexpr const char *cutMessage = "it is cut short, after 200 octets";

// The byte order is in the sixth octet.
std::string forOtherMachine(std::string content) {
    content.at(5) = static_cast<char>(3 - content.at(5));
    return content;
}
#endif

class Refusal : public testing::Test {
protected:
    std::filesystem::path file(const std::string &content) {
        const std::filesystem::path path = directory_ / ("plugin" + std::to_string(++files_) + ".so");
        std::ofstream(path, std::ios::binary) << content;
        return path;
    }

    TemporaryFolder folder_;
    const std::filesystem::path &directory_ = folder_.path();
    int files_ = 0;
};

TEST_F(Refusal, saysWhatIsWrongWhereAndWhatToDo) {
    const struct {
        std::filesystem::path path;
        std::vector<std::string> words;
    } cases[] = {
        {directory_ / "absent.so", {"no such file", "Give the path of a netfloor plug-in"}},
        {directory_, {"it is a directory", "Give the path"}},
        {file(""), {"it is not a shared library", "Give the path"}},
        {file("#!/bin/sh\n"), {"it is not a shared library"}},
        {file(forOtherMachine(contentOfPlugin())), {"the loader refuses it", "for this machine"}},
        {file(contentOfPlugin().substr(0, 200)), {cutMessage}},
        {NETFLOOR_STRANGER, // a library that every process loads
         {"vex_PreDecodeMD, vex_PreDecodeTO, vex_PreDecodeMV, XTR_netfloor, date_conv, vx_DLLGetPtr, vx_DLLGetTable"}},
        {file(pluginWith("vex_PreDecodeTO", "vex_PreDecodeXX")), {"does not export vex_PreDecodeTO."}},
        {file(pluginWith("XTR_netfloor", "XTR_otherone")), {"does not export XTR_netfloor."}},
        {file(pluginWith("date_conv", "date_Conv")), {"does not export date_conv."}},
        {file(pluginWith("vx_DLLGetTable", "vx_DLLGetTablE")), {"does not export vx_DLLGetTable."}},
#ifndef _WIN32 // wine gives a function to what it does not find
        {file(pluginWith("hd_PreDecode", "hd_PreDecoDe")), {"undefined symbol: hd_PreDecoDe", "netfloor/host.h"}},
#endif
        {file(pluginWith(keyOptionsLibrary, otherLibrary)), {otherLibraryMessage, "build it again"}},
    };
    for (const auto &[path, words] : cases) {
        for (const auto open : {&PluginLibrary::open, &PluginLibrary::openCopy}) {
            try {
                static_cast<void>(open(path));
                ADD_FAILURE() << path << " was taken: " << words.front();
            } catch (const PluginError &error) {
                const std::string message = error.what();
                EXPECT_NE(message.find(path.string()), std::string::npos) << message;
                for (const std::string &word : words) {
                    EXPECT_NE(message.find(word), std::string::npos) << word << " is not in: " << message;
                }
            }
        }
    }
}

#ifndef _WIN32
// The loader would end the process, or wait for ever.
TEST_F(Refusal, comesBeforeTheLoader) {
    const std::filesystem::path fifo = directory_ / "fifo";
    ASSERT_EQ(::mkfifo(fifo.c_str(), 0600), 0);
    EXPECT_THROW(static_cast<void>(PluginLibrary::open(fifo)), PluginError);
    for (const std::size_t octets : {std::size_t{20}, std::size_t{4096}, contentOfPlugin().size() / 2}) {
        EXPECT_THROW(static_cast<void>(PluginLibrary::open(file(contentOfPlugin().substr(0, octets)))), PluginError);
    }
}
#endif

TEST(PluginLibrary, sharesOneLoadAndCopiesDoNot) {
    const PluginLibrary first = PluginLibrary::open(NETFLOOR_PLUGIN);
    // The same file by a relative path is the same load.
    const PluginLibrary second = PluginLibrary::open(std::filesystem::relative(NETFLOOR_PLUGIN));
    const PluginLibrary copy = PluginLibrary::openCopy(NETFLOOR_PLUGIN);
    EXPECT_EQ(first.preDecodeMD(), second.preDecodeMD());
    EXPECT_NE(first.preDecodeMD(), copy.preDecodeMD());
    EXPECT_EQ(copy.find("vex_PreDecodeMV"), reinterpret_cast<void *>(copy.preDecodeMV()));
    EXPECT_EQ(copy.find("no_such_export"), nullptr);
    EXPECT_EQ(copy.path(), NETFLOOR_PLUGIN);
}

#ifdef _WIN32
// Windows refuses to stop its notifications of threads for a library with a TLS directory.
TEST(PluginLibrary, getsNoNotificationsOfThreads) {
    HMODULE const module = LoadLibraryW(std::filesystem::path(NETFLOOR_PLUGIN).c_str());
    ASSERT_NE(module, nullptr);
    EXPECT_NE(DisableThreadLibraryCalls(module), FALSE);
    FreeLibrary(module);
}
#endif

TEST(PluginLibrary, writesDates) {
    const PluginLibrary library = PluginLibrary::open(NETFLOOR_PLUGIN);
    EXPECT_EQ(library.dateText(0), "1970-01-01 00:00:00");
    EXPECT_EQ(library.dateText(951827696), "2000-02-29 12:34:56");
}

// Each load asks for its set-up until it gets another result than 0.
TEST(PluginLibrary, setsUpKeysOncePerLoad) {
    const std::vector<std::uint8_t> packet = {0x45};
    const struct {
        KeySetUp setUp;
        std::vector<std::int32_t> results; // of an XTR pass each
        std::uint32_t calls;
        std::size_t keysAtLast;
    } cases[] = {
        {{{1}, 0}, {1, 1}, 1, 1},                   // "Version"
        {{{0, 0, 0, 1}, 0}, {1, 1, 1, 1, 1}, 4, 1}, // not ready three times
        {{{-7}, 0}, {-7, -7}, 1, 0},
        {{{0, -3}, 0}, {1, -3, -3}, 2, 0},
        {{{2}, 7}, {1, 1}, 1, 2}, // row 7 is present in every record
    };
    for (const auto &[setUp, results, calls, keysAtLast] : cases) {
        Host host(PluginLibrary::openCopy(NETFLOOR_PLUGIN));
        host.library().setKeySetUp(setUp);
        Report report;
        for (const std::int32_t result : results) {
            report = host.run(Pass::xtr, packet);
            EXPECT_EQ(report.result, result);
            EXPECT_EQ(report.ending, result < 0 ? Ending::keysDenied : Ending::complete);
        }
        EXPECT_EQ(host.library().keySetUpCalls(), calls);
        EXPECT_EQ(report.keys.size(), keysAtLast);
        EXPECT_EQ(host.library().keyFieldNames().empty(), results.back() < 0);
    }
}

} // namespace
} // namespace netfloor::test
