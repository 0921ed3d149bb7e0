// SPDX-License-Identifier: MIT
// One load of a plug-in in this process, and the set-up of its key-field table.
#pragma once

#include <atomic>
#include <filesystem>
#include <span>
#include <vector>

#include "key_record.h"
#include "links.h"
#include "module.h"
#include "netfloor-host/plugin_library.h"

namespace netfloor {

class LoadedPlugin final : public standin::KeyOptions {
public:
    // With `isCopy` the plug-in is loaded once more, with statics of its own.
    LoadedPlugin(std::filesystem::path path, bool isCopy);
    LoadedPlugin(const LoadedPlugin &) = delete;
    LoadedPlugin &operator=(const LoadedPlugin &) = delete;

    std::int32_t initialise(KeyFieldRow *table, std::uint32_t rowCount, std::uint16_t *presenceRow) noexcept override;

    // The XTR entry, with this plug-in named to libhx_KeyOptions as long as it may ask for its set-up.
    [[nodiscard]] std::int32_t enterExtract(XtrContext *context);

    [[nodiscard]] void *handle() const { return module_.handle(); }
    [[nodiscard]] const std::filesystem::path &path() const { return path_; }
    [[nodiscard]] void *find(const char *exportName) const { return module_.find(exportName); }
    [[nodiscard]] std::span<const KeyFieldRow> keyTable() const { return keyTable_; }
    [[nodiscard]] std::span<const KeyColumn> keyColumns() const { return keyColumns_; } // of its rows

    NetfloorPreDecode preDecodeMD = nullptr;
    NetfloorPreDecode preDecodeTO = nullptr;
    NetfloorPreDecode preDecodeMV = nullptr;
    NetfloorExtract extract = nullptr;
    NetfloorDateConv dateConv = nullptr;
    NetfloorGetTable getPtr = nullptr;
    NetfloorGetTable getTable = nullptr;

    KeySetUp keySetUp;
    std::uint32_t keySetUpCalls = 0;

private:
    std::filesystem::path path_;
    Module module_;
    std::span<const KeyFieldRow> keyTable_;
    std::vector<KeyColumn> keyColumns_;
    bool keySetUpIsFinal_ = false; // the plug-in does not ask again

    friend class PluginUse;
    friend class OwnerTurn;
    // The thread that is running a pass, by the address of a variable of its own.
    std::atomic<const void *> user_ = nullptr;
    bool isHandingOff_ = false; // the innermost pass of that thread waits for the owner of a next layer
};

// The right to run a pass, held from its start to its end. The constructor throws PluginBusy where another pass is
// running, unless that pass waits in this thread for the owner of a next layer.
class PluginUse {
public:
    explicit PluginUse(LoadedPlugin &plugin);
    ~PluginUse();
    PluginUse(const PluginUse &) = delete;
    PluginUse &operator=(const PluginUse &) = delete;

private:
    LoadedPlugin &plugin_;
    bool isOutermost_ = false;
};

// The time in which a pass waits for the owner of a next layer.
class OwnerTurn {
public:
    explicit OwnerTurn(LoadedPlugin &plugin) : plugin_(plugin), before_(plugin.isHandingOff_) {
        plugin_.isHandingOff_ = true;
    }
    ~OwnerTurn() { plugin_.isHandingOff_ = before_; }
    OwnerTurn(const OwnerTurn &) = delete;
    OwnerTurn &operator=(const OwnerTurn &) = delete;

private:
    LoadedPlugin &plugin_;
    bool before_;
};

} // namespace netfloor
