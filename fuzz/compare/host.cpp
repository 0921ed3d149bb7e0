// SPDX-License-Identifier: MIT
#include "host.h"

#include <csetjmp>

#include "arena.h"
#include "random.h"
#include "support/memory.h"

namespace netfloor::compare {
namespace {

// Decoded fields are records of 1000 octets, of which this host keeps a few in turn.
constexpr std::size_t decodedFieldOctets = 1000;
constexpr std::uint32_t decodedFields = 4;

constexpr std::size_t mostPacketOctets = std::size_t{1} << 18;
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

// All of the run that is going on; the operations have no argument in which it could stand.
const Plugin *plugin;
const Input *input;
Pass pass;
Trace *trace;
const Observer *observer;
Arena arena;
std::span<std::uint8_t> working, source; // both end at an inaccessible page
DecodeState *state;
PreDecodeContext *context; // null in the XTR pass
XtrContext *keyContext;    // null in the others
std::size_t keyRecordOctets;
std::uint32_t growths, handOffs, depth;
std::int32_t lastResult;
// The plug-in keeps nothing that would have to be unwound.
jmp_buf beforeRun;

// What can be seen, in groups. Pointers are places in the storage, or in the packet.

void tracePointer(const char *label, const void *to) {
    const auto inside = [&](std::span<const std::uint8_t> octets) {
        const auto *const octet = static_cast<const std::uint8_t *>(to);
        return octet >= octets.data() && octet < octets.data() + octets.size();
    };
    const auto offset = [&](const void *from) {
        return static_cast<const std::uint8_t *>(to) - static_cast<const std::uint8_t *>(from);
    };
    trace->number(label, to == nullptr          ? -1
                         : to == working.data() ? -2
                         : to == source.data()  ? -3
                         : inside(arena.used()) ? offset(arena.used().data())
                                                : -4);
}

void traceStack(const char *label, const BitStack &stack) {
    const auto top = stack.top - stack.base;
    tracePointer(label, stack.base);
    trace->number("depth", top);
    trace->words("count capacity", &stack.count, 2 * sizeof stack.count);
    if (top >= 0 && top < stack.capacity) {
        trace->words(label, stack.base, (static_cast<std::size_t>(top) + 1) * sizeof *stack.base);
    }
}

void traceFieldRecord(const FieldRecord &record) {
    trace->number("recordId", record.fieldId);
    tracePointer("name", record.fieldName);
    trace->text("name", record.fieldName, textOctets);
    trace->number("value", record.value);
    tracePointer("valueText", record.valueText);
    trace->text("valueText", record.valueText, textOctets);
    trace->words("rangeCount outputRangeCount", &record.rangeCount, 2 * sizeof record.rangeCount);
    tracePointer("ranges", record.ranges);
    trace->words("rangeCapacity wideStart wideBits untouched1 untouched1 rawFlag untouched2 untouched2",
                 &record.rangeCapacity, 8 * sizeof record.rangeCapacity);
    trace->words("range", record.ranges, std::min(record.rangeCount, record.rangeCapacity) * sizeof(BitRange));
}

void traceState() {
    tracePointer("data", state->data);
    tracePointer("sourceData", state->sourceData);
    trace->words("totalBits cursor reserved1 bitsLeft flags", &state->totalBits, 5 * sizeof(std::uint32_t));
    traceStack("blockStarts", state->blockStarts);
    traceStack("limits", state->limits);
    trace->number("condition", state->condition);
    trace->words("advance reserved2", &state->advance, 2 * sizeof(std::uint32_t));
    tracePointer("blockName", state->blockName);
    trace->text("blockName", state->blockName, nameOctets);
    trace->words("scratch", state->scratch, sizeof state->scratch);
    traceFieldRecord(state->fieldRecord);
    tracePointer("layerFrames", state->layerFrames);
    trace->words("layerHandedOff layerIndex layerCapacity", &state->layerHandedOff, 3 * sizeof(std::uint32_t));
    trace->words("frame", state->layerFrames,
                 std::min(state->layerIndex + std::size_t{1}, std::size_t{state->layerCapacity}) * sizeof(LayerFrame));
}

void traceContext() {
    if (context == nullptr) {
        trace->number("left", keyContext->bitsLeft);
        tracePointer("keyRecord", keyContext->keyRecord);
        trace->words("byteAreaOffset byteAreaSize", &keyContext->byteAreaOffset, 4, sizeof keyContext->byteAreaSize);
        trace->octets("keyRecord", keyContext->keyRecord, keyRecordOctets);
        return;
    }
    trace->number("left", context->bitsLeft);
    trace->number("layerNumber", context->layerNumber);
    trace->words("decoderId verdict", &context->decoderId, 2 * sizeof context->decoderId);
    tracePointer("fieldRecords", context->fieldRecords);
    trace->number("fieldRecordCount", context->fieldRecordCount);
    trace->octets("decoded", context->fieldRecords + context->fieldRecordCount * decodedFieldOctets, 8);
    tracePointer("layerInfo", context->layerInfo);
    trace->words("layerInfoCount layerInfoCapacity", &context->layerInfoCount, 2 * sizeof context->layerInfoCount);
    trace->words("info", context->layerInfo,
                 (std::min(context->layerInfoCount, context->layerInfoCapacity) + std::size_t{1}) *
                     sizeof(LayerInfoRecord));
}

void event(const char *name) {
    if (trace->events() > mostEvents) {
        longjmp(beforeRun, 1);
    }
    trace->event(name);
    if (*observer) {
        (*observer)({name, *state, context, working, lastResult});
    }
    if (!trace->keepsAnything()) {
        return;
    }
    traceState();
    traceContext();
    const bool changed = !std::ranges::equal(working, input->packet);
    trace->number("copyChanged", changed);
    trace->octets("copy", working.data(), changed ? working.size() : 0);
}

void event(const char *name, const void *argument) {
    event(name);
    tracePointer("argument", argument);
}

void setUpPacket() {
    static const test::GuardedOctets workingRoom{test::Octets(mostPacketOctets)};
    static const test::GuardedOctets sourceRoom{test::Octets(mostPacketOctets)};
    const test::Octets &packet = input->packet;
    working = workingRoom.octets().last(packet.size());
    source = sourceRoom.octets().last(packet.size());
    std::ranges::copy(packet, working.begin());
    std::ranges::transform(packet, source.begin(), [](std::uint8_t octet) {
        return static_cast<std::uint8_t>(octet ^ input->plan.sourceMask);
    });
}

BitStack newStack(std::uint32_t capacity, std::uint32_t bottom) {
    auto *const base = arena.array<std::uint32_t>(capacity);
    *base = bottom;
    return {.base = base, .top = base, .count = 0, .capacity = capacity};
}

// What a host need not set stays as the storage is filled.
void setUpState(const Plan &plan) {
    state = arena.array<DecodeState>(1);
    state->data = working.data();
    state->sourceData = source.data();
    const auto bits = static_cast<std::uint32_t>(input->packet.size() * 8);
    state->totalBits = bits - std::min(plan.missingBits, bits);
    state->cursor = plan.cursor;
    const std::uint32_t after = state->totalBits + 1 - std::min(plan.cursor, state->totalBits + 1);
    state->bitsLeft = after - std::min(plan.outerBits, after);
    state->flags = plan.flags;
    state->blockStarts = newStack(plan.blockCapacity, state->cursor);
    state->limits = newStack(plan.limitCapacity, state->cursor + state->bitsLeft - 1);
    state->condition = 0;
    state->advance = 0;
    state->blockName = arena.array<char>(nameOctets);
    state->blockName[0] = '\0';
    std::ranges::fill(state->scratch, 0u);
    state->fieldRecord.rangeCount = 0;
    state->fieldRecord.fieldName = arena.array<char>(textOctets);
    state->fieldRecord.valueText = arena.array<char>(textOctets);
    state->fieldRecord.ranges = arena.array<BitRange>(plan.rangeCapacity);
    state->fieldRecord.rangeCapacity = plan.rangeCapacity;
    state->layerHandedOff = 1;
    state->layerIndex = plan.layerIndex;
    state->layerCapacity = plan.layerCapacity + plan.layerIndex;
    state->layerFrames = arena.array<LayerFrame>(state->layerCapacity);
}

void setUpContext(const Plan &plan) {
    context = arena.array<PreDecodeContext>(1);
    keyContext = nullptr;
    context->layerNumber = static_cast<std::uint8_t>(plan.seed);
    context->decoderId = static_cast<std::uint8_t>(plan.seed >> 8);
    context->verdict = 0;
    context->fieldRecords = arena.array<std::uint8_t>(decodedFields * decodedFieldOctets);
    context->fieldRecordCount = 0;
    context->layerInfo = arena.array<LayerInfoRecord>(plan.layerInfoCapacity + std::size_t{1});
    context->layerInfoCapacity = plan.layerInfoCapacity;
    context->layerInfoCount = plan.seed >> 16 & 1;
    context->decodeState = state;
}

void setUpKeyContext(const Plan &plan) {
    keyContext = arena.array<XtrContext>(1);
    context = nullptr;
    // An offset has 16 bits; in each layer an address takes as many octets as it has in the packet.
    keyRecordOctets = std::min<std::size_t>(byteArea + mostDepth * input->packet.size(), 0x10000) + nameOctets;
    keyContext->keyRecord = arena.array<std::uint8_t>(keyRecordOctets);
    std::memset(keyContext->keyRecord, 0, presenceOctets);
    keyContext->byteAreaOffset = byteArea;
    keyContext->byteAreaSize = plan.byteAreaSize;
    keyContext->decodeState = state;
}

void enter() {
    lastResult = plugin->passes[static_cast<std::size_t>(pass)](context);
    event("result");
    trace->number("result", static_cast<std::uint8_t>(lastResult));
}

// A next layer may have let the arrays grow.
void moveStorage() {
    const auto grow = [](auto *&array, std::uint32_t &capacity) {
        capacity += 1;
        array =
            static_cast<std::remove_reference_t<decltype(array)>>(arena.reallocate(array, capacity * sizeof *array));
    };
    for (BitStack *const stack : {&state->blockStarts, &state->limits}) {
        const auto top = stack->top - stack->base;
        grow(stack->base, stack->capacity);
        stack->top = stack->base + top;
    }
    grow(state->fieldRecord.ranges, state->fieldRecord.rangeCapacity);
    grow(state->layerFrames, state->layerCapacity);
}

// Changes a text. What stands past the end of an empty one, which passes leave as they like, does not come to light.
void beginWithX(char *text) {
    if (*text == '\0') {
        text[1] = '\0';
    }
    *text = 'x';
}

// Leaves the packet as a next layer may leave it, or as none should.
void leavePacket(Random random) {
    const std::uint32_t part = random.below(state->bitsLeft + std::uint64_t{1});
    const auto take = [](std::uint32_t bits) { state->cursor += bits, state->bitsLeft -= bits; };
    switch (random.below(7)) {
    case 0: break;
    case 1: take(part / 8 * 8); break;
    case 2: take(part); break;
    case 3: state->bitsLeft -= std::min(part, random.from(1, 9)); break;
    case 4: state->cursor -= std::min(state->cursor - 1, random.from(1, 70)); break;
    case 5: state->cursor = random.from(1, state->totalBits + 64), state->bitsLeft = random.below(600); break;
    default: take(state->bitsLeft); break;
    }
    if (random.oneIn(3)) {
        moveStorage();
    }
    if (random.oneIn(4)) {
        state->flags |= random.pick({2u, 8u, 16u, 0x100u});
    }
    if (random.oneIn(4)) {
        state->condition ^= 1;
        state->advance = static_cast<std::int32_t>(random.next());
        state->fieldRecord.rangeCount = random.below(3);
        beginWithX(state->fieldRecord.fieldName);
        beginWithX(state->blockName);
        state->scratch[random.below(32)] = random.below(1000);
    }
    if (random.oneIn(4) && !working.empty()) {
        working[random.below(working.size())] ^= random.octet();
    }
    if (context != nullptr && random.oneIn(4)) {
        context->decoderId += 3;
        context->layerNumber = random.octet();
    }
}

// The XTR pass ends at a hand-off, and the host goes on by itself. One that was not ready is asked again.
void extractLayers() {
    const Plan &plan = input->plan;
    for (std::uint32_t layer = 0; layer < mostDepth; ++layer) {
        lastResult = plugin->extract(keyContext);
        event("result");
        trace->number("result", lastResult);
        if (plan.keyStatus == 0) {
            continue;
        }
        if (lastResult != 1 || state->layerHandedOff != 1 || !plan.oddOwners) {
            return;
        }
        leavePacket(Random(plan.seed + layer));
        state->cursor = std::min(state->cursor, state->totalBits + 1);
        state->bitsLeft = std::min(state->bitsLeft, state->totalBits + 1 - state->cursor);
    }
}

std::int32_t decodeNextLayer() {
    const Plan &plan = input->plan;
    Random random(plan.seed + handOffs);
    if (++handOffs > mostHandOffs) {
        return -1;
    }
    if (!plan.oddOwners || random.oneIn(6)) {
        state->cursor += state->bitsLeft;
        state->bitsLeft = 0;
        return 0;
    }
    if (random.oneIn(8)) {
        return -static_cast<std::int32_t>(random.from(1, 0x7fffffff));
    }
    if (depth < mostDepth && random.oneIn(4)) {
        ++depth;
        enter();
        --depth;
    }
    leavePacket(random);
    return random.pick({0, 0, 1, 7});
}

std::int32_t unusedResult() {
    return static_cast<std::int32_t>(input->plan.seed);
}

} // namespace

bool run(const Plugin &thePlugin, Pass thePass, const Input &theInput, Trace &theTrace, const Observer &theObserver) {
    plugin = &thePlugin, pass = thePass, input = &theInput, trace = &theTrace;
    observer = &theObserver;
    growths = handOffs = depth = 0, lastResult = 0;
    arena.clear();
    trace->clear();
    setUpPacket();
    setUpState(input->plan);
    pass == Pass::xtr ? setUpKeyContext(input->plan) : setUpContext(input->plan);
    const bool ended = setjmp(beforeRun) == 0;
    if (ended) {
        pass == Pass::xtr ? extractLayers() : enter();
    } else {
        trace->event("no end"); // what can be seen may be broken
    }
    const bool overrun = arena.overrun();
    trace->number("overrun", overrun);
    return ended && !overrun;
}

} // namespace netfloor::compare

