// SPDX-License-Identifier: MIT
#include "checks.h"

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <functional>
#include <iterator>
#include <span>
#include <string_view>
#include <utility>
#include <vector>

namespace netfloor::compare {
namespace {

constexpr std::uint32_t flagsOfMvAlone =
    NETFLOOR_FLAG_EXPECTATION | NETFLOOR_FLAG_LIMIT_TOO_LONG | NETFLOOR_FLAG_BITS_LEFT_OVER;

// What a host saw at one of its calls.
struct Seen {
    enum class Event : std::uint8_t { output, layerInfo, growth, handOff, result };
    Event event;
    std::uint32_t flags, cursor, bitsLeft, fieldId, rangeCount;
    std::uint64_t stacks, record, layers; // digests
    bool operator==(const Seen &) const = default;
};

void print(const char *title, const std::vector<Seen> &seen, std::size_t at) {
    if (at >= seen.size()) {
        std::fprintf(stderr, "%s: nothing\n", title);
        return;
    }
    const Seen &one = seen[at];
    std::fprintf(
        stderr,
        "%s: event %d, flags %x, cursor %u, left %u, field %u, ranges %u, stacks %llx, record %llx, layers %llx\n",
        title, static_cast<int>(one.event), one.flags, one.cursor, one.bitsLeft, one.fieldId, one.rangeCount,
        static_cast<unsigned long long>(one.stacks), static_cast<unsigned long long>(one.record),
        static_cast<unsigned long long>(one.layers));
}

Seen::Event eventOf(std::string_view name) {
    return name.starts_with("hs_Add")        ? Seen::Event::output
           : name == "hs_CreateNewLayerInfo" ? Seen::Event::layerInfo
           : name == "hs_Realloc"            ? Seen::Event::growth
           : name == "result"                ? Seen::Event::result
                                             : Seen::Event::handOff;
}

// A number that follows from the octets, on top of the one before.
std::uint64_t digest(std::uint64_t before, const void *from, std::size_t octets) {
    return before * 31 + std::hash<std::string_view>()({static_cast<const char *>(from), octets});
}

std::span<const std::uint32_t> elementsOf(const BitStack &stack) {
    const auto depth = static_cast<std::uint32_t>(stack.top - stack.base);
    return {stack.base, std::min(depth + 1, stack.capacity)};
}

// One pass, and whether all was in order while it ran.
class CheckedRun {
public:
    CheckedRun(const Plugin &plugin, Pass pass, const Input &input) : input_(input), pass_(pass) {
        seen_.reserve(256); // allocations are slow under a sanitizer
        static Trace none(Trace::Keeps::nothing);
        const bool ended = run(plugin, pass, input, none, [this](const Moment &moment) { look(moment); });
        require(ended, "the pass does not end, or wrote outside its storage");
    }

    // The host's calls and the results.
    [[nodiscard]] const std::vector<Seen> &seen() const { return seen_; }

    // The same without what only MD and TO call.
    [[nodiscard]] std::vector<Seen> seenByAll() const {
        std::vector<Seen> kept;
        std::ranges::copy_if(seen_, std::back_inserter(kept), [](const Seen &one) {
            return one.event != Seen::Event::output && one.event != Seen::Event::layerInfo;
        });
        return kept;
    }

    [[nodiscard]] bool ranToItsEnd() const { return ranToItsEnd_; }
    [[nodiscard]] std::uint32_t flags() const { return seen_.empty() ? 0 : seen_.back().flags; }

    void require(bool holds, const char *what) const {
        if (!holds) {
            std::fprintf(stderr, "FAULT: %s; pass %d, call %zu, refused growth %u, seed %llu, cursor %u\npacket: %s\n",
                         what, static_cast<int>(pass_), seen_.size(), input_.plan.refusedGrowth,
                         static_cast<unsigned long long>(input_.plan.seed), input_.plan.cursor,
                         test::hexText(input_.packet).c_str());
            std::abort();
        }
    }

