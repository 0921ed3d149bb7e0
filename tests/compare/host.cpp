// SPDX-License-Identifier: MIT
#include "host.h"

#include <algorithm>
#include <csignal>
#include <cstring>

#include <netfloor/host.h>
#include <unistd.h>

#include "random.h"

namespace netfloor::compare {
namespace {

// A field record has room for 1000 octets, of which the host here keeps a few in turn.
constexpr std::size_t decodedFieldOctets = 1000;
constexpr std::uint32_t decodedFields = 4;

constexpr std::size_t nameOctets = 64;
constexpr std::size_t textOctets = 255;

// Key records: presence octets, then a place of four octets a row, then the area for addresses.
constexpr std::uint32_t keyRows = 113;
constexpr std::uint32_t presenceOctets = 128;
constexpr std::size_t byteArea = presenceOctets + std::size_t{4} * keyRows;

// After these a run would not end, or not soon.
constexpr std::size_t mostEvents = 200'000;
constexpr std::uint32_t mostHandOffs = 48;
constexpr std::uint32_t mostDepth = 3;
constexpr unsigned mostSeconds = 20;

Host *current = nullptr;
sigjmp_buf beforeRun;
constexpr int endless = 1000; // no number of a signal

// Signals come from the plug-in's code, which keeps nothing that would have to be unwound.
extern "C" void leaveRun(int signal) {
    siglongjmp(beforeRun, signal);
}

void catchSignals() {
    static std::uint8_t ownStack[1 << 16];
    stack_t stack{};
    stack.ss_sp = ownStack;
    stack.ss_size = sizeof ownStack;
    sigaltstack(&stack, nullptr);
    struct sigaction action {};
    action.sa_handler = leaveRun;
    action.sa_flags = SA_ONSTACK | SA_NODEFER;
    for (const int signal : {SIGSEGV, SIGBUS, SIGILL, SIGFPE, SIGABRT, SIGALRM}) {
        sigaction(signal, &action, nullptr);
    }
}

BitStack stackOf(Arena &arena, std::uint32_t capacity, std::uint32_t bottom) {
    auto *const base = arena.allocate<std::uint32_t>(capacity);
    *base = bottom;
    return {.base = base, .top = base, .count = 0, .capacity = capacity};
}

} // namespace

const char *nameOf(Pass pass) {
    static constexpr std::array names = {"TO", "MD", "MV", "XTR"};
    return names[static_cast<std::size_t>(pass)];
}

Host::Host() {
    catchSignals();
}

bool Host::run(const Plugin &plugin, Pass pass, const Input &input, Trace &trace) {
    plugin_ = &plugin;
    plan_ = &input.plan;
    trace_ = &trace;
    pass_ = pass;
    current = this;
    setUp(input);
    alarm(mostSeconds);
    const int signal = sigsetjmp(beforeRun, 0);
    if (signal == 0) {
        pass == Pass::xtr ? extractLayers() : enter();
    } else {
        trace_->event(signal == endless ? "no end" : "crash"); // what can be seen may be broken
        trace_->number("signal", signal);
    }
    alarm(0);
    if (strict) {
        trace_->octets("storage", arena_.used().data(), arena_.used().size());
    }
    const bool overrun = arena_.overrun();
    trace_->number("overrun", overrun);
    return signal == 0 && !overrun;
}

void Host::setUp(const Input &input) {
    growths_ = handOffs_ = depth_ = 0;
    arena_.clear();
    original_ = input.packet;
    data_.assign(original_);
    source_.assign(original_);
    for (std::size_t i = 0; i < source_.size(); ++i) {
        source_.data()[i] ^= plan_->sourceMask;
    }
    state_ = arena_.allocate<DecodeState>(1);
    context_ = arena_.allocate<PreDecodeContext>(1);
    keyContext_ = arena_.allocate<XtrContext>(1);
    setUpState();
    if (pass_ == Pass::xtr) {
        // An offset has 16 bits; in each layer an address takes as many octets as it has in the packet.
        keyRecordOctets_ = std::min<std::size_t>(byteArea + mostDepth * input.packet.size(), 0x10000) + nameOctets;
        keyContext_->keyRecord = arena_.allocate<std::uint8_t>(keyRecordOctets_);
        std::memset(keyContext_->keyRecord, 0, presenceOctets);
        keyContext_->byteAreaOffset = byteArea;
        keyContext_->byteAreaSize = plan_->byteAreaSize;
        keyContext_->decodeState = state_;
        return;
    }
    Random random(plan_->seed);
    context_->layerNumber = random.octet();
    context_->decoderId = random.below(1000);
    context_->verdict = 0;
    context_->fieldRecords = arena_.allocate<std::uint8_t>(decodedFields * decodedFieldOctets);
    context_->fieldRecordCount = 0;
    context_->layerInfo = arena_.allocate<LayerInfoRecord>(plan_->layerInfoCapacity + std::size_t{1});
    context_->layerInfoCapacity = plan_->layerInfoCapacity;
    context_->layerInfoCount = random.below(2);
    context_->decodeState = state_;
}

void Host::setUpState() {
    const auto bits = static_cast<std::uint32_t>(data_.size() * 8);
    DecodeState &state = *state_;
    state.data = data_.data();
    state.sourceData = source_.data();
    state.totalBits = bits - std::min(plan_->missingBits, bits);
    state.cursor = plan_->cursor;
    const std::uint32_t after = state.totalBits + 1 - std::min(plan_->cursor, state.totalBits + 1);
    state.bitsLeft = after - std::min(plan_->outerBits, after);
    state.flags = plan_->flags;
    state.blockStarts = stackOf(arena_, plan_->blockCapacity, state.cursor);
    state.limits = stackOf(arena_, plan_->limitCapacity, state.cursor + state.bitsLeft - 1);
    state.condition = 0;
    state.advance = 0;
    state.blockName = arena_.allocate<char>(nameOctets);
    state.blockName[0] = '\0';
    std::fill_n(state.scratch, std::size(state.scratch), 0u);
    FieldRecord &record = state.fieldRecord;
    record.rangeCount = record.outputRangeCount = 0;
    record.fieldName = arena_.allocate<char>(textOctets);
    record.valueText = arena_.allocate<char>(textOctets);
    record.ranges = arena_.allocate<BitRange>(plan_->rangeCapacity);
    record.rangeCapacity = plan_->rangeCapacity;
    state.layerIndex = plan_->layerIndex;
    state.layerCapacity = std::max(plan_->layerCapacity, plan_->layerIndex + 1);
    state.layerFrames = arena_.allocate<LayerFrame>(state.layerCapacity);
    state.layerHandedOff = 1;
}

void Host::enter() {
    const std::uint8_t result = plugin_->passes[static_cast<std::size_t>(pass_)](context_);
    event("result");
    trace_->number("result", result);
}

// The XTR pass ends at a hand-off, and the host goes on by itself.
void Host::extractLayers() {
    for (std::uint32_t layer = 0; layer < mostDepth; ++layer) {
        const std::int32_t result = plugin_->extract(keyContext_);
        event("result");
        trace_->number("result", result);
        const bool asksAgain = plan_->keyStatus == 0;
        if (!asksAgain && (result != 1 || state_->layerHandedOff != 1 || !plan_->oddOwners)) {
            return;
        }
        if (!asksAgain) {
            leavePacket(Random(plan_->seed + layer).next());
            state_->cursor = std::min(state_->cursor, state_->totalBits + 1);
            state_->bitsLeft = std::min(state_->bitsLeft, state_->totalBits + 1 - state_->cursor);
        }
    }
}

void *Host::grow(void *old, std::size_t size) {
    event("hs_Realloc");
    pointer("old", old);
    trace_->number("size", size);
    if (++growths_ == plan_->refusedGrowth) {
        return nullptr;
    }
    return old == nullptr ? arena_.allocate(size) : arena_.reallocate(old, size);
}

std::int32_t Host::createLayerInfo(PreDecodeContext *context) {
    event("hs_CreateNewLayerInfo");
    pointer("argument", context);
    const std::uint32_t capacity = context->layerInfoCount + context->layerNumber % 3;
    context->layerInfo = static_cast<LayerInfoRecord *>(
        arena_.reallocate(context->layerInfo, (capacity + std::size_t{1}) * sizeof *context->layerInfo));
    context->layerInfoCapacity = capacity;
    return static_cast<std::int32_t>(plan_->seed); // not used
}

std::int32_t Host::addDecodedField(PreDecodeContext *context, std::uint32_t outputRangeCount, const BitRange *ranges,
                                   const char *display, std::uint32_t zero1, const char *fieldName,
                                   std::uint32_t fieldId, std::uint32_t zero2, std::uint32_t bitOrder) {
    event("hs_AddDecodedFieldsData");
    pointer("argument", context);
    trace_->number("outputRangeCount", outputRangeCount);
    pointer("ranges", ranges);
    trace_->text("display", display, SIZE_MAX);
    trace_->number("zero1", zero1);
    trace_->text("fieldName", fieldName, SIZE_MAX);
    trace_->number("fieldId", fieldId);
    trace_->number("zero2", zero2);
    trace_->number("bitOrder", bitOrder);
    if (fieldId < fieldsSeen_.size()) {
        fieldsSeen_.set(fieldId);
    }
    context->fieldRecordCount = (context->fieldRecordCount + 1) % decodedFields;
    return static_cast<std::int32_t>(plan_->seed); // not used
}

std::int32_t Host::addDisplay(PreDecodeContext *context, const char *display, std::uint32_t displayId) {
    event("hs_AddFieldsToDisplayData");
    pointer("argument", context);
    trace_->text("display", display, SIZE_MAX);
    trace_->number("fieldId", displayId);
    return static_cast<std::int32_t>(plan_->seed); // not used
}

std::int32_t Host::handOff(PreDecodeContext *context, std::uint32_t mode) {
    event("hd_PreDecode");
    pointer("argument", context);
    trace_->number("mode", mode);
    if (++handOffs_ > mostHandOffs) {
        return -1;
    }
    Random random(plan_->seed * mostHandOffs + handOffs_);
    if (!plan_->oddOwners || random.oneIn(6)) {
        state_->cursor += state_->bitsLeft;
        state_->bitsLeft = 0;
        return 0;
    }
    if (random.oneIn(8)) {
        return -static_cast<std::int32_t>(random.from(1, 0x7fffffff));
    }
    if (depth_ < mostDepth && random.oneIn(4)) {
        ++depth_;
        enter();
        --depth_;
    }
    leavePacket(random.next());
    return random.pick<std::int32_t>({0, 0, 1, 7});
}

// The packet as a next layer may leave it.
void Host::leavePacket(std::uint64_t draw) {
    Random random(draw);
    DecodeState &state = *state_;
    const std::uint32_t part = random.below(state.bitsLeft + std::uint64_t{1});
    switch (random.below(7)) {
    case 0: break;
    case 1: state.cursor += part / 8 * 8, state.bitsLeft -= part / 8 * 8; break;
    case 2: state.cursor += part, state.bitsLeft -= part; break;
    case 3: state.bitsLeft -= std::min(part, random.from(1, 9)); break;
    case 4: state.cursor -= std::min(state.cursor - 1, random.from(1, 70)); break;
    case 5: state.cursor = random.from(1, state.totalBits + 64), state.bitsLeft = random.below(600); break;
    default: state.cursor += state.bitsLeft, state.bitsLeft = 0; break;
    }
    if (random.oneIn(3)) {
        moveStorage();
    }
    if (random.oneIn(4)) {
        state.flags |= random.pick({2u, 8u, 16u, 0x100u});
    }
    if (random.oneIn(4)) {
        state.condition ^= 1;
        state.advance = static_cast<std::int32_t>(random.next());
        state.fieldRecord.rangeCount = random.below(3);
        state.fieldRecord.fieldName[0] = 'x';
        state.scratch[random.below(32)] = random.below(1000);
        std::strcpy(state.blockName, "an owner's block");
    }
    if (random.oneIn(4) && data_.size() != 0) {
        data_.data()[random.below(data_.size())] ^= random.octet();
    }
    if (random.oneIn(4) && pass_ != Pass::xtr) {
        context_->decoderId += 3;
        context_->layerNumber = random.octet();
    }
}

// A next layer may have let the arrays grow.
void Host::moveStorage() {
    const auto moved = [&]<class Element>(Element *&array, std::uint32_t &capacity) {
        capacity += 1;
        array = static_cast<Element *>(arena_.reallocate(array, capacity * sizeof *array));
    };
    for (BitStack *const stack : {&state_->blockStarts, &state_->limits}) {
        const auto depth = stack->top - stack->base;
        moved(stack->base, stack->capacity);
        stack->top = stack->base + depth;
    }
    moved(state_->fieldRecord.ranges, state_->fieldRecord.rangeCapacity);
    moved(state_->layerFrames, state_->layerCapacity);
}

std::int32_t Host::setUpKeys(KeyFieldRow *table, std::uint32_t rowCount, std::uint16_t *presenceRow) {
    event("hx_InitialiseOptXTR");
    trace_->number("rowCount", rowCount);
    Random random(plan_->seed);
    for (std::uint32_t row = 0; row < rowCount; ++row) {
        KeyFieldRow &key = table[row];
        trace_->text("protocolName", key.protocolName, SIZE_MAX);
        trace_->text("keyName", key.fieldName, SIZE_MAX);
        trace_->words("zero", key.zero, std::size(key.zero));
        key.presenceOffset = row;
        key.presenceMask = random.next() & 0xffffffff;
        key.valueOffset = presenceOctets + 4 * row;
    }
    trace_->number("presenceRow", *presenceRow);
    *presenceRow = static_cast<std::uint16_t>(random.below(keyRows + 5));
    return plan_->keyStatus;
}

// Notes an operation, with all that the host can see when it is called.
void Host::event(const char *name) {
    if (trace_->events() > mostEvents) {
        siglongjmp(beforeRun, endless);
    }
    trace_->event(name);
    snapshot();
}

void Host::snapshot() {
    const DecodeState &state = *state_;
    pointer("data", state.data);
    pointer("sourceData", state.sourceData);
    trace_->number("totalBits", state.totalBits);
    trace_->number("cursor", state.cursor);
    trace_->number("reserved1", state.reserved1);
    trace_->number("bitsLeft", state.bitsLeft);
    trace_->number("flags", state.flags);
    const auto stack = [&](const char *label, const BitStack &bits) {
        const auto depth = bits.top - bits.base;
        pointer(label, bits.base);
        trace_->number("depth", depth);
        trace_->number("stack count", bits.count);
        trace_->number("stack capacity", bits.capacity);
        if (depth >= 0 && depth < bits.capacity) {
            trace_->words(label, bits.base, static_cast<std::size_t>(depth) + 1);
        }
    };
    stack("blockStarts", state.blockStarts);
    stack("limits", state.limits);
    trace_->number("condition", state.condition);
    trace_->number("advance", state.advance);
    trace_->number("reserved2", state.reserved2);
    pointer("blockName", state.blockName);
    trace_->text("blockName", state.blockName, nameOctets);
    trace_->words("scratch", state.scratch, std::size(state.scratch));
    snapshotFieldRecord();
    pointer("layerFrames", state.layerFrames);
    trace_->number("layerHandedOff", state.layerHandedOff);
    trace_->number("layerIndex", state.layerIndex);
    trace_->number("layerCapacity", state.layerCapacity);
    trace_->words("frame", state.layerFrames,
                  std::min(state.layerIndex + 1, state.layerCapacity) * sizeof(LayerFrame) / 4);
    snapshotContext();
    const bool changed = std::memcmp(data_.data(), original_.data(), original_.size()) != 0;
    trace_->octets("working copy", data_.data(), changed ? data_.size() : 0);
}

void Host::snapshotFieldRecord() {
    const FieldRecord &record = state_->fieldRecord;
    trace_->number("record id", record.fieldId);
    pointer("record name", record.fieldName);
    trace_->text("record name", record.fieldName, textOctets);
    trace_->number("record value", record.value);
    pointer("record text", record.valueText);
    trace_->text("record text", record.valueText, textOctets);
    trace_->number("rangeCount", record.rangeCount);
    trace_->number("record outputRangeCount", record.outputRangeCount);
    pointer("record ranges", record.ranges);
    trace_->number("rangeCapacity", record.rangeCapacity);
    trace_->number("wideStart", record.wideStart);
    trace_->number("wideBits", record.wideBits);
    trace_->words("untouched1", record.untouched1, 2);
    trace_->number("rawFlag", record.rawFlag);
    trace_->words("untouched2", record.untouched2, 2);
    const std::uint32_t shown = strict ? record.rangeCapacity : std::min(record.rangeCount, record.rangeCapacity);
    trace_->words("range", record.ranges, shown * sizeof(BitRange) / 4);
}

void Host::snapshotContext() {
    if (pass_ == Pass::xtr) {
        trace_->number("context bitsLeft", keyContext_->bitsLeft);
        trace_->number("byteAreaOffset", keyContext_->byteAreaOffset);
        trace_->number("byteAreaSize", keyContext_->byteAreaSize);
        pointer("keyRecord", keyContext_->keyRecord);
        trace_->octets("keyRecord", keyContext_->keyRecord, keyRecordOctets_);
        return;
    }
    const PreDecodeContext &context = *context_;
    trace_->number("context bitsLeft", context.bitsLeft);
    trace_->number("layerNumber", context.layerNumber);
    trace_->number("decoderId", context.decoderId);
    trace_->number("verdict", context.verdict);
    trace_->number("fieldRecordCount", context.fieldRecordCount);
    trace_->number("layerInfoCount", context.layerInfoCount);
    trace_->number("layerInfoCapacity", context.layerInfoCapacity);
    pointer("layerInfo", context.layerInfo);
    trace_->words("layerInfo", context.layerInfo,
                  std::min(context.layerInfoCount, context.layerInfoCapacity) * sizeof(LayerInfoRecord) / 4 +
                      sizeof(LayerInfoRecord) / 4);
    pointer("fieldRecords", context.fieldRecords);
    trace_->octets("decoded field", context.fieldRecords + context.fieldRecordCount * decodedFieldOctets, 8);
}

// A pointer as what it points to: the packet, the source, or a place in the storage.
void Host::pointer(const char *label, const void *to) {
    const auto *const octet = static_cast<const std::uint8_t *>(to);
    const auto *const storage = arena_.used().data();
    const bool stored = octet >= storage && octet < storage + arena_.used().size();
    trace_->number(label, to == data_.data()     ? -1
                          : to == source_.data() ? -2
                          : to == nullptr        ? -3
                          : stored               ? octet - storage
                                                 : -4);
}

} // namespace netfloor::compare