using namespace netfloor::compare;

void *hs_Malloc(std::size_t size) {
    return hs_Realloc(nullptr, size);
}

void *hs_Realloc(void *old, std::size_t size) {
    event("hs_Realloc", old);
    trace->number("size", size);
    if (++growths == input->plan.refusedGrowth) {
        return nullptr;
    }
    return old == nullptr ? arena.allocate(size) : arena.reallocate(old, size);
}

std::int32_t hs_CreateNewLayerInfo(PreDecodeContext *of) {
    event("hs_CreateNewLayerInfo", of);
    of->layerInfoCapacity = of->layerInfoCount + of->layerNumber % 3;
    of->layerInfo = static_cast<LayerInfoRecord *>(
        arena.reallocate(of->layerInfo, (of->layerInfoCapacity + std::size_t{1}) * sizeof *of->layerInfo));
    return unusedResult();
}

std::int32_t hs_AddDecodedFieldsData(PreDecodeContext *of, std::uint32_t outputRangeCount, const BitRange *ranges,
                                     const char *display, std::uint32_t zero1, const char *fieldName,
                                     std::uint32_t fieldId, std::uint32_t zero2, std::uint32_t bitOrder) {
    event("hs_AddDecodedFieldsData", of);
    trace->number("outputRangeCount", outputRangeCount);
    tracePointer("ranges", ranges);
    trace->text("display", display);
    trace->number("zero1", zero1);
    trace->text("fieldName", fieldName);
    trace->number("fieldId", fieldId);
    trace->number("zero2", zero2);
    trace->number("bitOrder", bitOrder);
    of->fieldRecordCount = (of->fieldRecordCount + 1) % decodedFields;
    return unusedResult();
}

