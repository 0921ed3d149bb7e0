// SPDX-License-Identifier: MIT
#include "jobs.h"

#include <utility>

#include <oneapi/tbb/global_control.h>
#include <oneapi/tbb/info.h>
#include <oneapi/tbb/parallel_pipeline.h>
#include <oneapi/tbb/task_arena.h>

#include "interrupt.h"

namespace netfloor::cli {

namespace {

// The blocks that go through the threads. Each comes back when it has been written.
class Blocks {
public:
    [[nodiscard]] DecodedBlock *take() {
        const std::scoped_lock lock(mutex_);
        if (free_.empty()) {
            return all_.emplace_back(std::make_unique<DecodedBlock>()).get();
        }
        DecodedBlock *const block = free_.back();
        free_.pop_back();
        return block;
    }
    void giveBack(DecodedBlock *block) {
        const std::scoped_lock lock(mutex_);
        free_.push_back(block);
    }

private:
    std::mutex mutex_;
    std::vector<std::unique_ptr<DecodedBlock>> all_;
    std::vector<DecodedBlock *> free_;
};

} // namespace

bool DecodedBlock::fill(PacketSource &source) {
    packets.clear();
    CapturedPacket packet;
    while (!packets.isFull() && source.next(packet, packets.isEmpty())) {
        packets.add(packet);
    }
    timeStart = source.timeStart();
    return !packets.isEmpty();
}

struct Jobs::Worker {
    Worker(const Options &options, bool hasColour, PluginLibrary library)
        : out(hasColour, false), decoder(options, std::move(library), out) {
        out.keepAll();
    }

    Output out;
    PacketDecoder decoder;
};

Jobs::Jobs(const Options &options, bool hasColour, PluginLibrary library)
    : options_(options), hasColour_(hasColour), library_(std::move(library)) {}

Jobs::~Jobs() = default;

std::unique_ptr<Jobs::Worker> Jobs::takeWorker() {
    std::unique_lock lock(mutex_);
    if (!free_.empty()) {
        auto worker = std::move(free_.back());
        free_.pop_back();
        return worker;
    }
    if (std::exchange(isLibraryFree_, false)) {
        return std::make_unique<Worker>(options_, hasColour_, library_);
    }
    lock.unlock(); // it takes a while
    return std::make_unique<Worker>(options_, hasColour_, PluginLibrary::openCopy(library_.path()));
}

void Jobs::decodeBlock(DecodedBlock &block, std::string_view file) {
    std::unique_ptr<Worker> worker = takeWorker();
    block.kinds.clear();
    for (const CapturedPacket &packet : block.packets.packets()) {
        block.kinds.push_back(worker->decoder.decode(packet, block.timeStart, file));
    }
    worker->out.exchange(block.text);
    const std::scoped_lock lock(mutex_);
    free_.push_back(std::move(worker));
}

void Jobs::decode(DecodedBlock &first, PacketSource &source, std::string_view file,
                  const std::function<void(const DecodedBlock &)> &write) {
    namespace tbb = oneapi::tbb;
    const unsigned jobs = jobCount(options_);
    const std::size_t blocksAtOnce = 2 * std::size_t{jobs};
    Blocks blocks;
    bool isFirst = true;
    const auto read = [&](tbb::flow_control &flow) -> DecodedBlock * {
        if (std::exchange(isFirst, false)) {
            return &first;
        }
        readsInThisThread();
        DecodedBlock *const block = blocks.take();
        if (!block->fill(source)) {
            flow.stop();
        }
        return block;
    };
    const auto decodeOne = [&](DecodedBlock *block) {
        decodeBlock(*block, file);
        return block;
    };
    const auto writeOne = [&](DecodedBlock *block) {
        write(*block);
        constexpr std::size_t mostRoom = std::size_t{4} * 1024 * 1024; // that is worth to be kept
        if (block->text.room.size() > mostRoom) {
            block->text = {};
        }
        if (block != &first) {
            blocks.giveBack(block);
        }
    };
    const tbb::global_control threads(tbb::global_control::max_allowed_parallelism, jobs);
    tbb::task_arena arena(static_cast<int>(jobs));
    arena.execute([&] {
        tbb::parallel_pipeline(
            blocksAtOnce, tbb::make_filter<void, DecodedBlock *>(tbb::filter_mode::serial_in_order, read) &
                              tbb::make_filter<DecodedBlock *, DecodedBlock *>(tbb::filter_mode::parallel, decodeOne) &
                              tbb::make_filter<DecodedBlock *, void>(tbb::filter_mode::serial_in_order, writeOne));
    });
}

void Jobs::giveCounts(Printer &printer) {
    for (const auto &worker : free_) {
        printer.takeCounts(worker->decoder.printer());
    }
}

unsigned jobCount(const Options &options) {
    // Where the reading ends is known in order alone, and a page names labels in the order in which they come.
    if (options.count || options.command == Command::html) {
        return 1;
    }
    return options.jobs.value_or(
        options.usesAllCores() ? static_cast<unsigned>(oneapi::tbb::info::default_concurrency()) : 1U);
}

} // namespace netfloor::cli
