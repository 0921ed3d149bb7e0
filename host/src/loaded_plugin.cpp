// SPDX-License-Identifier: MIT
#include "loaded_plugin.h"

#include <algorithm>
#include <array>
#include <fstream>
#include <map>
#include <memory>
#include <mutex>
#include <string>
#include <string_view>
#include <system_error>
#include <utility>

#include "key_types.h"
#include "plugin_file.h"

namespace netfloor {
namespace {

// The plug-in finds the three libraries by their names among those that the process has loaded. Using their
// operations here keeps them linked into every program that uses this library.
[[gnu::used]] const std::array boundary = {
    reinterpret_cast<void (*)()>(&hs_Malloc),
    reinterpret_cast<void (*)()>(&hd_PreDecode),
    reinterpret_cast<void (*)()>(&hx_InitialiseOptXTR),
};

template <typename Entry>
void resolve(const Module &module, const char *name, Entry &entry, std::string &missing) {
    entry = reinterpret_cast<Entry>(module.find(name));
    if (entry == nullptr) {
        missing += (missing.empty() ? "" : ", ") + std::string(name);
    }
}

} // namespace

LoadedPlugin::LoadedPlugin(std::filesystem::path path, bool isCopy) : path_(std::move(path)), module_(path_, isCopy) {
    std::string missing;
    resolve(module_, "vex_PreDecodeMD", preDecodeMD, missing);
    resolve(module_, "vex_PreDecodeTO", preDecodeTO, missing);
    resolve(module_, "vex_PreDecodeMV", preDecodeMV, missing);
    resolve(module_, "XTR_netfloor", extract, missing);
    resolve(module_, "date_conv", dateConv, missing);
    resolve(module_, "vx_DLLGetPtr", getPtr, missing);
    resolve(module_, "vx_DLLGetTable", getTable, missing);
    if (!missing.empty()) {
        refusePlugin(path_, "it is a shared library, but does not export " + missing + ".", pluginAdvice());
    }
}

std::int32_t LoadedPlugin::initialise(KeyFieldRow *table, std::uint32_t rowCount, std::uint16_t *presenceRow) noexcept {
    const std::vector<std::int32_t> &results = keySetUp.results;
    const std::int32_t result = results.empty() ? 1 : results[std::min<std::size_t>(keySetUpCalls, results.size() - 1)];
    ++keySetUpCalls;
    keySetUpIsFinal_ = result != 0 || rowCount > KeyRecord::mostRows;
    if (rowCount > KeyRecord::mostRows) {
        return -1;
    }
    if (result > 0) {
        KeyRecord::layOut({table, rowCount});
        keyTable_ = {table, rowCount};
        keyColumns_.clear();
        for (const KeyType type : keyTypesOf(keyTable_, getTable)) {
            keyColumns_.push_back({keyTable_[keyColumns_.size()].fieldName, type});
        }
        *presenceRow = keySetUp.presenceRow;
    }
    return result;
}

std::int32_t LoadedPlugin::enterExtract(XtrContext *context) {
    if (keySetUpIsFinal_) {
        return extract(context);
    }
    netfloor_setKeyOptions(this);
    const std::int32_t result = extract(context);
    netfloor_setKeyOptions(nullptr);
    return result;
}

// In a nested pass this thread is the user already. Only the user's thread accesses `isHandingOff_`, which need not be
// atomic therefore.
PluginUse::PluginUse(LoadedPlugin &plugin) : plugin_(plugin) {
    thread_local const char thisThread = 0;
    const void *user = nullptr;
    isOutermost_ = plugin_.user_.compare_exchange_strong(user, &thisThread, std::memory_order_acquire);
    if (!isOutermost_ && user != &thisThread) {
        throw PluginBusy("the plug-in " + plugin_.path().string() +
                         " is running in another thread, and it serves one packet at a time. Give each thread a Host "
                         "of its own, with a copy of the plug-in by PluginLibrary::openCopy.");
    }
    if (!isOutermost_ && !plugin_.isHandingOff_) {
        throw PluginBusy("the plug-in " + plugin_.path().string() +
                         " is in the middle of a packet. A sink cannot run it: run the other packet after this one, or "
                         "use a copy by PluginLibrary::openCopy.");
    }
    plugin_.isHandingOff_ = false;
}

PluginUse::~PluginUse() {
    if (isOutermost_) {
        plugin_.user_.store(nullptr, std::memory_order_release);
    } else {
        plugin_.isHandingOff_ = true;
    }
}

PluginLibrary::PluginLibrary(std::shared_ptr<LoadedPlugin> loaded) : loaded_(std::move(loaded)) {}

PluginLibrary PluginLibrary::open(const std::filesystem::path &path) {
    static std::mutex mutex;
    static std::map<void *, std::shared_ptr<LoadedPlugin>> loads;

    checkPluginFile(path);
    auto loaded = std::make_shared<LoadedPlugin>(path, false);
    const std::scoped_lock lock(mutex);
    return PluginLibrary(loads.try_emplace(loaded->handle(), loaded).first->second);
}

PluginLibrary PluginLibrary::openCopy(const std::filesystem::path &path) {
    checkPluginFile(path);
    return PluginLibrary(std::make_shared<LoadedPlugin>(path, true));
}

const std::filesystem::path &PluginLibrary::path() const {
    return loaded_->path();
}

NetfloorPreDecode PluginLibrary::preDecodeMD() const {
    return loaded_->preDecodeMD;
}

NetfloorPreDecode PluginLibrary::preDecodeTO() const {
    return loaded_->preDecodeTO;
}

NetfloorPreDecode PluginLibrary::preDecodeMV() const {
    return loaded_->preDecodeMV;
}

NetfloorExtract PluginLibrary::extract() const {
    return loaded_->extract;
}

NetfloorDateConv PluginLibrary::dateConv() const {
    return loaded_->dateConv;
}

NetfloorGetTable PluginLibrary::getPtr() const {
    return loaded_->getPtr;
}

NetfloorGetTable PluginLibrary::getTable() const {
    return loaded_->getTable;
}

void *PluginLibrary::find(const std::string &exportName) const {
    return loaded_->find(exportName.c_str());
}

std::string PluginLibrary::dateText(std::uint32_t seconds) const {
    DecodeState state = {};
    state.fieldRecord.value = seconds;
    std::array<char, 64> text = {};
    return loaded_->dateConv(text.data(), nullptr, &state);
}

void PluginLibrary::setKeySetUp(KeySetUp keySetUp) {
    loaded_->keySetUp = std::move(keySetUp);
    loaded_->keySetUpCalls = 0;
}

std::uint32_t PluginLibrary::keySetUpCalls() const {
    return loaded_->keySetUpCalls;
}

std::vector<std::string> PluginLibrary::keyFieldNames() const {
    std::vector<std::string> names;
    for (const KeyFieldRow &row : loaded_->keyTable()) {
        names.emplace_back(row.fieldName);
    }
    return names;
}

} // namespace netfloor
