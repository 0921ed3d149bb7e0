// SPDX-License-Identifier: MIT
// The four passes: what each does with a field once it is read, which flags it raises, and how it hands on.
//
// `Grammar` gives the variables and, for each field, the id under which the TO pass reports it and its row
// in the key-field table.
#pragma once

#include <array>
#include <cstdint>
#include <cstring>
#include <optional>
#include <type_traits>

#include "frame/pass.h"
#include "frame/text_line.h"
#include "netfloor/host.h"

namespace netfloor::plugin {

inline constexpr std::int32_t faultyVerdict = -52;

// The host keeps a record of this many octets for each decoded field.
inline constexpr std::size_t decodedFieldOctets = 1000;

// The list of layers, which the MD and TO passes keep.
inline void openLayerInfo(PreDecodeContext &context, std::uint32_t decoderId) {
    if (context.layerInfoCount > context.layerInfoCapacity) {
        hs_CreateNewLayerInfo(&context);
    }
    LayerInfoRecord &layer = context.layerInfo[context.layerInfoCount];
    layer.firstBit = context.decodeState->cursor;
    layer.decoderId = decoderId;
    layer.layerNumber = context.layerNumber;
}

inline void closeLayerInfo(PreDecodeContext &context) {
    context.layerInfo[context.layerInfoCount].lastBit = context.decodeState->cursor - 1;
    ++context.layerInfoCount;
}

// What the three passes with a PreDecodeContext share.
template <class Grammar, std::uint32_t mode>
struct PreDecodePass {
    using Context = PreDecodeContext;
    using Variables = typename Grammar::Variables;
    using Fields = typename Grammar::Fields;

    static constexpr bool reportsFields = mode != NETFLOOR_MODE_MV;

    template <const Field &>
    static constexpr bool takesValue = false;

    static inline constinit Variables variables{};
    static inline constinit std::uint32_t savedDecoderId = 0;

    static constexpr bool raises(Flag flag) { return mode == NETFLOOR_MODE_MV || flag == Flag::expectation; }

    static void giveVerdict(PreDecodeContext &context) {
        if constexpr (mode == NETFLOOR_MODE_MV) {
            context.verdict = faultyVerdict;
        }
    }

    NETFLOOR_INLINE static bool enter(PreDecodeContext &context) {
        if constexpr (reportsFields) {
            openLayerInfo(context, context.decoderId);
        }
        savedDecoderId = context.decoderId;
        return true;
    }

    // 0 where the run was cut off. No host can refuse it.
    using Result = std::uint8_t;
    NETFLOOR_INLINE static Result resultOf(std::optional<Outcome> outcome) {
        return outcome == Outcome::cutOff ? 0 : 1;
    }

    static void leave(PreDecodeContext &context) {
        if constexpr (reportsFields) {
            closeLayerInfo(context);
        }
    }

    // Runs the owner of the next layer. A nested run of this pass leaves its own
    // decoder id; that is the one put back.
    NETFLOOR_INLINE static Outcome transfer(PreDecodeContext &context) {
        if constexpr (reportsFields) {
            closeLayerInfo(context);
        }
        ++context.layerNumber;
        if (hd_PreDecode(&context, mode) < 0) {
            return Outcome::cutOff;
        }
        if constexpr (reportsFields) {
            openLayerInfo(context, savedDecoderId);
        }
        context.decoderId = savedDecoderId;
        return Outcome::running;
    }
};

// MD: the long text of each field, with its name, id and bit ranges.
template <class Grammar>
struct MdPass : PreDecodePass<Grammar, NETFLOOR_MODE_MD> {
    using Writer = ImmediateWriter;

    static inline constinit Line::Buffer buffer{};

