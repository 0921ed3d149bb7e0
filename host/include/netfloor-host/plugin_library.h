// SPDX-License-Identifier: MIT
// A plug-in, loaded from a file.
#pragma once

#include <cstdint>
#include <filesystem>
#include <memory>
#include <stdexcept>
#include <string>
#include <vector>

#include <netfloor/descriptors.h>
#include <netfloor/plugin.h>

namespace netfloor {

// A file could not be used as a plug-in. what() is a sentence for the user: what is missing or wrong, in
// which file, and what to do.
class PluginError : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

// A plug-in was entered while it serves another packet. what() says which one and what to do.
class PluginBusy : public std::logic_error {
public:
    using std::logic_error::logic_error;
};

// How this host answers hx_InitialiseOptXTR: each call gets the next result, and calls after the last one repeat it.
struct KeySetUp {
    std::vector<std::int32_t> results = {1};
    std::uint16_t presenceRow = 0; // with a result above 1: the row that is present in every record
};

class LoadedPlugin;

// A handle of a loaded plug-in; copies share it.
//
// A pass of a plug-in keeps its variables in statics and serves one packet at a time. Decoding in several threads
// needs a copy for each, and so does a new set-up of the key-field table. The functions of a handle may not be called
// while another thread runs or sets up the same load.
class PluginLibrary {
public:
    // Loads the plug-in at `path`, or gives a handle of it when this process has loaded it before. It stays
    // loaded until the process ends, as the set-up of its key-field table does. Throws PluginError.
    [[nodiscard]] static PluginLibrary open(const std::filesystem::path &path);

    // Loads the plug-in once more, with statics of its own. It is unloaded with the last handle. Throws
    // PluginError.
    [[nodiscard]] static PluginLibrary openCopy(const std::filesystem::path &path);

    [[nodiscard]] const std::filesystem::path &path() const;

    [[nodiscard]] NetfloorPreDecode preDecodeMD() const;
    [[nodiscard]] NetfloorPreDecode preDecodeTO() const;
    [[nodiscard]] NetfloorPreDecode preDecodeMV() const;
    [[nodiscard]] NetfloorExtract extract() const;
    [[nodiscard]] NetfloorDateConv dateConv() const;
    [[nodiscard]] NetfloorGetTable getPtr() const; // FieldTables reads the tables of these two
    [[nodiscard]] NetfloorGetTable getTable() const;

    // Any other export by its name, or null.
    [[nodiscard]] void *find(const std::string &exportName) const;

    // The time stamp `seconds` since 1970-01-01 00:00:00 UTC as the plug-in's date_conv writes it.
    [[nodiscard]] std::string dateText(std::uint32_t seconds) const;

    // Decides what later calls of hx_InitialiseOptXTR get. A plug-in that got another result than 0 does not ask
    // again: open a copy first.
    void setKeySetUp(KeySetUp keySetUp);

    // How often the plug-in has called hx_InitialiseOptXTR.
    [[nodiscard]] std::uint32_t keySetUpCalls() const;

    // The key-field table as the plug-in handed it over; empty before the first XTR pass.
    [[nodiscard]] std::vector<std::string> keyFieldNames() const;

private:
    friend class Host;
    explicit PluginLibrary(std::shared_ptr<LoadedPlugin> loaded);

    std::shared_ptr<LoadedPlugin> loaded_;
};

} // namespace netfloor
