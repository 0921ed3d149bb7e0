// SPDX-License-Identifier: MIT
#include "netfloor-capture/shards.h"

#include <utility>

#include "netfloor-capture/errors.h"
#include "records.h"

namespace netfloor {

namespace {

// The sections whose interfaces the shards need, each with those that are known by now.
void addSection(std::vector<SectionBlocks> &sections, SectionBlocks section) {
    if (!sections.empty() && sections.back().begin == section.begin) {
        sections.back() = std::move(section);
    } else {
        sections.push_back(std::move(section));
    }
}

} // namespace

CapturePlan planShards(const std::string &path, std::uint64_t shardOctets) {
    OctetStream stream(path);
    if (stream.file().isLive()) {
        throw CaptureError(stream.file().name() + " can be read once only, and so cannot be planned. Name a file.");
    }
    CapturePlan plan;
    plan.path = path;
    plan.file = fileState(stream);
    plan.isPacked = stream.isPacked();
    const auto reader = readRecords(stream);
    CapturedPacket packet;
    TimeStart time;
    Shard shard;
    ReadingPlace cut; // after the packet before, where one is due
    bool isCutDue = false;
    try {
        while (reader->next(packet)) {
            if (isCutDue) {
                shard.end = cut.position;
                plan.shards.push_back(shard);
                shard = {};
                shard.begin = cut;
                shard.timeStart = time;
            }
            time.see(packet);
            if (shard.packets++ == 0) {
                shard.firstTime = packet.time;
            }
            isCutDue = !plan.isPacked && stream.position() / shardOctets > shard.begin.position / shardOctets;
            if (isCutDue) {
                cut = reader->place();
                addSection(plan.sections, reader->section());
            }
        }
    } catch (const CaptureDamage &damage) {
        plan.damage = damage.what();
    }
    plan.shards.push_back(shard);
    return plan;
}

} // namespace netfloor