    // That this pass saw what another one did.
    void requireSame(const std::vector<Seen> &other, const std::vector<Seen> &own, const char *what) const {
        if (other != own) {
            const auto at = static_cast<std::size_t>(std::ranges::mismatch(other, own).in1 - other.begin());
            print("other", other, at);
            print("this", own, at);
            require(false, what);
        }
    }

private:
    void look(const Moment &moment) {
        const DecodeState &state = moment.state;
        seen_.push_back({eventOf(moment.event), state.flags, state.cursor, state.bitsLeft, state.fieldRecord.fieldId,
                         state.fieldRecord.rangeCount, stacksOf(state), recordOf(state.fieldRecord), layersOf(state)});
        // One more while room is made for it, and where there was none.
        const bool oneMore = seen_.back().event == Seen::Event::growth || (state.flags & NETFLOOR_FLAG_NO_STACK) != 0;
        for (const BitStack &stack : {state.blockStarts, state.limits}) {
            const auto depth = static_cast<std::uint64_t>(stack.top - stack.base);
            require(depth < std::uint64_t{stack.capacity} + (oneMore ? 1 : 0), "a stack is left");
        }
        checkRecord(state.fieldRecord);
        require(strnlen(state.blockName, 64) < 64, "the block name has no end");
        if (!input_.plan.oddOwners) {
            checkOrder(state);
        }
        if (seen_.back().event == Seen::Event::result) {
            ranToItsEnd_ = moment.result == 1;
            checkEnd(moment);
            nestedWasCutOff_ = nestedWasCutOff_ || moment.result == 0;
        }
    }

    static std::uint64_t stacksOf(const DecodeState &state) {
        std::uint64_t stacks = digest(0, state.blockName, strnlen(state.blockName, 64));
        for (const BitStack &stack : {state.blockStarts, state.limits}) {
            const std::span<const std::uint32_t> elements = elementsOf(stack);
            stacks = digest(stacks, elements.data(), elements.size_bytes());
        }
        return stacks;
    }

    // An owner that changes the count of elements shows old ones, which passes need not leave alike.
    [[nodiscard]] std::uint64_t recordOf(const FieldRecord &record) const {
        const std::uint32_t elements = std::min(record.rangeCount, record.rangeCapacity);
        const std::uint64_t name = digest(0, record.fieldName, strnlen(record.fieldName, 255));
        const std::uint64_t ranges =
            digest(name, record.ranges, input_.plan.oddOwners ? 0 : elements * sizeof(BitRange));
        return ranges ^ (std::uint64_t{record.value} << 32 | record.outputRangeCount);
    }

    static std::uint64_t layersOf(const DecodeState &state) {
        const std::uint64_t frames = std::min(state.layerIndex + std::uint64_t{1}, std::uint64_t{state.layerCapacity});
        return digest(digest(0, state.scratch, sizeof state.scratch), state.layerFrames, frames * sizeof(LayerFrame));
    }

    void checkRecord(const FieldRecord &record) const {
        require(record.rangeCount <= record.rangeCapacity, "more elements than there is room for");
        require(seen_.back().event != Seen::Event::output || strnlen(record.fieldName, 255) < 255,
                "the field name has no end");
    }

    // With owners that leave the cursor anywhere, these need not hold.
    void checkOrder(const DecodeState &state) const {
        require(std::ranges::is_sorted(elementsOf(state.limits), std::greater<>()),
                "a limit reaches past the one around it");
        require(std::ranges::is_sorted(elementsOf(state.blockStarts)), "a block starts before the one around it");
        require(state.cursor >= input_.plan.cursor, "the cursor went back before the start");
        // Signed: an address is shown ahead of the test of its limit, and goes below 0 where it does not fit.
        require(std::int64_t{state.cursor} + static_cast<std::int32_t>(state.bitsLeft) <=
                    std::int64_t{state.totalBits} + 1,
                "the bits left reach past the packet");
        const FieldRecord &record = state.fieldRecord;
        require(std::all_of(record.ranges, record.ranges + (record.wideBits == 0 ? record.rangeCount : 0),
                            [&](const BitRange &range) { return range.lastBit <= state.totalBits; }),
                "an element lies past the packet");
    }