    template <const Field &field, class Reader>
    NETFLOOR_INLINE static void output(Reader &reader, const std::uint8_t *, std::uint32_t, std::uint32_t) {
        report<field>(*reader.context, reader.state->fieldRecord, reader.bitOrder);
    }

private:
    // Out of line, as it calls the host anyway: inlined, it takes compilers longer.
    template <const Field &field>
    [[gnu::noinline]] static void report(PreDecodeContext &context, const FieldRecord &record, std::uint32_t bitOrder) {
        static constexpr Format format = parseFormat(longText<field>);
        std::uint8_t *const decoded = context.fieldRecords + context.fieldRecordCount * decodedFieldOctets;
        decoded[0] = context.layerNumber;
        decoded[1] = 0;
        if constexpr (field.place.shape != Shape::groups) {
            decoded[2] = 0;
        }
        Line line(buffer);
        fill<field, format>(line, record);
        hs_AddDecodedFieldsData(&context, record.outputRangeCount, record.ranges, line.terminated(), 0,
                                record.fieldName, field.id, 0, bitOrder);
    }
};

// TO: the short text of each field.
template <class Grammar>
struct ToPass : PreDecodePass<Grammar, NETFLOOR_MODE_TO> {
    using Writer = ImmediateWriter;

    static inline constinit Line::Buffer buffer{};

    template <const Field &field, class Reader>
    NETFLOOR_INLINE static void output(Reader &reader, const std::uint8_t *, std::uint32_t, std::uint32_t) {
        report<field>(*reader.context, reader.state->fieldRecord);
    }

private:
    // Out of line, as that of the MD pass.
    template <const Field &field>
    [[gnu::noinline]] static void report(PreDecodeContext &context, const FieldRecord &record) {
        static constexpr Format format = parseFormat(shortText<field>);
        Line line(buffer);
        fill<field, format>(line, record);
        hs_AddFieldsToDisplayData(&context, line.terminated(), Grammar::template displayId<field>);
    }
};

// MV: the verdict.
template <class Grammar>
struct MvPass : PreDecodePass<Grammar, NETFLOOR_MODE_MV> {
    using Writer = DeferredWriter<MvPass>;

    template <const Field &field, class Reader>
    NETFLOOR_INLINE static void output(Reader &reader, const std::uint8_t *, std::uint32_t, std::uint32_t) {
        reader.check();
    }
};

// XTR: the values of the key fields.
template <class Grammar>
struct XtrPass {
    using Context = XtrContext;
    using Writer = DeferredWriter<XtrPass>;
    using Variables = typename Grammar::Variables;
    using Fields = typename Grammar::Fields;

    static constexpr bool reportsFields = false;

    template <const Field &field>
    static constexpr bool takesValue =
        Grammar::template keyRow<field> != Grammar::noKeyRow &&field.place.shape != Shape::addressNibbles;

    static inline constinit Variables variables{};
    static inline constinit std::int32_t keyFieldStatus = 0;
    static inline constinit std::uint16_t presenceRow = 0;

    static constexpr bool raises(Flag flag) { return flag == Flag::expectation; }

    static void giveVerdict(XtrContext &) {}

    // Sets the key fields up until the host says they are, once and for all. False when it refuses.
    NETFLOOR_INLINE static bool enter(XtrContext &context) {
        if (keyFieldStatus == 0) {
            keyFieldStatus = hx_InitialiseOptXTR(Grammar::keyRows.data(),
                                                 static_cast<std::uint32_t>(Grammar::keyRows.size()), &presenceRow);
        }
        if (keyFieldStatus < 0) {
            return false;
        }
        if (keyFieldStatus > 1 && presenceRow < Grammar::keyRows.size()) {
            setPresent(context.keyRecord, Grammar::keyRows[presenceRow]);
        }
        return true;
    }

    // 0 where the run was cut off. Nothing: the host refused the key fields, and its answer is the result.
    using Result = std::int32_t;
    NETFLOOR_INLINE static Result resultOf(std::optional<Outcome> outcome) {
        if (!outcome) {
            return keyFieldStatus;
        }
        return *outcome == Outcome::cutOff ? 0 : 1;
    }

    static void leave(XtrContext &) {}

    // The pass ends at a hand-off: the host goes on by itself.
    NETFLOOR_INLINE static Outcome transfer(XtrContext &) { return Outcome::stopped; }

