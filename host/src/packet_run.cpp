// SPDX-License-Identifier: MIT
#include "packet_run.h"

#include <algorithm>
#include <limits>
#include <string>
#include <utility>

namespace netfloor {
namespace {

constexpr std::int32_t refusal = -1;
constexpr std::size_t usualLayers = 8;
constexpr std::uint16_t addressAreaOctets = 64; // for one address, which takes 17 octets

constexpr std::size_t mostPacketOctets = std::numeric_limits<std::uint32_t>::max() / bitsPerOctet;

std::uint32_t modeOf(Pass pass) {
    switch (pass) {
    case Pass::md: return NETFLOOR_MODE_MD;
    case Pass::mv: return NETFLOOR_MODE_MV;
    default: return NETFLOOR_MODE_TO;
    }
}

Ending endingOf(std::int32_t result) {
    if (result == 0) {
        return Ending::cutOff;
    }
    return result > 0 ? Ending::complete : Ending::keysDenied;
}

// The flags that were raised before the first field that was not captured.
class SoundFlags final : public Sink {
public:
    [[nodiscard]] bool wantsBlocks() const override { return false; }
    void notCaptured(const NotCaptured &first) override { flags = first.flags; }
    std::uint32_t flags = ~std::uint32_t{0};
};

std::string_view withoutLeadingBlanks(std::string_view name) {
    name.remove_prefix(std::min(name.find_first_not_of(' '), name.size()));
    return name;
}

} // namespace

PacketRun::PacketRun(LoadedPlugin &plugin, FieldNames &names)
    : plugin_(plugin), names_(names), reused_({}), layerInfo_(usualLayers), blocks_(names) {
    preDecode_.operations = this;
}

Ending PacketRun::run(Pass pass, std::span<const std::uint8_t> packet, const OwnerRegistry &owners, Sink &sink,
                      const RunOptions &options, const TestRunOptions *test) {
    owners_ = &owners;
    options_ = options;
    soundFlags_ = ~std::uint32_t{0};
    cut_.take(packet, options.wireOctets);
    return cut_.isCut() ? runCut(pass, sink, test) : finish(runPass(pass, sink, test));
}

// A grammar looks ahead, and so a captured octet may be read as another field because of one that was not captured.
// What two runs with other values in the place of those octets have in common comes from captured octets.
Ending PacketRun::runCut(Pass pass, Sink &sink, const TestRunOptions *test) {
    if (pass == Pass::mv) { // it does not report where it is; the MD pass does, and raises flags in the same places
        SoundFlags flags;
        runCut(Pass::md, flags, test);
        soundFlags_ = flags.flags;
        return finish(runPass(pass, sink, test));
    }
    Sink nothing;
    cut_.fill(0xff);
    reading_.clear();
    isFirstReading_ = true;
    (void)runPass(pass, nothing, test);
    isFirstReading_ = false;
    cut_.fill(0);
    if (pass != Pass::xtr) {
        return finish(runPass(pass, sink, test));
    }
    if (!otherKeys_) {
        otherKeys_.emplace();
    }
    std::swap(keyRecord_, *otherKeys_);
    return finish(runPass(pass, sink, test), &*otherKeys_);
}

std::int32_t PacketRun::runPass(Pass pass, Sink &sink, const TestRunOptions *test) {
    pass_ = pass;
    sink_ = &sink;
    withBlocks_ = pass == Pass::md && sink.wantsBlocks();
    withBlockNames_ = sink.wantsBlockNames();
    wantedFields_ = withBlocks_ ? std::span<const std::uint8_t>() : sink.wantedFields();
    reportsAll_ = !cut_.isCut() && wantedFields_.empty();
    view_.depth = 0;
    view_.blocks = {};
    view_.blockName = {};
    prepare(test);
    sink.begin(pass, packet_);
    const std::int32_t result = enter();
    if (exception_) {
        std::rethrow_exception(exception_);
    }
    if (pass == Pass::xtr) {
        keyRecord_.setEnd(xtr_.byteAreaOffset);
    }
    return result;
}

void PacketRun::prepare(const TestRunOptions *test) {
    packet_ = cut_.octets();
    bitsBeyond_ = 0;
    isReadToCut_ = false;
    fieldsRead_ = 0;
    exception_ = nullptr;
    handOffDepth_ = 0;
    reentries_ = 0;
    followStop_ = test == nullptr || test->followStop;
    if (test == nullptr) {
        if (packet_.size() > CutPacket::mostOctets && packet_.size() <= mostPacketOctets) {
            bitsBeyond_ = static_cast<std::uint32_t>((packet_.size() - CutPacket::mostOctets) * bitsPerOctet);
            packet_ = packet_.first(CutPacket::mostOctets);
        }
        reused_.reset(packet_); // refuses what is longer
        state_ = &reused_.state();
    } else {
        state_ = &exact_.emplace(packet_, test->state).state();
    }
    if (pass_ == Pass::xtr) {
        prepareKeyContext(test);
    } else {
        prepareContext(test);
    }
}

void PacketRun::prepareContext(const TestRunOptions *test) {
    if (test != nullptr) {
        layerInfo_ = std::vector<LayerInfoRecord>(std::size_t{test->layerInfoCapacity} + 1);
    }
    PreDecodeContext &context = preDecode_.context;
    context.bitsLeft = 0;
    context.layerNumber = options_.layerNumber;
    context.decoderId = options_.decoderId;
    context.verdict = 0;
    context.fieldRecords = fieldRecords_.data();
    context.fieldRecordCount = 0;
    context.layerInfo = layerInfo_.data();
    context.layerInfoCount = 0;
    context.layerInfoCapacity = static_cast<std::uint32_t>(layerInfo_.size() - 1);
    context.decodeState = &state();
    if (pass_ == Pass::md) {
        blocks_.reset();
        fillFieldRecordHead();
    }
}

void PacketRun::prepareKeyContext(const TestRunOptions *test) {
    keyRecord_.reset();
    xtr_.bitsLeft = 0;
    xtr_.keyRecord = keyRecord_.octets();
    xtr_.byteAreaOffset = 0;
    xtr_.byteAreaSize = test == nullptr ? addressAreaOctets : test->byteAreaSize;
    xtr_.decodeState = &state();
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

// The XTR pass stops at a hand-off, and the host goes on with the owner.
std::int32_t PacketRun::enterExtract() {
    const std::int32_t result = plugin_.enterExtract(&xtr_);
    if (result != 1 || state().layerHandedOff == 0 || !followStop_) {
        return result;
    }
    if (handOff() == Handled::refused) {
        return 0;
    }
    xtr_.bitsLeft = state().bitsLeft;
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
    if (exception_) {
        return refusal;
    }
    try {
        if (mode != modeOf(pass_)) {
            throw PluginError("the plug-in " + plugin_.path().string() + " hands off in mode " + std::to_string(mode) +
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
    const OwnerTurn turn(plugin_);
    ++handOffDepth_;
    const Handled handled = owners_->find(next.key(), next.ipProtocol())(next);
    --handOffDepth_;
    record.consumedBits = state().cursor - record.cursor;
    record.refused = handled == Handled::refused;
    if (!exception_ && !isReadToCut_) {
        sink_->handOff(record);
    }
    return handled;
}

HandOff PacketRun::describeHandOff() const {
    const DecodeState &state = *state_;
    HandOff record;
    record.key = frame().nextLayerKey;
    record.protocol = frame().nextLayerProtocol;
    record.port = state.scratch[NETFLOOR_NEXT_LAYER_PORT];
    record.nextLayerOctets = state.scratch[NETFLOOR_NEXT_LAYER_OCTETS];
    record.precedingOctets = state.scratch[NETFLOOR_PRECEDING_OCTETS];
    record.layerNumber = pass_ == Pass::xtr ? 0 : preDecode_.context.layerNumber;
    record.layerIndex = state.layerIndex;
    record.cursor = state.cursor;
    record.bitsLeft = state.bitsLeft;
    record.contextBitsLeft = pass_ == Pass::xtr ? xtr_.bitsLeft : preDecode_.context.bitsLeft;
    record.blockDepth = depthOf(state.blockStarts);
    record.limitDepth = depthOf(state.limits);
    record.nesting = handOffDepth_;
    return record;
}

// Out of line, so that a field in the block of the one before saves no registers for it.
[[gnu::noinline]] void PacketRun::moveToBlock(NamedField &field) {
    blocks_.moveTo(state(), field, *sink_);
    view_.depth = blocks_.shownDepth();
    view_.blocks = blocks_.open();
    view_.blockName = LazyText(view_.blocks.empty() ? std::string_view() : view_.blocks.back().name);
}

// Completes the view by what the decode state tells. Inside its callers: it is what most of the MD pass's time in the
// host goes to.
[[gnu::always_inline]] inline void PacketRun::reportField(NamedField &field) {
    const DecodeState &state = *state_;
    view_.flags = state.flags;
    view_.cursor = state.cursor;
    if (withBlocks_) {
        if (!blocks_.isAt(state)) {
            moveToBlock(field);
        }
        blocks_.passField(state);
    } else if (withBlockNames_) {
        view_.blockName = LazyText(names_.blockName(field, state.blockName));
    }
    sink_->field(view_);
}

// Fills the view by what the plug-in gives with the call. Inside its callers, as reportField.
[[gnu::always_inline]] inline NamedField &PacketRun::takeField(std::uint32_t outputRangeCount, const BitRange *ranges,
                                                               const char *display, const char *fieldName,
                                                               std::uint32_t fieldId, std::uint32_t bitOrder) {
    NamedField &field = names_.find(fieldId);
    view_.id = fieldId;
    view_.name = field.name;
    view_.isKey = field.isKey;
    view_.text = LazyText(display);
    view_.reportedName = LazyText(fieldName);
    view_.value = state().fieldRecord.value;
    view_.ranges = {ranges, outputRangeCount};
    view_.bitOrder = bitOrder;
    std::memcpy(view_.recordHead.data(), fieldRecordHead(), headOctets);
    nextFieldRecord();
    if (!field.isKnown) { // last, so that it saves no registers
        view_.name = withoutLeadingBlanks(view_.reportedName.view());
    }
    return field;
}

std::int32_t PacketRun::addField(std::uint32_t outputRangeCount, const BitRange *ranges, const char *display,
                                 std::uint32_t zero, const char *fieldName, std::uint32_t fieldId,
                                 std::uint32_t otherZero, std::uint32_t bitOrder) noexcept {
    if (!reportsAll_) {
        return addChosenField(outputRangeCount, ranges, display, zero, fieldName, fieldId, otherZero, bitOrder);
    }
    try {
        NamedField &field = takeField(outputRangeCount, ranges, display, fieldName, fieldId, bitOrder);
        reportField(field);
    } catch (...) {
        keepException();
    }
    return 0;
}

// A field that may not be for the sink. With the arguments of addField, so that it is called by a jump.
std::int32_t PacketRun::addChosenField(std::uint32_t outputRangeCount, const BitRange *ranges, const char *display,
                                       std::uint32_t /*zero*/, const char *fieldName, std::uint32_t fieldId,
                                       std::uint32_t /*otherZero*/, std::uint32_t bitOrder) noexcept {
    if (exception_) {
        return 0;
    }
    const bool isWanted = this->isWanted(fieldId);
    if (!isWanted && !cut_.isCut()) { // in a packet that is cut each field is compared between two runs
        fillFieldRecordHead();
        return 0;
    }
    try {
        NamedField &field = takeField(outputRangeCount, ranges, display, fieldName, fieldId, bitOrder);
        if (!cut_.isCut() || (isCaptured(view_.name, view_.ranges) && isWanted)) {
            reportField(field);
        }
    } catch (...) {
        keepException();
    }
    return 0;
}

void PacketRun::addDisplay(const char *display, std::uint32_t displayId) noexcept {
    if (exception_) {
        return;
    }
    try {
        const NamedField &field = names_.find(displayId);
        const FieldRecord &record = state().fieldRecord;
        if (cut_.isCut() && !isCaptured(field.name, {record.ranges, record.outputRangeCount})) {
            return;
        }
        sink_->text({displayId, field.name, field.isKey, LazyText(display), preDecode_.context.layerNumber});
    } catch (...) {
        keepException();
    }
}

// When this returns, the plug-in writes the record without a test. So without storage the process ends.
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
    context.layerInfo[context.layerInfoCount] = {state().cursor, 0, decoderId, context.layerNumber};
}

void PacketRun::closeLayer() {
    PreDecodeContext &context = preDecode_.context;
    context.layerInfo[context.layerInfoCount].lastBit = state().cursor - 1;
    ++context.layerInfoCount;
}

void PacketRun::addOwnEntry(std::uint32_t bits, std::string_view name, std::string_view longText,
                            std::string_view shortText) {
    if (exception_) {
        return;
    }
    const BitRange range = {0, state().cursor, state().cursor + bits - 1, 0, {}};
    if (cut_.isCut() && !isCaptured(name, {&range, 1})) {
        return;
    }
    if (pass_ == Pass::md) {
        view_.id = 0;
        view_.name = name;
        view_.isKey = false;
        view_.text = LazyText(longText);
        view_.reportedName = LazyText(name);
        view_.value = 0;
        view_.ranges = {&range, 1};
        view_.bitOrder = 0;
        view_.recordHead = {preDecode_.context.layerNumber, 0, 0};
        reportField(names_.find(0));
    } else if (pass_ == Pass::to) {
        sink_->text({0, name, false, LazyText(shortText), preDecode_.context.layerNumber});
    }
}

bool PacketRun::isCaptured(std::string_view name, std::span<const BitRange> ranges) {
    if (isReadToCut_) {
        return false;
    }
    const FieldRead field = {name, state().cursor};
    bool isSame = true;
    if (isFirstReading_) {
        reading_.push_back(field);
    } else {
        isSame = fieldsRead_ < reading_.size() && reading_[fieldsRead_] == field;
        ++fieldsRead_;
    }
    if (!isSame || !cut_.holds(ranges, state().cursor)) {
        isReadToCut_ = true;
        sink_->notCaptured({name, state().flags});
    }
    return !isReadToCut_;
}

void PacketRun::keepException() noexcept {
    if (!exception_) {
        exception_ = std::current_exception();
        reportsAll_ = false;
    }
}

Ending PacketRun::finish(std::int32_t result, const KeyRecord *otherKeys) {
    const PreDecodeContext &context = preDecode_.context;
    const Ending ending = endingOf(result);
    // The XTR pass stops inside the packet at a hand-off, and tells what its limit leaves.
    const bool atEnd = ending == Ending::complete && (pass_ != Pass::xtr || state().layerHandedOff == 0);
    const std::uint32_t bitsBeyond = atEnd ? bitsBeyond_ : 0;
    if (pass_ == Pass::xtr) {
        keyRecord_.report(plugin_.keyColumns(), otherKeys, *sink_);
        sink_->end({pass_, ending, result, xtr_.bitsLeft + bitsBeyond, {}, 0, 0, state()});
        return ending;
    }
    Verdict verdict;
    if (pass_ == Pass::mv) {
        const std::uint32_t flags = state().flags & soundFlags_;
        verdict = {flags == 0 ? 0 : context.verdict, flags};
    } else {
        blocks_.closeAll(*sink_);
        for (const LayerInfoRecord &layer : std::span(context.layerInfo, context.layerInfoCount)) {
            sink_->layer({layer.firstBit, layer.lastBit, layer.decoderId, layer.layerNumber});
        }
    }
    sink_->end({pass_, ending, result, context.bitsLeft + bitsBeyond, verdict, context.layerNumber, context.decoderId,
                state()});
    return ending;
}

} // namespace netfloor
