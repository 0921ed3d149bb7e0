// SPDX-License-Identifier: MIT
#include "exports.h"

#include <algorithm>
#include <cstring>
#include <type_traits>

#include "random.h"
#include "trace.h"

namespace netfloor::compare {
namespace {

template <class Row>
const Row *rows(const void *table) {
    return static_cast<const Row *>(table);
}

void tellText(Trace &trace, const char *label, const char *text) {
    trace.text(label, text == nullptr ? "(null)" : text, SIZE_MAX);
}

void tellSlots(Trace &trace, const void *table) {
    const auto *const slots = rows<std::remove_extent_t<decltype(ProtocolIdentity::slots)>>(table);
    for (std::size_t i = 0; i < std::size(ProtocolIdentity{}.slots); ++i) {
        const bool isNumber = (i >= 16 && i <= 18) || i >= 21;
        isNumber ? trace.number("slot", slots[i].number) : tellText(trace, "slot", slots[i].text);
    }
}

void tellFields(Trace &trace, const void *table) {
    const auto *row = rows<FieldDescriptor>(table);
    for (; row->flags != NETFLOOR_NO_FIELD; ++row) {
        FieldDescriptor numbers = *row;
        numbers.name = numbers.shortName = nullptr;
        trace.event("field");
        trace.words("row", &numbers, sizeof numbers / 4);
        tellText(trace, "name", row->name);
        tellText(trace, "shortName", row->shortName);
    }
    FieldTableEnd end{};
    std::memcpy(&end, row, sizeof end);
    tellText(trace, "marker", end.marker);
    end.marker = nullptr;
    trace.words("end", &end, sizeof end / 4);
}

void tellTexts(Trace &trace, const void *table) {
    const auto *text = rows<const char *>(table);
    do {
        tellText(trace, "text", *text);
    } while (std::strcmp(*text++, NETFLOOR_LAST_TEXT) != 0);
}

// The numbers, of which only the rows know how many there are, after the rows themselves.
void tellValues(Trace &trace, const Plugin &plugin, const void *table) {
    std::uint32_t numbers = 0;
    const auto *const first = rows<ValueMapRow>(table);
    const auto *row = first;
    for (; row->kind != 0; ++row) {
        numbers = std::max(numbers, row->poolIndex + (row->kind == NETFLOOR_VALUE_RANGE ? 2 : 1));
    }
    trace.words("value", first, static_cast<std::size_t>(row + 1 - first) * sizeof *row / 4);
    const void *pool = nullptr;
    plugin.getTable(NETFLOOR_TABLE_POOL, &pool);
    trace.words("pool", pool, numbers);
}

void tellLayouts(Trace &trace, const void *table) {
    const auto *const octets = rows<std::uint8_t>(table);
    std::size_t end = 0;
    std::uint16_t length = 0;
    do {
        std::memcpy(&length, octets + end, sizeof length);
        end += sizeof length + length;
    } while (length != 0);
    trace.octets("layouts", octets, end);
}

void tellProbe(Trace &trace, const void *table, std::size_t skipped) {
    std::uint32_t size = 0;
    std::memcpy(&size, rows<std::uint8_t>(table) - skipped + 4, sizeof size);
    trace.octets("probe", table, size - skipped);
}

void tellTable(Trace &trace, const Plugin &plugin, std::int32_t index, const void *table) {
    switch (index) {
    case NETFLOOR_TABLE_VERSION: return tellText(trace, "version", rows<char>(table));
    case NETFLOOR_TABLE_IDENTITY: return tellSlots(trace, table);
    case NETFLOOR_TABLE_FIELDS: return tellFields(trace, table);
    case NETFLOOR_TABLE_SAMPLE: return tellProbe(trace, table, 16);
    case NETFLOOR_TABLE_VALUES: return tellValues(trace, plugin, table);
    case NETFLOOR_TABLE_TEXTS: return tellTexts(trace, table);
    case NETFLOOR_TABLE_LAYOUTS: return tellLayouts(trace, table);
    default: return;
    }
}

void tellPointer(Trace &trace, std::int32_t index, const void *table) {
    switch (index) {
    case NETFLOOR_TABLE_VERSION: return tellText(trace, "version", rows<char>(table));
    case NETFLOOR_TABLE_IDENTITY:
        trace.words("head", table, 4);
        return tellSlots(trace, rows<ProtocolIdentity>(table)->slots);
    case NETFLOOR_TABLE_FIELDS:
    case NETFLOOR_TABLE_SAMPLE: return tellProbe(trace, table, 0);
    default: return;
    }
}

void tellTimes(Trace &trace, const Plugin &plugin) {
    Random random(1);
    DecodeState state{};
    for (int i = 0; i < 2000; ++i) {
        state.fieldRecord.value = i % 2 == 0 ? random.below(0x100000000) : static_cast<std::uint32_t>(i) * 43200;
        char text[64] = "at ";
        trace.event("date_conv");
        trace.number("same", plugin.dateConv(text, nullptr, &state) == text);
        trace.octets("time", text, sizeof text);
    }
}

Trace exportsOf(const Plugin &plugin) {
    Trace trace;
    trace.start(true);
    for (std::int32_t index = -2; index < 20; ++index) {
        const void *table = &trace;
        trace.event("vx_DLLGetPtr");
        trace.number("index", index);
        trace.number("result", plugin.getPtr(index, &table));
        trace.number("found", table != nullptr);
        tellPointer(trace, index, table);
        table = &trace;
        trace.event("vx_DLLGetTable");
        trace.number("index", index);
        trace.number("result", plugin.getTable(index, &table));
        trace.number("found", table != nullptr);
        tellTable(trace, plugin, index, table);
    }
    tellTimes(trace, plugin);
    return trace;
}

} // namespace

std::string exportDifferences(const Plugin &before, const Plugin &after) {
    const Trace old = exportsOf(before);
    const Trace now = exportsOf(after);
    return old == now ? "" : firstDifference(old, now);
}

} // namespace netfloor::compare
