// SPDX-License-Identifier: MIT
#include "packet_run.h"

#include <algorithm>
#include <string>
#include <tuple>
#include <utility>

namespace netfloor {
namespace {

constexpr std::int32_t refusal = -1;
constexpr std::uint8_t untouchedOctet = 0xff;
constexpr std::size_t usualFields = 48; // an IP and a transport header

std::uint32_t modeOf(Pass pass) {
    switch (pass) {
    case Pass::md: return NETFLOOR_MODE_MD;
    case Pass::mv: return NETFLOOR_MODE_MV;
    default: return NETFLOOR_MODE_TO;
    }
}

// A plug-in that gives no text means an empty one.
std::string_view textOf(const char *text) {
    return text == nullptr ? std::string_view() : std::string_view(text);
}

} // namespace

PacketRun::PacketRun(LoadedPlugin &plugin, const OwnerRegistry &owners, Pass pass, std::span<const std::uint8_t> packet,
                     const RunOptions &options)
    : plugin_(plugin), owners_(owners), pass_(pass), options_(options), packet_(packet, options.state) {
    report_.pass = pass;
    if (pass == Pass::xtr) {
        xtr_.keyRecord = keyRecord_.emplace().octets();
        xtr_.byteAreaSize = options.byteAreaSize;
        xtr_.decodeState = &packet_.state();
        return;
    }
    layerInfo_.resize(std::size_t{options.layerInfoCapacity} + 1);
    preDecode_.operations = this;
    PreDecodeContext &context = preDecode_.context;
    context.layerNumber = options.layerNumber;
    context.decoderId = options.decoderId;
    context.fieldRecords = fieldRecords_.data();
    context.layerInfo = layerInfo_.data();
    context.layerInfoCapacity = options.layerInfoCapacity;
    context.decodeState = &packet_.state();
    markFieldRecord();
    report_.fields.reserve(pass == Pass::md ? usualFields : 0);
    report_.displays.reserve(pass == Pass::to ? usualFields : 0);
}

Report PacketRun::run() {
    report_.result = enter();
    if (exception_) {
        std::rethrow_exception(exception_);
    }
    finish();
    return std::move(report_);
}

std::int32_t PacketRun::enter() {
    switch (pass_) {
    case Pass::md: return plugin_.preDecodeMD(&preDecode_.context);
    case Pass::to: return plugin_.preDecodeTO(&preDecode_.context);
    case Pass::mv: return plugin_.preDecodeMV(&preDecode_.context);
    case Pass::xtr: return enterExtract();
    }
    return 0;
}

// The XTR pass stops at a hand-off, and it is for the host to go on with the owner.
std::int32_t PacketRun::enterExtract() {
    const std::int32_t result = plugin_.enterExtract(&xtr_);
    if (result != 1 || packet_.state().layerHandedOff == 0 || !options_.followStop) {
        return result;
    }
    if (handOff() == Handled::refused) {
        return 0;
    }
    xtr_.bitsLeft = packet_.state().bitsLeft;
    return result;
}

bool PacketRun::enterFromOwner() {
    if (reentries_ >= options_.mostNesting) {
        return false;
    }
    ++reentries_;
    const std::int32_t result = enter();
    --reentries_;
    return result == 1 && !exception_;
}

std::int32_t PacketRun::preDecode(std::uint32_t mode) noexcept {
    try {
        if (mode != modeOf(pass_)) {
            throw PluginError("the plug-in " + plugin_.path().string() + " hands on in mode " + std::to_string(mode) +
                              " during the pass " + std::string(passName(pass_)) + ": it does not fit this host.");
        }
        return handOff() == Handled::refused ? refusal : 0;
    } catch (...) {
        keepException();
        return refusal;
    }
}

Handled PacketRun::handOff() {
    HandOff record = describeHandOff();
    NextLayer next(*this);
    ++handOffDepth_;
    const Handled handled = owners_.find(next.key(), next.ipProtocol())(next);
    --handOffDepth_;
    record.consumedBits = packet_.state().cursor - record.cursor;
    record.refused = handled == Handled::refused;
    report_.handOffs.push_back(record);
    return handled;
}

HandOff PacketRun::describeHandOff() const {
    const DecodeState &state = packet_.state();
    HandOff record;
    record.key = frame().nextLayerKey;
    record.protocol = frame().nextLayerProtocol;
    record.port = state.scratch[NETFLOOR_NEXT_LAYER_PORT];
    record.nextLayerOctets = state.scratch[NETFLOOR_NEXT_LAYER_OCTETS];
    record.precedingOctets = state.scratch[NETFLOOR_PRECEDING_OCTETS];
    record.layerNumber = preDecode_.context.layerNumber;
    record.layerIndex = state.layerIndex;
    record.cursor = state.cursor;
    record.bitsLeft = state.bitsLeft;
    record.contextBitsLeft = pass_ == Pass::xtr ? xtr_.bitsLeft : preDecode_.context.bitsLeft;
    record.blockDepth = depthOf(state.blockStarts);
    record.limitDepth = depthOf(state.limits);
    record.nesting = handOffDepth_;
    return record;
}

const LayerFrame &PacketRun::frame() const {
    return packet_.state().layerFrames[packet_.state().layerIndex];
}

void PacketRun::addField(std::uint32_t outputRangeCount, const BitRange *ranges, const char *display,
                         const char *fieldName, std::uint32_t fieldId, std::uint32_t bitOrder) noexcept {
    try {
        PreDecodeContext &context = preDecode_.context;
        const std::uint8_t *const head = context.fieldRecords + context.fieldRecordCount * fieldRecordOctets;
        FieldReport &field = report_.fields.emplace_back();
        field.id = fieldId;
        field.name = textOf(fieldName);
        field.text = textOf(display);
        field.value = packet_.state().fieldRecord.value;
        field.ranges.reserve(outputRangeCount);
        for (std::uint32_t i = 0; i < outputRangeCount; ++i) {
            field.ranges.push_back({ranges[i].value, ranges[i].firstBit, ranges[i].lastBit});
        }
        field.bitOrder = bitOrder;
        field.flags = packet_.state().flags;
        field.block = blocks_.current(packet_.state(), report_.blocks);
        std::copy_n(head, field.recordHead.size(), field.recordHead.begin());
        context.fieldRecordCount = (context.fieldRecordCount + 1) % fieldRecordCount;
        markFieldRecord();
    } catch (...) {
        keepException();
    }
}

// Marks the head of the current field record, so that what the plug-in leaves alone can be told.
void PacketRun::markFieldRecord() {
    std::fill_n(preDecode_.context.fieldRecords + preDecode_.context.fieldRecordCount * fieldRecordOctets,
                std::tuple_size_v<decltype(FieldReport::recordHead)>, untouchedOctet);
}

void PacketRun::addDisplay(const char *display, std::uint32_t displayId) noexcept {
    try {
        report_.displays.push_back({displayId, std::string(textOf(display)), preDecode_.context.layerNumber});
    } catch (...) {
        keepException();
    }
}

// The plug-in writes the record on return whatever happens here: without storage there is no way on, and the
// process ends.
void PacketRun::growLayerInfo() noexcept {
    PreDecodeContext &context = preDecode_.context;
    layerInfo_.resize(2 * (std::size_t{context.layerInfoCount} + 1));
    context.layerInfo = layerInfo_.data();
    context.layerInfoCapacity = static_cast<std::uint32_t>(layerInfo_.size() - 1);
}

void PacketRun::openLayer(std::uint32_t decoderId) {
    PreDecodeContext &context = preDecode_.context;
    if (context.layerInfoCount > context.layerInfoCapacity) {
        growLayerInfo();
    }
    context.layerInfo[context.layerInfoCount] = {packet_.state().cursor, 0, decoderId, context.layerNumber};
}

void PacketRun::closeLayer() {
    PreDecodeContext &context = preDecode_.context;
    context.layerInfo[context.layerInfoCount].lastBit = packet_.state().cursor - 1;
    ++context.layerInfoCount;
}

void PacketRun::addOwnEntry(std::uint32_t bits, std::string_view name, std::string_view longText,
                            std::string_view shortText) {
    const DecodeState &state = packet_.state();
    if (pass_ == Pass::md) {
        FieldReport field;
        field.name = name;
        field.text = longText;
        field.ranges.push_back({0, state.cursor, state.cursor + bits - 1});
        field.flags = state.flags;
        field.block = blocks_.current(state, report_.blocks);
        field.recordHead = {preDecode_.context.layerNumber, 0, 0};
        report_.fields.push_back(std::move(field));
    } else if (pass_ == Pass::to) {
        report_.displays.push_back({0, std::string(shortText), preDecode_.context.layerNumber});
    }
}

void PacketRun::keepException() noexcept {
    if (!exception_) {
        exception_ = std::current_exception();
    }
}

void PacketRun::finish() {
    const DecodeState &state = packet_.state();
    const PreDecodeContext &context = preDecode_.context;
    report_.cursor = state.cursor;
    report_.flags = state.flags;
    report_.stateBitsLeft = state.bitsLeft;
    report_.blockDepth = depthOf(state.blockStarts);
    report_.limitDepth = depthOf(state.limits);
    report_.layerIndex = state.layerIndex;
    report_.layerHandedOff = state.layerHandedOff != 0;
    report_.condition = state.condition != 0;
    std::ranges::copy(state.scratch, report_.scratch.begin());
    report_.ending = report_.result > 0 ? Ending::complete : report_.result == 0 ? Ending::cutOff : Ending::keysDenied;
    if (pass_ == Pass::xtr) {
        report_.bitsLeft = xtr_.bitsLeft;
        report_.keys = keyRecord_->values(plugin_.keyTable(), plugin_.keyTypes(), xtr_.byteAreaOffset);
        return;
    }
    report_.bitsLeft = context.bitsLeft;
    report_.layerNumber = context.layerNumber;
    report_.decoderId = context.decoderId;
    if (pass_ == Pass::mv) {
        report_.verdict = {context.verdict, state.flags};
        return;
    }
    for (std::uint32_t i = 0; i < context.layerInfoCount; ++i) {
        const LayerInfoRecord &layer = context.layerInfo[i];
        report_.layers.push_back({layer.firstBit, layer.lastBit, layer.decoderId, layer.layerNumber});
    }
}

Host::Host(PluginLibrary library) : library_(std::move(library)) {}

Report Host::run(Pass pass, std::span<const std::uint8_t> packet, const RunOptions &options) {
    return PacketRun(*library_.loaded_, owners_, pass, packet, options).run();
}

} // namespace netfloor