using netfloor::compare::current;

void *hs_Malloc(std::size_t size) {
    return current->grow(nullptr, size);
}

void *hs_Realloc(void *old, std::size_t size) {
    return current->grow(old, size);
}

std::int32_t hs_CreateNewLayerInfo(PreDecodeContext *context) {
    return current->createLayerInfo(context);
}

std::int32_t hs_AddDecodedFieldsData(PreDecodeContext *context, std::uint32_t outputRangeCount, const BitRange *ranges,
                                     const char *display, std::uint32_t zero1, const char *fieldName,
                                     std::uint32_t fieldId, std::uint32_t zero2, std::uint32_t bitOrder) {
    return current->addDecodedField(context, outputRangeCount, ranges, display, zero1, fieldName, fieldId, zero2,
                                    bitOrder);
}

std::int32_t hs_AddFieldsToDisplayData(PreDecodeContext *context, const char *display, std::uint32_t displayId) {
    return current->addDisplay(context, display, displayId);
}

std::int32_t hd_PreDecode(PreDecodeContext *context, std::uint32_t mode) {
    return current->handOff(context, mode);
}

std::int32_t hx_InitialiseOptXTR(KeyFieldRow *table, std::uint32_t rowCount, std::uint16_t *presenceRow) {
    return current->setUpKeys(table, rowCount, presenceRow);
}
