// SPDX-License-Identifier: MIT
// The command over one packet: host, sinks and printers. An input is four octets that say which options it gets, all of
// them 0 for a summary of a packet that starts with its IP header, and the packet as it was captured.
#include <algorithm>
#include <array>
#include <cstdio>
#include <cstdlib>
#include <iostream>
#include <string>
#include <vector>

#include "decode.h"
#include "exit_code.h"
#include "inputs.h"
#include "memory_file.h"
#include "options.h"
#include "packet_mutator.h"

namespace netfloor::fuzz {
namespace {

using test::operator+;

constexpr std::size_t headOctets = 4;
constexpr std::size_t mostPacketOctets = 2048;

constexpr std::array commands = {cli::Command::summary, cli::Command::detail, cli::Command::verify, cli::Command::keys,
                                 cli::Command::json};
// Raw IP, Ethernet, null, PPP, Linux cooked v1 and v2, MPLS, Frame Relay.
constexpr std::array<std::uint8_t, 8> linkTypes = {101, 1, 0, 9, 113, 20, 219, 107};
constexpr std::array conditions = {"", "ip.ttl < 65 and not quoted", "sctp.chunk_type in {0-3, 192} or tcp.syn",
                                   "ip.address in 10.0.0.0/8 or ip.source in 2001:db8::/32"};

cli::Options optionsFrom(std::span<const std::uint8_t> head) {
    const auto on = [&](unsigned bit) { return (head[1] >> bit & 1) != 0; };
    cli::Options options;
    options.command = commands[head[0] % commands.size()];
    options.where = conditions[head[0] / 4 % conditions.size()];
    options.all = on(0);
    options.bits = on(1);
    options.bad = on(2);
    options.raw = on(3);
    options.perChunk = on(4);
    options.utc = on(5);
    options.withFields = on(7);
    options.colour = on(6) ? cli::Colour::always : cli::Colour::never;
    options.plugin = NETFLOOR_PLUGIN;
    options.jobs = 1;
    return options;
}

// A capture of the packet, twice: the second must be printed as the first. Of a packet that was cut, some octets were
// more on the wire.
test::Octets captureOf(std::span<const std::uint8_t> packet, std::uint8_t linkType, std::uint8_t cutOctets) {
    const test::Octets octets(packet.begin(), packet.end());
    const test::Octets record = test::hex("00*8") + test::be32(static_cast<std::uint32_t>(octets.size())) +
                                test::be32(static_cast<std::uint32_t>(octets.size()) + cutOctets) + octets;
    return test::hex("a1b2c3d4 0002 0004 00*8 00040000") + test::be32(linkType) + record + record;
}

void require(bool holds, const char *what, const std::string &output) {
    if (!holds) {
        std::fprintf(stderr, "FAULT: %s\n%s\n", what, output.c_str());
        std::abort();
    }
}

// JSON has texts of packets in UTF-8.
bool mayBePrinted(char letter, const cli::Options &options) {
    const bool isColour = letter == '\x1b' && options.colour == cli::Colour::always;
    const bool isUtf8 = static_cast<unsigned char>(letter) >= 0x80 && options.command == cli::Command::json;
    return letter == '\n' || isColour || isUtf8 || (letter >= ' ' && letter <= '~');
}

// What is printed goes to standard output.
const MemoryFile &standardOutput() {
    static const MemoryFile file;
    static const bool taken = ::dup2(file.descriptor(), STDOUT_FILENO) == STDOUT_FILENO;
    static_cast<void>(taken);
    return file;
}

void runCommand(const cli::Options &options, std::size_t packetOctets) {
    const MemoryFile &output = standardOutput();
    output.set({});
    ::lseek(STDOUT_FILENO, 0, SEEK_SET);
    const cli::ExitCode code = cli::decodeCapture(options);
    const std::string text = output.content();
    require(code == cli::ExitCode::good || code == cli::ExitCode::damagedPackets, "the command has failed", text);
    const std::size_t mostForOctet = options.command == cli::Command::json && options.withFields ? 160 : 100;
    require(text.size() <= 2 * (4096 + mostForOctet * packetOctets), "the output is not bounded by the packet", text);
    require(std::ranges::all_of(text, [&options](char letter) { return mayBePrinted(letter, options); }),
            "the output holds what a terminal would obey", text);
}

} // namespace
} // namespace netfloor::fuzz

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size) {
    using namespace netfloor::fuzz;
    static const MemoryFile capture;
    if (size < headOctets) {
        return 0;
    }
    const std::span head(data, headOctets);
    const std::span packet(data + headOctets, std::min(size - headOctets, mostPacketOctets));
    capture.set(captureOf(packet, linkTypes[head[2] % linkTypes.size()], head[3]));
    netfloor::cli::Options options = optionsFrom(head);
    options.files = {capture.path()};
    runCommand(options, packet.size() + head[3]);
    return 0;
}

extern "C" std::size_t LLVMFuzzerCustomMutator(std::uint8_t *data, std::size_t size, std::size_t mostOctets,
                                               unsigned seed) {
    const auto changeHead = [](std::span<std::uint8_t> head, netfloor::compare::Random &random) {
        head[random.below(head.size())] = random.oneIn(3) ? 0 : random.octet();
    };
    return netfloor::compare::mutateInput({data, mostOctets}, size, netfloor::fuzz::headOctets, seed, changeHead);
}
