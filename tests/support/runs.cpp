// SPDX-License-Identifier: MIT
#include "support/runs.h"

#include <algorithm>
#include <cstdlib>
#include <optional>
#include <sstream>

#include <gtest/gtest.h>

#include "support/memory.h"

namespace netfloor::test {
namespace {

constexpr std::uint32_t flagsOfMvAlone =
    NETFLOOR_FLAG_EXPECTATION | NETFLOOR_FLAG_LIMIT_TOO_LONG | NETFLOOR_FLAG_BITS_LEFT_OVER;

std::uint32_t widthOf(const ReportedRange &range) {
    return range.lastBit - range.firstBit + 1;
}

// The end of the ranges from `first` on that one item of the line shows.
std::size_t joined(const std::vector<ReportedRange> &ranges, std::size_t first) {
    std::size_t end = first + 1;
    while (end < ranges.size() && ranges[end].firstBit == ranges[end - 1].lastBit + 1 &&
           widthOf(ranges[end]) == widthOf(ranges[first])) {
        ++end;
    }
    return end;
}

void writeRanges(std::ostream &out, const std::vector<ReportedRange> &ranges) {
    for (std::size_t first = 0; first < ranges.size();) {
        const std::size_t end = joined(ranges, first);
        out << ' ' << ranges[first].firstBit << '-' << ranges[end - 1].lastBit;
        if (end - first > 1) {
            out << '/' << widthOf(ranges[first]);
        }
        first = end;
    }
}

std::size_t depth(const Report &report, std::size_t block) {
    std::size_t blocks = 0;
    for (; block != Block::none; block = report.blocks[block].parent) {
        ++blocks;
    }
    return blocks;
}

void writeField(std::ostream &out, const Report &report, const FieldReport &field) {
    out << field.id << " |" << depth(report, field.block) << ' ' << report.blockName(field) << "| \"" << field.name
        << "\" \"" << field.text << '"';
    writeRanges(out, field.ranges);
    if (field.bitOrder != 0) {
        out << " order " << field.bitOrder;
    }
    out << '\n';
}

void writeOthers(std::ostream &out, const Report &report) {
    for (const DisplayReport &display : report.displays) {
        if (display.displayId != 0) {
            out << display.displayId << " \"" << display.text << "\"\n";
        }
    }
    for (const KeyValue &key : report.keys) {
        out << "row " << key.row << ' ' << key.name << '=' << keyText(key) << '\n';
    }
    if (report.pass == Pass::mv) {
        out << verdictLine(report);
    }
}

std::string_view withoutBlanks(std::string_view name) {
    name.remove_prefix(std::min(name.find_first_not_of(' '), name.size()));
    return name;
}

bool hasField(const Report &md, const KeyValue &key) {
    const std::uint32_t mask = key.type == KeyType::number8 ? 0xff : key.type == KeyType::number16 ? 0xffff : ~0u;
    return std::any_of(md.fields.begin(), md.fields.end(), [&](const FieldReport &field) {
        return withoutBlanks(field.name) == withoutBlanks(key.name) && (field.value & mask) == key.number;
    });
}

// A nested hand-off ends before the one around it, so the first to start need not be the first in the list.
const HandOff &firstOf(const Report &report) {
    return *std::ranges::min_element(report.handOffs, {}, &HandOff::cursor);
}

void writeHandOff(std::ostream &out, const HandOff &handOff) {
    out << "hand-off key " << handOff.key << " protocol " << handOff.protocol << " port " << handOff.port << " at "
        << handOff.cursor << " bits " << handOff.bitsLeft << " octets " << handOff.nextLayerOctets << " preceding "
        << handOff.precedingOctets << '\n';
}

// What all passes leave in the same state, but for an XTR pass that has stopped.
std::string endText(const Report &report, bool withContext) {
    std::ostringstream out;
    out << "bits left " << report.stateBitsLeft << " cursor " << report.cursor << " blocks " << report.blockDepth
        << " limits " << report.limitDepth << " layer " << report.layerIndex << ' ' << report.layerHandedOff
        << " flags " << (report.flags & ~flagsOfMvAlone) << " scratch";
    for (const std::uint32_t word : report.scratch) {
        out << ' ' << word;
    }
    if (withContext) {
        out << " context " << report.bitsLeft << " condition " << report.condition;
    }
    return out.str();
}

// Where the XTR pass stops, the others call the host for the first time.
std::string stopText(const HandOff &first, std::uint32_t cursor, std::uint32_t bitsLeft) {
    std::ostringstream out;
    writeHandOff(out, first);
    out << "blocks " << first.blockDepth << " limits " << first.limitDepth << " layer index " << first.layerIndex
        << " cursor " << cursor << " bits left " << bitsLeft;
    return out.str();
}

void expectSameEnds(const Report &md, const Report &other) {
    const bool complete = md.ending == Ending::complete && other.ending == Ending::complete;
    EXPECT_EQ(endText(md, complete), endText(other, complete)) << "MD, then " << passName(other.pass);
}

void expectSameStop(const Report &md, const Report &xtr) {
    ASSERT_EQ(md.handOffs.empty(), xtr.handOffs.empty()) << "one of MD and XTR hands nothing over";
    if (md.handOffs.empty()) {
        expectSameEnds(md, xtr);
        EXPECT_EQ(md.flags, xtr.flags);
        EXPECT_EQ(md.ending, xtr.ending);
        return;
    }
    const HandOff &first = firstOf(md);
    EXPECT_EQ(stopText(first, first.cursor, first.contextBitsLeft), stopText(firstOf(xtr), xtr.cursor, xtr.bitsLeft));
}

void expectAgreement(const Runs &runs) {
    const auto &[md, to, mv, xtr] = runs;
    for (const Report *other : {&to, &mv}) {
        expectSameEnds(md, *other);
        EXPECT_EQ(handOffLines(md), handOffLines(*other)) << "MD, then " << passName(other->pass);
    }
    expectSameStop(md, xtr);
    for (const KeyValue &key : xtr.keys) {
        EXPECT_TRUE(key.type == KeyType::ipv6Address || hasField(md, key)) << "MD has no field " << key.name;
    }
    EXPECT_EQ(layerLines(md), layerLines(to));
    EXPECT_EQ(md.fields.size(), to.displays.size());
    EXPECT_EQ(md.flags, to.flags);
    EXPECT_EQ(md.flags & ~mv.flags, 0U) << "MD sets a flag that MV does not set";
    EXPECT_TRUE(mv.ending != Ending::complete || mv.verdict.fault() == (mv.flags != 0)) << "verdict and flags";
    EXPECT_TRUE(md.ending != Ending::complete || (md.blockDepth == 0 && md.limitDepth == 0)) << "blocks stay open";
}

Report runGuarded(Pass pass, std::span<const std::uint8_t> packet, TestRunOptions options, bool followStop,
                  Host &host) {
    const GuardedOctets source(packet);
    const GuardedOctets working(packet);
    options.followStop = followStop;
    options.state.prepare = [&working, then = options.state.prepare](DecodeState &state) {
        state.data = working.octets().data();
        if (then) {
            then(state);
        }
    };
    return host.run(pass, source.octets(), options);
}

} // namespace

const char *pluginPath() {
    const char *const other = std::getenv("NETFLOOR_TEST_PLUGIN");
    return other != nullptr ? other : NETFLOOR_PLUGIN;
}

Host &sharedHost() {
    static Host host(PluginLibrary::open(pluginPath()));
    return host;
}

Host freshHost() {
    return Host(PluginLibrary::openCopy(pluginPath()));
}

Report runPass(Pass pass, std::span<const std::uint8_t> packet, const TestRunOptions &options, Host &host) {
    Report report = runGuarded(pass, packet, options, false, host);
    if (pass == Pass::xtr && report.layerHandedOff && report.ending == Ending::complete) {
        report.handOffs = runGuarded(pass, packet, options, true, host).handOffs;
    }
    return report;
}

Runs runAll(std::span<const std::uint8_t> packet, const TestRunOptions &options, Host &host) {
    Runs runs{runPass(Pass::md, packet, options, host), runPass(Pass::to, packet, options, host),
              runPass(Pass::mv, packet, options, host), runPass(Pass::xtr, packet, options, host)};
    const bool hadFailed = testing::Test::HasFailure();
    expectAgreement(runs);
    if (!hadFailed && testing::Test::HasFailure()) {
        ADD_FAILURE() << "the passes disagree on " << hexText(packet);
    }
    return runs;
}

std::string lines(const Report &report) {
    std::ostringstream out;
    for (const FieldReport &field : report.fields) {
        if (field.id != 0) {
            writeField(out, report, field);
        }
    }
    writeOthers(out, report);
    return out.str();
}

std::string shortLines(const Report &report) {
    std::ostringstream out;
    for (const FieldReport &field : report.fields) {
        if (field.id != 0) {
            out << field.id << " \"" << field.text << "\"\n";
        }
    }
    writeOthers(out, report);
    return out.str();
}

std::string linesWith(std::string_view text, std::string_view word) {
    const std::string quoted = '"' + std::string(word) + '"';
    std::string kept;
    while (!text.empty()) {
        const std::string_view line = text.substr(0, text.find('\n') + 1);
        text.remove_prefix(line.size());
        if (line.starts_with(std::string(word) + ' ') || line.find(quoted) != std::string_view::npos) {
            kept += line;
        }
    }
    return kept;
}

std::string linesFrom(std::string_view text, std::string_view word) {
    const std::string start = '\n' + std::string(word) + ' ';
    const std::size_t at = ('\n' + std::string(text)).find(start);
    return std::string(at == std::string::npos ? std::string_view() : text.substr(at));
}

std::string oneLine(std::string_view lines) {
    std::string result;
    for (const char letter : lines.substr(0, lines.empty() ? 0 : lines.size() - 1)) { // without the last line's end
        result += letter == '\n' ? std::string("; ") : std::string(1, letter);
    }
    return result;
}

std::string verdictLine(const Report &report) {
    std::ostringstream out;
    out << "verdict " << report.verdict.value << " flags 0x" << std::hex << report.flags << '\n';
    return out.str();
}

std::string handOffLines(const Report &report) {
    std::ostringstream out;
    for (const HandOff &handOff : report.handOffs) {
        writeHandOff(out, handOff);
    }
    return out.str();
}

std::string layerLines(const Report &report) {
    std::ostringstream out;
    for (const LayerRecord &layer : report.layers) {
        out << "layer " << layer.layerNumber << " of " << layer.decoderId << ": " << layer.firstBit << '-'
            << layer.lastBit << '\n';
    }
    return out.str();
}

std::string expected(std::string_view text) {
    std::string result;
    while (!text.empty()) {
        std::string_view line = text.substr(0, text.find('\n'));
        text.remove_prefix(std::min(line.size() + 1, text.size()));
        line.remove_prefix(std::min(line.find_first_not_of(' '), line.size()));
        if (!line.empty() && !line.starts_with('#')) {
            result.append(line).push_back('\n');
        }
    }
    return result;
}

} // namespace netfloor::test
