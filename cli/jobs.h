// SPDX-License-Identifier: MIT
// Decodes the packets of a capture in several threads. What is read and what is written stays in the order of the
// capture, and what is in memory is bounded by the number of threads.
#pragma once

#include <functional>
#include <memory>
#include <mutex>
#include <optional>
#include <span>
#include <string>
#include <vector>

#include "netfloor-capture/packet_block.h"
#include "packet_decoder.h"
#include "packet_source.h"

namespace netfloor::cli {

// A part of a capture, and what is printed of it.
struct DecodedBlock {
    PacketBlock packets;
    TimeStart timeStart;
    std::vector<std::optional<NotIp>> kinds; // of each packet, none for one that is not shown
    Output::Text text;

    // Takes the next packets; false if there are none. A block that is not full is the last one, or others have not
    // come yet.
    [[nodiscard]] bool fill(PacketSource &source);
};

class Jobs {
public:
    // Uses `library` in one of the threads as long as it decodes, and copies of it in the others.
    Jobs(const Options &options, bool hasColour, PluginLibrary library);
    ~Jobs();

    // Decodes the block, and what follows it in the source. `write` gets the blocks in their order, one at a time, in
    // any thread. The first exception ends all and is thrown on.
    void decode(DecodedBlock &first, PacketSource &source, std::string_view file,
                const std::function<void(const DecodedBlock &)> &write);

    // Adds to the printer what the packets have counted so far.
    void giveCounts(Printer &printer);

private:
    struct Worker;

    void decodeBlock(DecodedBlock &block, std::string_view file);
    [[nodiscard]] std::unique_ptr<Worker> takeWorker();

    const Options &options_;
    bool hasColour_;
    PluginLibrary library_;
    bool isLibraryFree_ = true; // no worker has it
    std::mutex mutex_;
    std::vector<std::unique_ptr<Worker>> free_;
};

// The number of threads that the options ask for.
[[nodiscard]] unsigned jobCount(const Options &options);

} // namespace netfloor::cli
