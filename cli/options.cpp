// SPDX-License-Identifier: MIT
#include "options.h"

#include <algorithm>
#include <array>
#include <charconv>
#include <map>
#include <string_view>

#include <CLI/CLI.hpp>

namespace netfloor::cli {

namespace {

struct CommandName {
    Command command;
    const char *name;
    const char *help;
};

constexpr std::array commandNames = {
    CommandName{Command::summary, "summary", "One line a packet (what 'netfloor FILE' does)"},
    CommandName{Command::detail, "detail", "Every field of each packet, as a tree of layers and blocks"},
    CommandName{Command::verify, "verify", "Two verdicts on each packet, of the plug-in and of checks, and totals"},
    CommandName{Command::keys, "keys", "A row for each IP layer of each packet, as CSV"},
    CommandName{Command::json, "json", "A JSON object for each packet, on a line of its own"},
    CommandName{Command::exporting, "export", "Packets, layers, chunks and causes as tables of a SQLite database"},
    CommandName{Command::html, "html", "A page for a browser: the packets with their fields and octets, in one file"},
    CommandName{Command::plan, "plan", "Cuts captures into shards that several programs can read at once, as JSON"},
    CommandName{Command::fields, "fields", "The fields that the plug-in can report; takes no capture"},
};

constexpr const char *footer = R"(
Exit codes:
  0  all packets were read (also when the reader of the output closed it)
  1  verify: at least one packet is damaged
  2  an option, a filter or a packet number that makes no sense
  3  the file is missing, empty or no capture
  4  the capture is cut or damaged: the whole packets in front were decoded
  5  the plug-in is missing or no plug-in
  6  the output cannot be written
  7  a fault of netfloor itself
  8  memory ran out

Examples:
  netfloor capture.pcap                          what is in it
  netfloor detail --packet 7 --bits capture.pcap one packet, with the bits of each field
  netfloor fields Protocol                       what a field is, and what its values are called
  netfloor verify --filter 'tcp port 80' c.pcapng
  netfloor keys --column ip.source --column tcp.window c.pcap
  netfloor html capture.pcap > page.html         to look into it with a browser
  tcpdump -U -w - | netfloor -)";

constexpr const char *fieldsFooter = R"(
In a display line, %u is the value in decimal, %x in hexadecimal, %c as a character, %-S its name, and %-["%u":"."] a
list of the field's elements with what stands between them.

Bits count from 1 where the field starts, and within an octet from the least significant bit up. A bit picture has the
most significant bit of each octet on the left, as RFCs do. The place of a field is not told where it is shown ahead of
its turn, or is an address in groups.

Examples:
  netfloor fields Protocol        what a field is, and what its values are called
  netfloor fields 384             the same, by its id
  netfloor fields tcp             the fields of TCP)";

constexpr const char *planFooter = R"(
A shard is a range of octets with whole packets. Shards of one plan, decoded in any order and place and joined in the
order of the plan, give what one run with --no-totals gives. The plan names the files as they are named here; a file
that has changed since is refused. No shard is empty, so there may be fewer than asked for.

Example:
  netfloor plan --shards 8 c.pcap > plan.json
  for k in 1 2 3 4 5 6 7 8; do netfloor keys --shard plan.json:$k > $k.csv; done)";

// The word for the command may be left out, which CLI11's own usage line does not say.
class UsageFormatter : public CLI::Formatter {
public:
    std::string make_usage(const CLI::App *app, std::string name) const override {
        if (app->get_parent() != nullptr) {
            return CLI::Formatter::make_usage(app, name);
        }
        return "Usage: netfloor [summary|detail|verify|keys|json|export|html] [OPTIONS] FILE...\n"
               "       netfloor plan --shards N FILE...\n"
               "       netfloor fields [OPTIONS] [NAME|ID]\n"
               "       netfloor detail --help    tells the options of a command\n";
    }
};

void addPluginOption(CLI::App &app, Options &options) {
    app.add_option("--plugin", options.plugin,
                   "The plug-in to decode with (default: the one that belongs to this command)")
        ->type_name("PATH");
}

