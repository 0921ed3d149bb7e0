// SPDX-License-Identifier: MIT
// Plans as JSON (RFC 8259).
#include <fstream>
#include <optional>
#include <string>

#include <nlohmann/json.hpp>

#include "exit_code.h"
#include "plan.h"
#include "text.h"

namespace netfloor::cli {

namespace {

using Json = nlohmann::ordered_json;

constexpr unsigned planVersion = 1;

std::string hexOf(const std::string &octets) {
    std::string text;
    for (const char character : octets) {
        const auto octet = static_cast<unsigned char>(character);
        text += {hexDigits[octet >> 4U], hexDigits[octet & 0xfU]};
    }
    return text;
}

std::string octetsOf(const std::string &hex) {
    std::string octets;
    for (std::size_t i = 0; i + 1 < hex.size(); i += 2) {
        octets += static_cast<char>(hexDigits.find(hex[i]) << 4U | hexDigits.find(hex[i + 1]));
    }
    return octets;
}

Json jsonOf(const std::optional<CaptureTime> &time) {
    return time ? Json{{"seconds", time->seconds}, {"nanoseconds", time->nanoseconds}} : Json();
}

std::optional<CaptureTime> timeOf(const Json &json) {
    if (json.is_null()) {
        return std::nullopt;
    }
    return CaptureTime{json.at("seconds").get<std::int64_t>(), json.at("nanoseconds").get<std::uint32_t>()};
}

Json jsonOf(const CapturePlan &plan) {
    Json sections = Json::array();
    for (const SectionBlocks &section : plan.sections) {
        sections.push_back({{"begin", section.begin}, {"interfaces", section.interfaces}});
    }
    return {{"file", plan.path},
            {"octets", plan.file.octets},
            {"modified_ns", plan.file.modified},
            {"start", hexOf(plan.file.start)},
            {"packed", plan.isPacked},
            {"damage", plan.damage.empty() ? Json() : Json(plan.damage)},
            {"sections", std::move(sections)}};
}

CapturePlan captureOf(const Json &json) {
    CapturePlan plan;
    plan.path = json.at("file").get<std::string>();
    plan.file = {json.at("octets").get<std::uint64_t>(), json.at("modified_ns").get<std::int64_t>(),
                 octetsOf(json.at("start").get<std::string>())};
    plan.isPacked = json.at("packed").get<bool>();
    plan.damage = json.at("damage").is_null() ? "" : json.at("damage").get<std::string>();
    for (const Json &section : json.at("sections")) {
        plan.sections.push_back(
            {section.at("begin").get<std::uint64_t>(), section.at("interfaces").get<std::vector<std::uint64_t>>()});
    }
    return plan;
}

Json jsonOf(const Shard &shard, std::size_t number, std::size_t capture) {
    return {{"shard", number},
            {"capture", capture},
            {"begin", shard.begin.position},
            {"end", shard.end ? Json(*shard.end) : Json()},
            {"first_packet", shard.begin.packets + 1},
            {"packets", shard.packets},
            {"first_time", jsonOf(shard.firstTime)},
            {"time_start", jsonOf(shard.timeStart.time)},
            {"time_digits", shard.timeStart.digits},
            {"section", shard.begin.section},
            {"interfaces", shard.begin.interfaces}};
}

Shard shardOf(const Json &json) {
    Shard shard;
    shard.begin = {json.at("begin").get<std::uint64_t>(), json.at("first_packet").get<std::uint64_t>() - 1,
                   json.at("section").get<std::uint64_t>(), json.at("interfaces").get<std::uint64_t>()};
    if (!json.at("end").is_null()) {
        shard.end = json.at("end").get<std::uint64_t>();
    }
    shard.packets = json.at("packets").get<std::uint64_t>();
    shard.firstTime = timeOf(json.at("first_time"));
    shard.timeStart = {timeOf(json.at("time_start")), json.at("time_digits").get<unsigned>()};
    return shard;
}

std::string lines(const std::vector<Json> &rows) {
    std::string text;
    for (const Json &row : rows) {
        text += (text.empty() ? "    " : ",\n    ") + row.dump();
    }
    return text;
}

} // namespace

std::string planText(const std::vector<CapturePlan> &captures) {
    std::vector<Json> captureRows;
    std::vector<Json> shardRows;
    for (const CapturePlan &plan : captures) {
        for (const Shard &shard : plan.shards) {
            shardRows.push_back(jsonOf(shard, shardRows.size() + 1, captureRows.size()));
        }
        captureRows.push_back(jsonOf(plan));
    }
    try {
        return "{\n  \"plan_version\": " + std::to_string(planVersion) + ",\n  \"captures\": [\n" + lines(captureRows) +
               "\n  ],\n  \"shards\": [\n" + lines(shardRows) + "\n  ]\n}\n";
    } catch (const Json::type_error &) {
        throw UsageError("A plan is JSON, and the name of a file is no UTF-8. Name it otherwise.");
    }
}

std::vector<CapturePlan> readPlan(const std::string &name) {
    std::ifstream file(name, std::ios::binary);
    if (!file) {
        throw UsageError(name + " cannot be read. Make a plan: netfloor plan --shards 8 FILE > " + name);
    }
    try {
        const Json json = Json::parse(file);
        if (json.at("plan_version") != planVersion) {
            throw UsageError(name + " is a plan of another version. Plan the captures again.");
        }
        std::vector<CapturePlan> captures;
        for (const Json &capture : json.at("captures")) {
            captures.push_back(captureOf(capture));
        }
        for (const Json &shard : json.at("shards")) {
            captures.at(shard.at("capture").get<std::size_t>()).shards.push_back(shardOf(shard));
        }
        return captures;
    } catch (const Json::exception &error) {
        throw UsageError(name + " is no plan: " + error.what() + ".");
    } catch (const std::out_of_range &) {
        throw UsageError(name + " is no plan: a shard is of no capture.");
    }
}

} // namespace netfloor::cli
