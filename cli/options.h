// SPDX-License-Identifier: MIT
// The command line.
#pragma once

#include <algorithm>
#include <cstdint>
#include <filesystem>
#include <optional>
#include <string>
#include <variant>
#include <vector>

#include "exit_code.h"

namespace netfloor::cli {

enum class Command : std::uint8_t { summary, detail, verify, keys, json, exporting, html, plan, fields };

enum class FieldsForm : std::uint8_t { text, json, markdown, tables };

enum class Colour : std::uint8_t { automatic, always, never };

// Packets by their numbers, as "3-7,9".
struct PacketNumbers {
    struct Range {
        std::uint64_t first = 0;
        std::uint64_t last = 0;
    };
    std::string text; // empty: all packets
    std::vector<Range> ranges;
    std::uint64_t last = 0;

    [[nodiscard]] bool areAll() const { return ranges.empty(); }
    [[nodiscard]] bool hold(std::uint64_t number) const {
        return areAll() || std::ranges::any_of(ranges, [number](const Range &range) {
                   return number >= range.first && number <= range.last;
               });
    }
};

struct Options {
    Command command = Command::summary;
    std::vector<std::string> files; // at least one, but for a shard
    std::filesystem::path plugin;   // empty: where the command is installed
    std::string filter;
    std::filesystem::path write;        // the packets that pass, into this file
    std::string where;                  // a condition on the layers
    std::optional<std::uint64_t> count; // packets to show at most
    PacketNumbers packets;              // to show
    std::optional<unsigned> jobs;       // threads that decode
    std::uint64_t shards = 0;           // plan: at most, or 0 and
    std::uint64_t shardSize = 0;        // plan: octets
    std::string shard;                  // of a plan, in the place of files: "PLAN.json:3"
    bool totals = true;                 // summary, detail
    Colour colour = Colour::automatic;
    bool utc = false;                 // times of day instead of seconds since the first packet
    bool all = false;                 // summary, detail: nothing left out
    bool bits = false;                // detail: bit ranges
    bool bad = false;                 // verify: damaged packets only
    bool raw = false;                 // keys: addresses as octets
    bool perChunk = false;            // keys: a row for each SCTP chunk instead of each IP layer
    bool withFields = false;          // json: with every field
    bool schema = false;              // json: the schema of its objects, without a capture
    std::uint64_t limit = 10'000;     // html: packets of the page at most; it says that there are more
    std::filesystem::path to;         // export: the database
    bool append = false;              // export: to a database that is there
    std::vector<std::string> columns; // keys: these fields in the place of the usual ones
    std::string field;                // fields: those of this name, or of this id; empty: all
    FieldsForm form = FieldsForm::text;

    // Without --jobs: for rows and totals all cores, for what people look at one.
    [[nodiscard]] bool usesAllCores() const {
        return command == Command::keys || command == Command::json || command == Command::exporting ||
               command == Command::verify;
    }
};

// The options, or the code to end with when the command line has been answered: --help, or a mistake.
[[nodiscard]] std::variant<Options, ExitCode> parseOptions(int argumentCount, char **arguments);

} // namespace netfloor::cli