void addFieldsOptions(CLI::App &app, Options &options) {
    app.add_option_function<std::vector<std::string>>(
           "field",
           [&options](const std::vector<std::string> &words) {
               for (const std::string &word : words) {
                   options.field += (options.field.empty() ? "" : " ") + word;
               }
           },
           "Name or id: the field with its values and bits; part of names, or a protocol: a list (default: all fields)")
        ->type_name("NAME|ID");
    app.footer(fieldsFooter);
    CLI::Option *const json = app.add_flag_callback(
        "--json", [&options] { options.form = FieldsForm::json; }, "As JSON (RFC 8259)");
    app.add_flag_callback(
           "--markdown", [&options] { options.form = FieldsForm::markdown; },
           "As a page of reference, all fields by protocol")
        ->excludes(json)
        ->excludes("field");
    app.add_flag_callback(
           "--tables", [&options] { options.form = FieldsForm::tables; },
           "Instead of fields, the columns of the tables that json and export write, as a page of reference")
        ->excludes(json)
        ->excludes("--markdown")
        ->excludes("field");
    addPluginOption(app, options);
}

// Decimal digits, from `least` on.
CLI::Validator wholeNumber(std::uint64_t least) {
    const auto check = [least](const std::string &word) -> std::string {
        const bool digits = !word.empty() && word.find_first_not_of("0123456789") == std::string::npos;
        const bool isZero = word.find_first_not_of('0') == std::string::npos;
        return digits && !(isZero && least > 0)
                   ? ""
                   : "'" + word + "' is no whole number from " + std::to_string(least) + " on";
    };
    return {check, ""};
}

// "7", "3-7,9".
PacketNumbers packetNumbersOf(const std::string &text) {
    PacketNumbers numbers;
    numbers.text = text;
    const char *at = text.data();
    const char *const end = at + text.size();
    const auto number = [&](std::uint64_t &into) {
        const auto [next, error] = std::from_chars(at, end, into);
        const bool isNumber = error == std::errc() && into != 0;
        at = next;
        return isNumber;
    };
    for (;;) {
        PacketNumbers::Range range;
        bool isSound = number(range.first);
        range.last = range.first;
        if (isSound && at != end && *at == '-') {
            ++at;
            isSound = number(range.last) && range.last >= range.first;
        }
        if (!isSound || (at != end && *at != ',')) {
            throw CLI::ValidationError("--packet", "'" + text + "' is no list of packet numbers, such as 7 or 3-7,9");
        }
        numbers.ranges.push_back(range);
        numbers.last = std::max(numbers.last, range.last);
        if (at == end) {
            return numbers;
        }
        ++at;
    }
}

Colour colourOf(const std::string &word) {
    static const std::map<std::string, Colour> colours = {
        {"auto", Colour::automatic}, {"always", Colour::always}, {"never", Colour::never}};
    const auto found = colours.find(word);
    if (found == colours.end()) {
        throw CLI::ValidationError("--color", "'" + word + "' is none of auto, always and never");
    }
    return found->second;
}

bool isChunk(const std::string &word) {
    if (word != "chunk" && word != "layer") {
        throw CLI::ValidationError("--per", "'" + word + "' is neither layer nor chunk");
    }
    return word == "chunk";
}

void addOptions(CLI::App &app, Options &options) {
    app.add_option("file,-r,--read", options.files,
                   "Capture files (pcap or pcapng, gzip or not), one after the other; '-' for standard input")
        ->type_name("FILE");
    app.add_option("-f,--filter", options.filter, "Only packets that match, in libpcap's language (man pcap-filter)")
        ->type_name("EXPRESSION");
    app.add_option("--write", options.write, "Keep the packets that are shown, unchanged, in this pcapng file")
        ->type_name("OUT");
    app.add_option("--where", options.where,
                   "Only packets with a layer for which this holds: 'sctp.chunk_type == 6 and ip.ttl < 5'")
        ->type_name("CONDITION");
    app.add_option("-c,--count", options.count, "Stop after N packets")->type_name("N")->check(wholeNumber(0));
    app.add_option_function<std::string>(
           "-p,--packet", [&options](const std::string &text) { options.packets = packetNumbersOf(text); },
           "Only these packets of the file: 7, or 3-7,9")
        ->type_name("NUMBERS");
    app.add_option("-j,--jobs", options.jobs,
                   "Decode in N threads (default: keys, json and verify one for each core, the others 1); export, "
                   "html, and with --count, in one")
        ->type_name("N")
        ->check(wholeNumber(1))
        ->check(CLI::Range(1, 1024).description(""));
    app.add_flag("--utc", options.utc, "Date and time of day (UTC) instead of seconds since the first packet");
    addPluginOption(app, options);
    app.add_option_function<std::string>(
           "--color", [&options](const std::string &word) { options.colour = colourOf(word); },
           "auto (default: on a terminal, if NO_COLOR is not set), always, never")
        ->type_name("WHEN");
}

