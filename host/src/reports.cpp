// SPDX-License-Identifier: MIT
#include "netfloor-host/reports.h"

#include <algorithm>
#include <ranges>

#include "netfloor-host/testing.h"

namespace netfloor {
namespace {

template <typename Element>
const Element *firstOfName(const std::vector<Element> &elements, std::string_view name) {
    const auto found = std::ranges::find(elements, name, &Element::name);
    return found == elements.end() ? nullptr : &*found;
}

} // namespace

std::string Report::path(const FieldReport &field, std::string_view separator) const {
    std::vector<std::string_view> names;
    for (std::size_t block = field.block; block != Block::none; block = blocks[block].parent) {
        if (!blocks[block].name.empty()) {
            names.push_back(blocks[block].name);
        }
    }
    std::string path;
    for (std::size_t i = names.size(); i-- > 0;) {
        path.append(names[i]).append(i == 0 ? std::string_view() : separator);
    }
    return path;
}

const FieldReport *Report::field(std::string_view name) const {
    return firstOfName(fields, name);
}

const KeyValue *Report::key(std::string_view name) const {
    return firstOfName(keys, name);
}

void ReportSink::begin(Pass pass, std::span<const std::uint8_t> /*packet*/) {
    constexpr std::size_t usualFields = 48; // an IP and a transport header
    report_ = {};
    report_.pass = pass;
    report_.fields.reserve(pass == Pass::md ? usualFields : 0);
    report_.displays.reserve(pass == Pass::to ? usualFields : 0);
}

void ReportSink::field(const FieldView &field) {
    keepBlocks(field.blocks);
    FieldReport &kept = report_.fields.emplace_back();
    kept.id = field.id;
    kept.name = field.reportedName.view();
    kept.text = field.text.view();
    kept.value = field.value;
    kept.ranges.reserve(field.ranges.size());
    for (const BitRange &range : field.ranges) {
        kept.ranges.push_back({range.value, range.firstBit, range.lastBit});
    }
    kept.bitOrder = field.bitOrder;
    kept.flags = field.flags;
    kept.block = field.blocks.empty() ? Block::none : field.blocks.back().number;
    kept.recordHead = field.recordHead;
}

// New blocks are the innermost ones, and their numbers are consecutive.
void ReportSink::keepBlocks(std::span<const BlockView> blocks) {
    std::size_t known = blocks.size();
    while (known > 0 && blocks[known - 1].number >= report_.blocks.size()) {
        --known;
    }
    for (std::size_t i = known; i < blocks.size(); ++i) {
        const std::size_t parent = i == 0 ? Block::none : blocks[i - 1].number;
        report_.blocks.push_back({std::string(blocks[i].name), parent, blocks[i].firstBit});
    }
    if (!blocks.empty() && report_.blocks[blocks.back().number].name.empty()) {
        report_.blocks[blocks.back().number].name = blocks.back().name;
    }
}

void ReportSink::text(const ShortTextView &text) {
    report_.displays.push_back({text.displayId, std::string(text.text.view()), text.layerNumber});
}

void ReportSink::key(const KeyView &key) {
    report_.keys.push_back(
        {std::string(key.name), key.row, key.type, key.number, {key.octets.begin(), key.octets.end()}});
}

void ReportSink::layer(const LayerRecord &layer) {
    report_.layers.push_back(layer);
}

void ReportSink::handOff(const HandOff &handOff) {
    report_.handOffs.push_back(handOff);
}

void ReportSink::end(const PassEnd &end) {
    const DecodeState &state = end.state;
    report_.ending = end.ending;
    report_.result = end.result;
    report_.cursor = state.cursor;
    report_.bitsLeft = end.bitsLeft;
    report_.flags = state.flags;
    report_.verdict = end.verdict;
    report_.stateBitsLeft = state.bitsLeft;
    report_.blockDepth = depthOf(state.blockStarts);
    report_.limitDepth = depthOf(state.limits);
    report_.layerIndex = state.layerIndex;
    report_.layerHandedOff = state.layerHandedOff != 0;
    report_.condition = state.condition != 0;
    report_.layerNumber = end.layerNumber;
    report_.decoderId = end.decoderId;
    std::ranges::copy(state.scratch, report_.scratch.begin());
}

} // namespace netfloor
