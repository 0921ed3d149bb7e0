// SPDX-License-Identifier: MIT
// Blocks: named parts of the grammar. A block is open as long as its object lives.
#pragma once

#include <cstdint>

#include "frame/reader.h"

namespace netfloor::plugin {

// A block.
template <class Pass>
class [[nodiscard]] Block {
public:
    NETFLOOR_INLINE Block(Reader<Pass> &reader, BlockName name) : reader_(reader), outer_(reader.block) {
        reader_.block = name;
        if (!reader_.ended()) {
            reader_.openBlock();
        }
    }

    NETFLOOR_INLINE ~Block() {
        reader_.block = outer_;
        if (!reader_.ended()) {
            reader_.closeBlock();
        }
    }

    Block(const Block &) = delete;
    Block &operator=(const Block &) = delete;

private:
    Reader<Pass> &reader_;
    BlockName outer_;
};

// A block with a length of its own: it narrows the limit, has its own live flag, and skips at its end what
// nothing has read. The live flag of the enclosing production comes back at the end, so that what is cut
// short inside the block does not stop what stands around it.
template <class Pass>
class [[nodiscard]] LimitedBlock {
public:
    // Opens the block; `limit` must follow, once the length is known.
    NETFLOOR_INLINE LimitedBlock(Reader<Pass> &reader, BlockName name)
        : reader_(reader), outer_(reader.block), outerLive_(reader.live) {
        reader_.block = name;
        if (!reader_.ended() && reader_.openBlock()) {
            reader_.live = true;
        }
    }

    // Opens the block with a length in bits.
    NETFLOOR_INLINE LimitedBlock(Reader<Pass> &reader, BlockName name, std::uint32_t bitCount)
        : LimitedBlock(reader, name) {
        limit(bitCount);
    }

    // Sets the limit. A length that reaches past the bits left does not narrow anything: the block is read
    // as far as bits last, and the enclosing production reads no further.
    NETFLOOR_INLINE void limit(std::uint32_t bitCount) {
        if (!reader_.ended() && !reader_.openLimit(bitCount)) {
            outerLive_ = false;
        }
    }

    NETFLOOR_INLINE ~LimitedBlock() {
        reader_.block = outer_;
        if (reader_.ended()) {
            return;
        }
        reader_.skipRest();
        reader_.closeBlock();
        reader_.closeLimit();
        reader_.live = outerLive_;
    }

    LimitedBlock(const LimitedBlock &) = delete;
    LimitedBlock &operator=(const LimitedBlock &) = delete;

private:
    Reader<Pass> &reader_;
    BlockName outer_;
    bool outerLive_;
};

// The blocks of a chain, in which each link stands inside the one before: they stay open until the chain is
// through. A chain is a loop, so that the native stack does not grow with the packet; closing all blocks at
// its end leaves the same as if each link had been a call.
template <class Pass>
class [[nodiscard]] BlockChain {
public:
    NETFLOOR_INLINE explicit BlockChain(Reader<Pass> &reader)
        : reader_(reader), outer_(reader.block), outerRoom_(reader.writer.blockRoom()) {}

    // Opens the next block, inside the others.
    NETFLOOR_INLINE void open(BlockName name) {
        reader_.block = name;
        if (!reader_.ended() && reader_.openBlock()) {
            ++blocks_;
        }
    }

    // Opens the next block with a length in bits, as a LimitedBlock does. Nothing is read after a chain with
    // such a block, so that no outer live flag is kept.
    NETFLOOR_INLINE void openLimited(BlockName name, std::uint32_t bitCount) {
        open(name);
        if (!reader_.ended()) {
            reader_.live = true;
            reader_.openLimit(bitCount);
            ++limits_;
        }
    }

    // Closing a block touches neither cursor nor limit, so that it does not matter which blocks a limit stands
    // between: what the limits leave is skipped first, the innermost limit first.
    NETFLOOR_INLINE ~BlockChain() {
        for (; limits_ > 0 && !reader_.ended(); --limits_) {
            reader_.skipRest();
            reader_.closeLimit();
        }
        if (!reader_.ended()) {
            reader_.closeBlocks(blocks_, outerRoom_);
        }
        reader_.block = outer_;
    }

    BlockChain(const BlockChain &) = delete;
    BlockChain &operator=(const BlockChain &) = delete;

private:
    Reader<Pass> &reader_;
    BlockName outer_;
    std::uint32_t outerRoom_;
    std::uint32_t blocks_ = 0;
    std::uint32_t limits_ = 0;
};

// Runs a production out of line, on a reader of its own: the caller's is not touched by the call, and so both
// can stay in registers. What it calls by itself is inlined, so that its reader has no address. A reader that is not
// live runs nothing, so that a production which is always run so need not ask.
template <auto production, class Pass>
[[gnu::noinline, gnu::flatten]] void outOfLineBody(typename Pass::Context &context, Position &position) {
    Reader<Pass> reader(context, position);
    reader.live = true; // runOutOfLine has asked; the run of a live reader has not ended
    reader.outcome = Outcome::running;
    production(reader);
    position = reader.position();
}

template <auto production, class Pass>
NETFLOOR_INLINE inline void runOutOfLine(Reader<Pass> &reader) {
    if (!reader.live) {
        return;
    }
    reader.writer.flushRun(*reader.state);
    Position position = reader.position();
    outOfLineBody<production, Pass>(*reader.context, position);
    reader.resumeAt(position);
}

// Runs a production in line or out of line.
template <bool inLine, auto production, class Pass>
NETFLOOR_INLINE inline void runInLineIf(Reader<Pass> &reader) {
    if constexpr (inLine) {
        production(reader);
    } else {
        runOutOfLine<production>(reader);
    }
}

} // namespace netfloor::plugin