void addShardOption(CLI::App &app, Options &options) {
    app.add_option("--shard", options.shard,
                   "Shard K of a plan in the place of FILE: its packets, without totals and what stands once in front")
        ->type_name("PLAN.json:K");
}

void addTotalsOption(CLI::App &app, Options &options) {
    app.add_flag_callback(
        "--no-totals", [&options] { options.totals = false; }, "Nothing after the last packet, as with --shard");
}

void addPlanOptions(CLI::App &app, Options &options) {
    app.add_option("file", options.files, "Capture files (pcap or pcapng). One that is packed with gzip is one shard")
        ->type_name("FILE");
    CLI::Option *const shards =
        app.add_option("--shards", options.shards, "Shards of all files together, at least one a file")
            ->type_name("N")
            ->check(wholeNumber(1));
    app.add_option("--shard-size", options.shardSize, "Octets of a shard, also as 64M or 1G")
        ->type_name("OCTETS")
        ->transform(CLI::AsSizeValue(false))
        ->check(wholeNumber(1))
        ->excludes(shards);
    app.footer(planFooter);
}

void addOwnOptions(CLI::App &app, Command command, Options &options) {
    switch (command) {
    case Command::summary:
        addShardOption(app, options);
        addTotalsOption(app, options);
        app.add_flag("-a,--all", options.all, "The text of every field, not of the key fields alone");
        break;
    case Command::detail:
        addShardOption(app, options);
        addTotalsOption(app, options);
        app.add_flag("-b,--bits", options.bits, "With the bits of each field; the first bit of the IP header is bit 1");
        app.add_flag("-a,--all", options.all,
                     "All octets of data, a line for each, and the second reading of addresses");
        break;
    case Command::keys:
        addShardOption(app, options);
        app.add_option("--column", options.columns,
                       "This field in the place of the usual ones (may be repeated); a wrong name lists all")
            ->type_name("NAME")
            ->allow_extra_args(false);
        app.add_option_function<std::string>(
               "--per", [&options](const std::string &word) { options.perChunk = isChunk(word); },
               "A row for each IP layer (layer, the default), or for each SCTP chunk (chunk)")
            ->type_name("WHAT");
        app.add_flag("--raw", options.raw, "Addresses as octets, in hexadecimal");
        break;
    case Command::json:
        addShardOption(app, options);
        app.add_flag("--fields", options.withFields, "With every field: id, name, value, text, block and bits");
        app.add_flag("--schema", options.schema, "The JSON schema of these objects; takes no capture");
        break;
    case Command::exporting:
        app.add_option("--to", options.to, "The database, a new file")->type_name("FILE.db")->required();
        app.add_flag("--append", options.append, "Add to the database, if it is there");
        break;
    case Command::verify:
        app.add_flag("--bad", options.bad, "Only damaged packets");
        app.add_flag("-a,--all", options.all, "Also the flags of the plug-in that are by design");
        break;
    case Command::html:
        app.add_option("--limit", options.limit, "Packets of the page at most (default: 10000)")
            ->type_name("N")
            ->check(wholeNumber(1));
        break;
    case Command::plan:
    case Command::fields: break;
    }
}

const CommandName *findCommand(const std::string &word) {
    const auto *const row =
        std::ranges::find_if(commandNames, [&](const CommandName &name) { return word == name.name; });
    return row == commandNames.end() ? nullptr : row;
}

