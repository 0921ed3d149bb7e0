// SPDX-License-Identifier: MIT
// Shards of a capture. They are pickled, so that other processes and machines can read them.
#include "shards.h"

#include <algorithm>
#include <new>
#include <string>
#include <tuple>
#include <utility>
#include <vector>

#include <nanobind/stl/optional.h>
#include <nanobind/stl/pair.h>
#include <nanobind/stl/string.h>
#include <nanobind/stl/tuple.h>
#include <nanobind/stl/vector.h>

#include "module.h"

namespace nb = nanobind;

namespace netfloor::python {
namespace {

using FileTuple = std::tuple<std::string, std::uint64_t, std::int64_t, nb::bytes, bool, std::string>;
using SectionTuple = std::pair<std::uint64_t, std::vector<std::uint64_t>>;
using TimeTuple = std::pair<std::int64_t, std::uint32_t>;
using ShardTuple = std::tuple<std::uint64_t, std::uint64_t, std::uint64_t, std::uint64_t, std::optional<std::uint64_t>,
                              std::uint64_t, std::optional<TimeTuple>>;
using State = std::tuple<FileTuple, std::vector<SectionTuple>, ShardTuple>;

State getState(const PlannedShard &planned) {
    const CapturePlan &plan = planned.plan;
    const Shard &shard = plan.shards.front();
    std::vector<SectionTuple> sections;
    for (const SectionBlocks &section : plan.sections) {
        sections.emplace_back(section.begin, section.interfaces);
    }
    std::optional<TimeTuple> time;
    if (shard.firstTime) {
        time.emplace(shard.firstTime->seconds, shard.firstTime->nanoseconds);
    }
    return {{plan.path, plan.file.octets, plan.file.modified, nb::bytes(plan.file.start.data(), plan.file.start.size()),
             plan.isPacked, plan.damage},
            std::move(sections),
            {shard.begin.position, shard.begin.packets, shard.begin.section, shard.begin.interfaces, shard.end,
             shard.packets, time}};
}

void setState(PlannedShard &planned, const State &state) {
    const auto &[file, sections, part] = state;
    CapturePlan plan;
    nb::bytes start;
    std::tie(plan.path, plan.file.octets, plan.file.modified, start, plan.isPacked, plan.damage) = file;
    plan.file.start.assign(start.c_str(), start.size());
    for (const auto &[begin, interfaces] : sections) {
        plan.sections.push_back({begin, interfaces});
    }
    Shard shard;
    std::optional<TimeTuple> time;
    std::tie(shard.begin.position, shard.begin.packets, shard.begin.section, shard.begin.interfaces, shard.end,
             shard.packets, time) = part;
    if (time) {
        shard.firstTime = {time->first, time->second};
    }
    plan.shards.push_back(shard);
    new (&planned) PlannedShard{std::move(plan)};
}

std::vector<PlannedShard> planOf(const std::string &path, std::uint64_t shardOctets) {
    CapturePlan plan = planShards(path, shardOctets);
    const std::vector<Shard> shards = std::exchange(plan.shards, {});
    std::vector<PlannedShard> planned;
    for (const Shard &shard : shards) {
        planned.push_back({plan});
        planned.back().plan.shards = {shard};
    }
    return planned;
}

const Shard &shardOf(const PlannedShard &planned) {
    return planned.plan.shards.front();
}

// Where the blocks begin that a reader of the shard needs before it.
std::vector<std::uint64_t> blocksBefore(const PlannedShard &planned) {
    const ReadingPlace &begin = shardOf(planned).begin;
    const auto &sections = planned.plan.sections;
    const auto section = std::ranges::find(sections, begin.section, &SectionBlocks::begin);
    if (section == sections.end()) {
        return {};
    }
    const std::size_t known = std::min<std::uint64_t>(begin.interfaces, section->interfaces.size());
    std::vector<std::uint64_t> blocks = {section->begin};
    blocks.insert(blocks.end(), section->interfaces.begin(),
                  section->interfaces.begin() + static_cast<std::ptrdiff_t>(known));
    return blocks;
}

std::optional<std::int64_t> firstTime(const PlannedShard &planned) {
    const auto &time = shardOf(planned).firstTime;
    return time ? time->inNanoseconds() : std::nullopt;
}

} // namespace

void addShards(nb::module_ &module) {
    nb::class_<PlannedShard>(module, "Shard")
        .def("__getstate__", &getState)
        .def("__setstate__", &setState)
        .def_prop_ro("path", [](const PlannedShard &planned) { return planned.plan.path; })
        .def_prop_ro("begin", [](const PlannedShard &planned) { return shardOf(planned).begin.position; })
        .def_prop_ro("end", [](const PlannedShard &planned) { return shardOf(planned).end; })
        .def_prop_ro("first_packet", [](const PlannedShard &planned) { return shardOf(planned).begin.packets + 1; })
        .def_prop_ro("packets", [](const PlannedShard &planned) { return shardOf(planned).packets; })
        .def_prop_ro("first_time_ns", &firstTime)
        .def_prop_ro("file_octets", [](const PlannedShard &planned) { return planned.plan.file.octets; })
        .def_prop_ro("file_modified_ns", [](const PlannedShard &planned) { return planned.plan.file.modified; })
        .def_prop_ro("is_packed", [](const PlannedShard &planned) { return planned.plan.isPacked; })
        .def_prop_ro("blocks_before", &blocksBefore);
    module.def("plan", &planOf, nb::arg("path"), nb::arg("shard_octets"));
}

} // namespace netfloor::python
