// SPDX-License-Identifier: MIT
// What a pass is: the type that says what is done with a field once it is read. The frame and the grammar are written
// against this concept; the four passes stand in passes.h.
#pragma once

#include <concepts>
#include <cstdint>
#include <optional>

#include "frame/field.h"
#include "frame/position.h"
#include "frame/state_writer.h"

namespace netfloor::plugin {

// What a production may find wrong. The pass decides whether it raises the flag.
enum class Flag : std::uint8_t {
    expectation,  // a fixed value was not met: all passes
    count,        // a list ended with another count than it should have: MV pass
    limitTooLong, // a length reaches past the bits left: MV pass
    bitsLeftOver, // bits that no field covers inside a length: MV pass
};

// Stand in for any field and any reader.
inline constexpr Field someField{0, "", octets(1), ""};
struct AnyReader {};

// clang-format off
template <class Pass>
concept DecodingPass = requires(typename Pass::Context &context, Flag flag, AnyReader &someReader, const std::uint8_t *data,
                                std::uint32_t start, std::uint32_t value) {
    // The host's record for a run: it has a `decodeState`.
    { context.decodeState } -> std::convertible_to<DecodeState *>;

    // The variables of the grammar. Each pass has a set of its own, which its entry clears.
    { Pass::variables } -> std::same_as<typename Pass::Variables &>;

    // The fields that the grammar may read, a FieldList.
    typename Pass::Fields;

    // Whether what was read is written to the host's records at once, or where the host can look:
    // an ImmediateWriter or a DeferredWriter.
    typename Pass::Writer;

    // Whether the host is called for each field.
    { Pass::reportsFields } -> std::convertible_to<bool>;

    // Whether the pass raises a flag.
    { Pass::raises(flag) } -> std::same_as<bool>;

    // Takes a raised flag into the verdict, in the pass that gives one.
    { Pass::giveVerdict(context) };

    // Starts a run; false where the host refuses it.
    { Pass::enter(context) } -> std::same_as<bool>;

    // Ends a run that was not cut off.
    { Pass::leave(context) };

    // What the entry of the pass returns after a run, of which nothing is said where the host refused it.
    { Pass::resultOf(std::optional<Outcome>{}) } -> std::same_as<typename Pass::Result>;

    // Gives control to the owner of the next layer, and says how the run goes on.
    { Pass::transfer(context) } -> std::same_as<Outcome>;

    // Whether `output` takes the value of a field.
    { Pass::template takesValue<someField> } -> std::convertible_to<bool>;

    // Does with a field that was read what the pass is for. The field lies at bit `start` of `data`. The
    // value is not scaled.
    { Pass::template output<someField>(someReader, data, start, value) } -> std::same_as<void>;
};
// clang-format on

} // namespace netfloor::plugin