// Options may stand before the command's name. Those of the usual command tell which of them take a value.
std::vector<std::string>::iterator firstNoOption(std::vector<std::string> &words) {
    const auto isOption = [](const std::string &word) { return word.starts_with("-") && word != "-"; };
    auto word = words.begin();
    if (word == words.end() || !isOption(*word)) {
        return word;
    }
    Options unused;
    CLI::App usual;
    addOptions(usual, unused);
    addOwnOptions(usual, commandNames.front().command, unused);
    while (word != words.end() && isOption(*word)) {
        const CLI::Option *const option = usual.get_option_no_throw(*word);
        const bool valueFollows = option != nullptr && option->get_items_expected() > 0;
        word += valueFollows && std::next(word) != words.end() ? 2 : 1;
    }
    return word;
}

// Brings the command's name to the front, and adds the one that 'netfloor FILE' leaves out. Gives whether there was
// one.
bool putCommandFirst(std::vector<std::string> &words) {
    const auto word = firstNoOption(words);
    if (word == words.end() || findCommand(*word) == nullptr) {
        words.insert(words.begin(), commandNames.front().name);
        return false;
    }
    std::rotate(words.begin(), word, word + 1);
    return true;
}

void describeCommand(CLI::App &sub, const CommandName &row, Options &options) {
    if (row.command == Command::fields) {
        addFieldsOptions(sub, options);
    } else if (row.command == Command::plan) {
        addPlanOptions(sub, options);
    } else {
        addOptions(sub, options);
        addOwnOptions(sub, row.command, options);
    }
    sub.callback([&options, &row] {
        options.command = row.command;
        if (row.command != Command::fields && !options.schema && options.files.empty() && options.shard.empty()) {
            throw CLI::RequiredError("file"); // CLI11 would name the option
        }
        if (row.command == Command::plan && options.shards == 0 && options.shardSize == 0) {
            throw CLI::RequiredError("--shards N or --shard-size OCTETS");
        }
    });
}

// A command that is misspelt reads like a file.
void checkFiles(const Options &options, bool named) {
    const std::vector<std::string> &files = options.files;
    if (!options.shard.empty() && !files.empty()) {
        throw CLI::ValidationError("--shard", "the plan names the captures: leave FILE out");
    }
    if (!options.shard.empty() && options.count) {
        throw CLI::ValidationError("--shard", "--count cannot be kept across shards: leave it out");
    }
    if (std::ranges::count(files, "-") > 1) {
        throw CLI::ValidationError("FILE", "standard input (-) can be read once");
    }
    std::error_code error;
    if (!named && files.size() > 1 && files.front() != "-" && !std::filesystem::exists(files.front(), error)) {
        throw CLI::ValidationError("FILE", "'" + files.front() + "' is neither a command nor a file");
    }
}

} // namespace

std::variant<Options, ExitCode> parseOptions(int argumentCount, char **arguments) {
    Options options;
    CLI::App app{"netfloor decodes the IP layers of the packets in a capture file.", "netfloor"};
    app.set_version_flag("--version", "netfloor " NETFLOOR_VERSION);
    app.formatter(std::make_shared<UsageFormatter>());
    app.footer(footer);
    app.require_subcommand(1);
    for (const CommandName &row : commandNames) {
        app.add_subcommand(row.name, row.help);
    }

    std::vector<std::string> words(arguments + 1, arguments + argumentCount);
    if (!words.empty() && words.front() == "help") { // as many programs have it
        std::rotate(words.begin(), words.begin() + 1, words.end());
        words.back() = "--help";
    }
    constexpr std::array<std::string_view, 3> forAll = {"--help", "-h", "--version"};
    if (words.empty()) {
        words.emplace_back("--help");
    }
    const bool named = std::find(forAll.begin(), forAll.end(), words.front()) != forAll.end() || putCommandFirst(words);
    if (const CommandName *const row =
            findCommand(words.front())) { // to build those of all commands takes longer than to read a small capture
        describeCommand(*app.get_subcommand(row->name), *row, options);
    }
    std::reverse(words.begin(), words.end()); // as CLI11 takes them
    try {
        app.parse(words);
        checkFiles(options, named);
    } catch (const CLI::Success &answer) {
        app.exit(answer);
        return ExitCode::good;
    } catch (const CLI::ParseError &mistake) {
        std::cerr << "netfloor: " << mistake.what() << '\n';
        std::cerr << "netfloor --help tells what can be asked for.\n";
        return ExitCode::usage;
    }
    return options;
}

} // namespace netfloor::cli
