// SPDX-License-Identifier: MIT
#include "frame/bare_host.h"

#include <algorithm>
#include <cstddef>
#include <sstream>
#include <utility>

#include "support/runs.h"

namespace netfloor::test {
namespace {

constexpr std::size_t fieldRecordOctets = 1000;
constexpr std::size_t fieldRecordCount = 64;

StateOptions guarded(StateOptions options, const GuardedOctets &working) {
    options.prepare = [&working, then = options.prepare](DecodeState &state) {
        state.data = working.octets().data();
        if (then) {
            then(state);
        }
    };
    return options;
}

} // namespace

BarePlugin::BarePlugin(std::vector<std::int32_t> results, std::uint16_t presenceRow)
    : library(PluginLibrary::openCopy(pluginPath())), results_(std::move(results)), presenceRow_(presenceRow) {}

// Fills the table whatever the result is. Only the low octet of the mask counts.
std::int32_t BarePlugin::initialise(KeyFieldRow *table, std::uint32_t count, std::uint16_t *presenceRow) noexcept {
    rowCount = count;
    if (count > KeyRoom::rows) {
        return -1;
    }
    if (calls == 0) {
        tableAtLoad.assign(table, table + count);
    }
    for (std::uint32_t row = 0; row < count; ++row) {
        table[row].presenceOffset = static_cast<std::uint32_t>(offsetof(KeyRoom, presence) + row);
        table[row].valueOffset = static_cast<std::uint32_t>(offsetof(KeyRoom, values) + 8 * row);
        table[row].presenceMask = 0xabcd1200u | KeyRoom::ownPresence;
    }
    *presenceRow = std::min(presenceRow_, static_cast<std::uint16_t>(count - 1));
    return results_[std::min<std::size_t>(calls++, results_.size() - 1)];
}

BarePlugin &sharedBarePlugin() {
    static BarePlugin plugin;
    return plugin;
}

std::string stackText(const BitStack &stack) {
    std::ostringstream out;
    for (const std::uint32_t *element = stack.base; element <= stack.top; ++element) {
        out << (element == stack.base ? "" : " ") << *element;
    }
    return out.str();
}

std::string describeField(const DecodeState &state) {
    const FieldRecord &record = state.fieldRecord;
    std::ostringstream out;
    out << "cursor " << state.cursor << " left " << state.bitsLeft << " advance " << state.advance << " condition "
        << unsigned{state.condition} << " block \"" << state.blockName << "\" field " << record.fieldId << " \""
        << record.fieldName << "\" value " << record.value << record.valueText << " ranges " << record.rangeCount << '/'
        << record.outputRangeCount;
    return out.str();
}

std::string describe(const DecodeState &state) {
    const FieldRecord &record = state.fieldRecord;
    std::ostringstream out;
    out << describeField(state);
    for (std::uint32_t i = 0; i < record.rangeCount; ++i) {
        const BitRange &range = record.ranges[i];
        out << ' ' << range.value << ':' << range.firstBit << '-' << range.lastBit << ':' << range.flagWord;
    }
    return out.str();
}

BareRun::BareRun(const Octets &packet, const StateOptions &options, BarePlugin &plugin)
    : layerInfo(16),
      fieldRecords(fieldRecordOctets * fieldRecordCount, 0xee),
      plugin_(plugin),
      source_(packet),
      working_(packet),
      packet_(source_.octets(), guarded(options, working_)) {
    record_.operations = this;
    context().layerNumber = 1;
    context().decoderId = 7;
    context().bitsLeft = 0xeeeeeeee;
    context().verdict = 1;
    context().fieldRecords = fieldRecords.data();
    context().layerInfo = layerInfo.data();
    context().layerInfoCapacity = static_cast<std::uint32_t>(layerInfo.size() - 1);
    context().decodeState = &state();
    xtr.bitsLeft = 0xeeeeeeee;
    xtr.keyRecord = reinterpret_cast<std::uint8_t *>(&keys);
    xtr.decodeState = &state();
}

std::int32_t BareRun::enter(Pass pass) {
    const PluginLibrary &library = plugin_.library;
    switch (pass) {
    case Pass::md: return library.preDecodeMD()(&context());
    case Pass::to: return library.preDecodeTO()(&context());
    case Pass::mv: return library.preDecodeMV()(&context());
    case Pass::xtr: break;
    }
    netfloor_setKeyOptions(&plugin_);
    const std::int32_t result = library.extract()(&xtr);
    netfloor_setKeyOptions(nullptr);
    return result;
}

std::uint32_t BareRun::contextBitsLeft(Pass pass) const {
    return pass == Pass::xtr ? xtr.bitsLeft : record_.context.bitsLeft;
}

std::string BareRun::keyText() const {
    std::ostringstream out;
    for (std::size_t row = 0; row < KeyRoom::rows; ++row) {
        const auto &value = keys.values[row];
        const auto end = std::ranges::find(value, KeyRoom::poison) - value.begin();
        const bool present = keys.presence[row] == (KeyRoom::othersPresence | KeyRoom::ownPresence);
        const bool clean =
            std::ranges::all_of(value.begin() + end, value.end(), [](auto o) { return o == KeyRoom::poison; });
        if (present) {
            out << row << '=' << hexText({value.data(), static_cast<std::size_t>(end)}) << '\n';
        }
        if (!clean || (!present && (end != 0 || keys.presence[row] != KeyRoom::othersPresence))) {
            out << "stray octets in row " << row << '\n';
        }
    }
    return out.str();
}

std::int32_t BareRun::take(std::uint32_t bits) {
    state().cursor += bits;
    state().bitsLeft -= bits;
    return 0;
}

std::int32_t BareRun::addField(std::uint32_t outputRangeCount, const BitRange *ranges, const char *display,
                               std::uint32_t zero, const char *fieldName, std::uint32_t fieldId,
                               std::uint32_t otherZero, std::uint32_t bitOrder) noexcept {
    seen.push_back({fieldId, display, describe(state()), bitOrder});
    const FieldRecord &record = state().fieldRecord;
    if (outputRangeCount != record.outputRangeCount || ranges != record.ranges || fieldId != record.fieldId ||
        zero != 0 || otherZero != 0 || fieldName != std::string_view(record.fieldName)) {
        seen.back().state += " (the arguments are not those of the field record)";
    }
    context().fieldRecordCount = (context().fieldRecordCount + 1) % fieldRecordCount;
    afterCall();
    return 0;
}

void BareRun::addDisplay(const char *display, std::uint32_t displayId) noexcept {
    seen.push_back({displayId, display, describe(state()), 0});
    afterCall();
}

void BareRun::growLayerInfo() noexcept {
    ++layerInfoGrowths;
    layerInfo.resize(context().layerInfoCount + std::size_t{1});
    context().layerInfo = layerInfo.data();
    context().layerInfoCapacity = context().layerInfoCount;
}

std::int32_t BareRun::preDecode(std::uint32_t mode) noexcept {
    modes.push_back(mode);
    return nextLayer();
}

} // namespace netfloor::test