    void checkEnd(const Moment &moment) const {
        const DecodeState &state = moment.state;
        constexpr std::uint32_t missingStorage =
            NETFLOOR_FLAG_NO_LAYER_FRAMES | NETFLOOR_FLAG_NO_STACK | NETFLOOR_FLAG_NO_RANGES;
        // An odd owner does not tell that its own run of the plug-in was cut off, and the flag of that stays.
        require(moment.result == 0 || nestedWasCutOff_ || (state.flags & missingStorage) == 0,
                "a pass goes on without storage");
        if (input_.plan.oddOwners) {
            return;
        }
        const bool addressFits = moment.context != nullptr || input_.plan.byteAreaSize > 16;
        require(moment.result == 1 || !addressFits || (state.flags & missingStorage) != 0,
                "a pass that is cut off does not say why");
        const bool handedOff = moment.context == nullptr && state.layerHandedOff == 1;
        require(moment.result == 0 || handedOff ||
                    (state.blockStarts.top == state.blockStarts.base && state.limits.top == state.limits.base),
                "blocks or limits stay open");
        if (moment.context != nullptr && pass_ == Pass::mv && moment.result == 1) {
            require((moment.context->verdict != 0) == (state.flags != 0), "the verdict does not go with the flags");
        }
        const std::uint8_t mask = input_.plan.sourceMask;
        require(moment.result == 0 || std::ranges::equal(moment.workingCopy, input_.packet,
                                                         [mask](std::uint8_t copy, std::uint8_t octet) {
                                                             return copy == octet || copy == (octet ^ mask);
                                                         }),
                "the working copy is not restored");
    }

    const Input &input_;
    Pass pass_;
    std::vector<Seen> seen_;
    bool ranToItsEnd_ = false;
    bool nestedWasCutOff_ = false;
};

std::vector<Seen> withoutFlags(std::vector<Seen> seen, std::uint32_t flags) {
    for (Seen &one : seen) {
        one.flags &= ~flags;
    }
    return seen;
}

// XTR ends at the first hand-off, where the others call the host.
std::vector<Seen> upToFirstStop(std::vector<Seen> seen) {
    const auto isStop = [](const Seen &one) { return one.event >= Seen::Event::handOff; };
    const auto stop = std::ranges::find_if(seen, isStop);
    if (stop != seen.end()) {
        stop->event = Seen::Event::result;
        seen.erase(stop + 1, seen.end());
    }
    return seen;
}

// The packet with other bits outside of what the host says is there.
Input withOtherBitsOutside(Input input) {
    const Plan &plan = input.plan;
    const auto bits = static_cast<std::uint32_t>(input.packet.size() * 8);
    for (std::uint32_t bit = 0; bit < bits; ++bit) {
        if (bit + 1 < plan.cursor || bit + plan.missingBits >= bits) {
            input.packet[bit / 8] ^= static_cast<std::uint8_t>(1u << bit % 8);
        }
    }
    return input;
}

} // namespace

bool checkPasses(const Plugin &plugin, const Input &input) {
    const CheckedRun md(plugin, Pass::md, input);
    const CheckedRun to(plugin, Pass::to, input);
    const CheckedRun mv(plugin, Pass::mv, input);
    const CheckedRun xtr(plugin, Pass::xtr, input);
    to.requireSame(md.seen(), to.seen(), "TO disagrees with MD");
    mv.requireSame(withoutFlags(md.seenByAll(), flagsOfMvAlone), withoutFlags(mv.seenByAll(), flagsOfMvAlone),
                   "MV disagrees with MD");
    mv.require((md.flags() & ~mv.flags()) == 0, "MV lacks a flag of MD");
    if (input.plan.byteAreaSize > 16) { // else the pass ends at an address
        xtr.requireSame(upToFirstStop(md.seenByAll()), upToFirstStop(xtr.seenByAll()), "XTR disagrees with MD");
    }
    const bool hasBitsOutside = input.plan.cursor != 1 || input.plan.missingBits != 0;
    if (!hasBitsOutside || input.plan.oddOwners) { // which may send the plug-in there
        return md.ranToItsEnd();
    }
    const Input other = withOtherBitsOutside(input);
    for (const auto &[pass, before] :
         {std::pair{Pass::md, &md}, std::pair{Pass::mv, &mv}, std::pair{Pass::xtr, &xtr}}) {
        const CheckedRun again(plugin, pass, other);
        again.requireSame(before->seen(), again.seen(), "bits outside the packet make a difference");
    }
    return md.ranToItsEnd();
}

void setKeyFieldsUp(const Plugin &plugin) {
    Trace none(Trace::Keeps::nothing);
    run(plugin, Pass::xtr, {{0x45}, {}, "first"}, none);
}

} // namespace netfloor::compare