    template <const Field &field, class Reader>
    NETFLOOR_INLINE static void output(Reader &reader, const std::uint8_t *data, std::uint32_t start,
                                       std::uint32_t value) {
        constexpr std::uint32_t row = Grammar::template keyRow<field>;
        if constexpr (row != Grammar::noKeyRow) {
            const KeyFieldRow &key = Grammar::keyRows[row];
            std::uint8_t *const record = reader.context->keyRecord;
            setPresent(record, key);
            if constexpr (field.place.shape == Shape::addressNibbles) {
                if (!storeAddress(*reader.context, key, data, start)) {
                    reader.cutOff();
                }
            } else {
                storeNumber<field>(record, key, value);
            }
        }
    }

private:
    NETFLOOR_INLINE static void setPresent(std::uint8_t *record, const KeyFieldRow &row) {
        std::uint8_t &presence = record[row.presenceOffset];
        presence = static_cast<std::uint8_t>(presence | row.presenceMask);
    }

    template <const Field &field>
    NETFLOOR_INLINE static void storeNumber(std::uint8_t *record, const KeyFieldRow &row, std::uint32_t value) {
        constexpr std::uint32_t width = field.place.width();
        static_assert(width > 0 && width <= 32, "a key field is a number of up to 32 bits, or an address");
        using Stored =
            std::conditional_t<width <= 8, std::uint8_t, std::conditional_t<width <= 16, std::uint16_t, std::uint32_t>>;
        const auto stored = static_cast<Stored>(value * field.place.scale);
        std::memcpy(record + row.valueOffset, &stored, sizeof stored);
    }

    static constexpr std::uint32_t addressOctets = addressBits / bitsPerOctet;

    // An address as it is stored: each octet with its two nibbles exchanged, as the nibbles were read.
    NETFLOOR_INLINE static std::array<std::uint8_t, addressOctets> storedAddress(const std::uint8_t *data,
                                                                                 std::uint32_t start) {
        auto octets = octetArrayAt<addressOctets>(data, start);
        std::array<std::uint64_t, addressOctets / sizeof(std::uint64_t)> halves{};
        std::memcpy(halves.data(), octets.data(), addressOctets);
        halves = {nibblesExchanged(halves[0]), nibblesExchanged(halves[1])};
        std::memcpy(octets.data(), halves.data(), addressOctets);
        return octets;
    }

    // Stores an address as a string of octets. The room test counts one octet more than is written. False when there is
    // no room.
    NETFLOOR_INLINE static bool storeAddress(XtrContext &context, const KeyFieldRow &row, const std::uint8_t *data,
                                             std::uint32_t start) {
        std::uint8_t *const place = context.keyRecord + row.valueOffset;
        const std::array<std::uint16_t, 2> lengthAndPlace = {addressBits, context.byteAreaOffset};
        std::memcpy(place, lengthAndPlace.data(), sizeof lengthAndPlace);
        if (addressOctets >= context.byteAreaSize) [[unlikely]] {
            markFailed(place);
            storeWhatFits(context, data, start);
            return false;
        }
        const auto octets = storedAddress(data, start);
        std::memcpy(context.keyRecord + context.byteAreaOffset, octets.data(), addressOctets);
        context.byteAreaOffset = static_cast<std::uint16_t>(context.byteAreaOffset + addressOctets);
        return true;
    }

    [[gnu::cold, gnu::noinline]] static void markFailed(std::uint8_t *place) {
        std::uint32_t failed = 0;
        std::memcpy(&failed, place, sizeof failed);
        failed |= 0x80000000;
        std::memcpy(place, &failed, sizeof failed);
    }

    // An address is stored nibble by nibble, the last one first, and only a whole one is turned round at the end. So an
    // area that is too small is left with the end of the address. The room test keeps the last nibble of it free.
    [[gnu::cold, gnu::noinline]] static void storeWhatFits(const XtrContext &context, const std::uint8_t *data,
                                                           std::uint32_t start) {
        const auto address = storedAddress(data, start);
        std::uint8_t *const area = context.keyRecord + context.byteAreaOffset;
        for (std::size_t octet = 0; octet < context.byteAreaSize; ++octet) {
            area[octet] = address[addressOctets - 1 - octet];
        }
        if (context.byteAreaSize != 0) {
            area[context.byteAreaSize - 1] &= 0x0f;
        }
    }
};

} // namespace netfloor::plugin
