// SPDX-License-Identifier: MIT
// One load of a plug-in in this process, and the set-up of its key-field table.
#pragma once

#include <filesystem>
#include <span>
#include <vector>

#include "key_record.h"
#include "links.h"
#include "netfloor-host/plugin_library.h"

namespace netfloor {

class LoadedPlugin final : public standin::KeyOptions {
public:
    // `loadPath` is the name that the loader gets where it differs from the file's own, and `descriptor` a file
    // descriptor to be closed after the unloading, or -1.
    LoadedPlugin(std::filesystem::path path, const std::filesystem::path &loadPath, int descriptor);
    ~LoadedPlugin();
    LoadedPlugin(const LoadedPlugin &) = delete;
    LoadedPlugin &operator=(const LoadedPlugin &) = delete;

    std::int32_t initialise(KeyFieldRow *table, std::uint32_t rowCount, std::uint16_t *presenceRow) noexcept override;

    // The XTR entry, with this plug-in named to libhx_KeyOptions.
    [[nodiscard]] std::int32_t enterExtract(XtrContext *context);

    [[nodiscard]] void *handle() const { return handle_; }
    [[nodiscard]] const std::filesystem::path &path() const { return path_; }
    [[nodiscard]] void *find(const char *exportName) const;
    [[nodiscard]] std::span<const KeyFieldRow> keyTable() const { return keyTable_; }
    [[nodiscard]] const std::vector<KeyType> &keyTypes() const { return keyTypes_; } // of its rows

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
    int descriptor_;
    void *handle_;
    std::span<const KeyFieldRow> keyTable_;
    std::vector<KeyType> keyTypes_;
};

} // namespace netfloor