std::int32_t hs_AddFieldsToDisplayData(PreDecodeContext *of, const char *display, std::uint32_t displayId) {
    event("hs_AddFieldsToDisplayData", of);
    trace->text("display", display);
    trace->number("fieldId", displayId);
    return unusedResult();
}

std::int32_t hd_PreDecode(PreDecodeContext *of, std::uint32_t mode) {
    event("hd_PreDecode", of);
    trace->number("mode", mode);
    return decodeNextLayer();
}

std::int32_t hx_InitialiseOptXTR(KeyFieldRow *table, std::uint32_t rowCount, std::uint16_t *presenceRow) {
    event("hx_InitialiseOptXTR");
    Random random(input->plan.seed);
    for (std::uint32_t row = 0; row < rowCount; ++row) {
        trace->text("protocolName", table[row].protocolName);
        trace->text("fieldName", table[row].fieldName);
        trace->words("zero", table[row].zero, sizeof table[row].zero);
        table[row].presenceOffset = row;
        table[row].presenceMask = random.below(0x100000000);
        table[row].valueOffset = presenceOctets + 4 * row;
    }
    trace->number("rowCount", rowCount);
    trace->number("presenceRow", *presenceRow);
    *presenceRow = static_cast<std::uint16_t>(random.below(keyRows + 5));
    return input->plan.keyStatus;
}
