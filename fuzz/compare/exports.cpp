// SPDX-License-Identifier: MIT
#include <algorithm>
#include <cstring>

#include "plugin.h"

namespace netfloor::compare {
namespace {

template <class Row>
const Row *rows(const void *table) {
    return static_cast<const Row *>(table);
}

void traceIdentity(Trace &trace, const void *table) {
    const auto *const slot = rows<std::remove_extent_t<decltype(ProtocolIdentity::slots)>>(table);
    for (std::size_t i = 0; i < std::extent_v<decltype(ProtocolIdentity::slots)>; ++i) {
        const bool isNumber = (i >= 16 && i <= 18) || i >= 21;
        isNumber ? trace.number("slot", slot[i].number) : trace.text("slot", slot[i].text);
    }
}

void traceFields(Trace &trace, const void *table) {
    const auto *row = rows<FieldDescriptor>(table);
    for (; row->flags != NETFLOOR_NO_FIELD; ++row) {
        trace.event("field");
        FieldDescriptor numbers = *row;
        numbers.name = numbers.shortName = nullptr;
        trace.words("word", &numbers, sizeof numbers);
        trace.text("name", row->name);
        trace.text("shortName", row->shortName);
    }
    FieldTableEnd end{};
    std::memcpy(&end, row, sizeof end);
    trace.text("marker", end.marker);
    end.marker = nullptr;
    trace.words("end", &end, sizeof end);
}

void traceTexts(Trace &trace, const void *table) {
    const auto *text = rows<const char *>(table);
    do {
        trace.text("text", *text);
    } while (std::strcmp(*text++, NETFLOOR_LAST_TEXT) != 0);
}

// With the numbers of the pool, of which the rows alone tell how many there are.
void traceValues(Trace &trace, const void *table, const void *pool) {
    std::uint32_t numbers = 0;
    const auto *row = rows<ValueMapRow>(table);
    for (; row->kind != 0; ++row) {
        trace.words("value", row, sizeof *row);
        numbers = std::max(numbers, row->poolIndex + (row->kind == NETFLOOR_VALUE_RANGE ? 2 : 1));
    }
    trace.words("end", row, sizeof *row);
    trace.words("pool", pool, numbers * sizeof(std::int32_t));
}

void traceLayouts(Trace &trace, const void *table) {
    const auto *const first = rows<std::uint8_t>(table);
    std::uint16_t length = 0;
    const std::uint8_t *at = first;
    do {
        std::memcpy(&length, at, sizeof length);
        at += sizeof length + length;
    } while (length != 0);
    trace.octets("layouts", first, static_cast<std::size_t>(at - first));
}

// A probe tells its own size.
void traceProbe(Trace &trace, const void *probe) {
    trace.octets("probe", probe, rows<std::uint32_t>(probe)[1]);
}

} // namespace

void traceExports(const Plugin &plugin, Trace &trace) {
    const void *pointers[20] = {};
    const void *tables[20] = {};
    for (std::int32_t index = -1; index < 19; ++index) {
        trace.event("tables");
        trace.number("index", index);
        trace.number("ptrResult", plugin.getPtr(index, &pointers[std::max(index, 0)]));
        trace.number("tableResult", plugin.getTable(index, &tables[std::max(index, 0)]));
        trace.number("pointer", pointers[std::max(index, 0)] != nullptr);
        trace.number("table", tables[std::max(index, 0)] != nullptr);
    }
    for (std::int32_t index = NETFLOOR_TABLE_VERSION; index <= NETFLOOR_TABLE_LAYOUTS; ++index) {
        const bool hasPointer = index != 3 && index <= NETFLOOR_TABLE_SAMPLE;
        if ((index != 3 && tables[index] == nullptr) || (hasPointer && pointers[index] == nullptr)) {
            return; // one is missing, which is told above
        }
    }
    trace.text("version", rows<char>(pointers[NETFLOOR_TABLE_VERSION]));
    trace.text("version", rows<char>(tables[NETFLOOR_TABLE_VERSION]));
    trace.words("head", pointers[NETFLOOR_TABLE_IDENTITY], sizeof(ProtocolIdentity::head));
    traceIdentity(trace, rows<ProtocolIdentity>(pointers[NETFLOOR_TABLE_IDENTITY])->slots);
    traceIdentity(trace, tables[NETFLOOR_TABLE_IDENTITY]);
    traceProbe(trace, pointers[NETFLOOR_TABLE_FIELDS]);
    traceProbe(trace, pointers[NETFLOOR_TABLE_SAMPLE]);
    traceProbe(trace, rows<std::uint32_t>(tables[NETFLOOR_TABLE_SAMPLE]) - 4);
    traceFields(trace, tables[NETFLOOR_TABLE_FIELDS]);
    traceTexts(trace, tables[NETFLOOR_TABLE_TEXTS]);
    traceLayouts(trace, tables[NETFLOOR_TABLE_LAYOUTS]);
    traceValues(trace, tables[NETFLOOR_TABLE_VALUES], tables[NETFLOOR_TABLE_POOL]);
    DecodeState state{};
    for (std::uint32_t i = 0; i < 4000; ++i) {
        state.fieldRecord.value = i % 2 == 0 ? i * 43200 : i * 2654435761u;
        char text[64] = "at ";
        trace.number("date_conv", plugin.dateConv(text, nullptr, &state) == text);
        trace.octets("time", text, sizeof text);
    }
}

} // namespace netfloor::compare
