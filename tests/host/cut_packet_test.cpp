// SPDX-License-Identifier: MIT
// A packet that the snap length has cut: what was captured shows as in the whole packet, and nothing else does.
#include <algorithm>

#include <gtest/gtest.h>

#include "support/corpus.h"
#include "support/runs.h"

namespace netfloor::test {
namespace {

class Missing final : public Sink {
public:
    void notCaptured(const NotCaptured &first) override { names.emplace_back(first.name); }
    std::vector<std::string> names;
};

Report runCut(Pass pass, const Octets &packet, std::size_t captured) {
    RunOptions options;
    options.wireOctets = packet.size();
    return sharedHost().run(pass, std::span(packet).first(captured), options);
}

std::uint32_t endBit(const FieldReport &field) {
    std::uint32_t end = 0;
    for (const ReportedRange &range : field.ranges) {
        end = std::max(end, range.lastBit);
    }
    return end;
}

constexpr std::size_t mostBitsAhead = 64;

// Each captured beginning of each packet, against the whole packet.
TEST(CutPacket, showsWhatWasCapturedAndNothingElse) {
    std::size_t shown = 0;
    for (const Octets &packet : packetsOfAllFields()) {
        const Report whole = sharedHost().run(Pass::md, packet);
        const Report texts = sharedHost().run(Pass::to, packet);
        const Report keys = sharedHost().run(Pass::xtr, packet);
        for (std::size_t captured = 1; captured < packet.size(); ++captured) {
            const Report md = runCut(Pass::md, packet, captured);
            ASSERT_LE(md.fields.size(), whole.fields.size());
            for (std::size_t i = 0; i < md.fields.size(); ++i) {
                const FieldReport &field = md.fields[i];
                ASSERT_LE(endBit(field), captured * 8);
                if (field.id != 0) { // data of an owner is shown as far as it was captured
                    ASSERT_EQ(field.text, whole.fields[i].text);
                }
            }
            // What follows the reports was not captured, or is read only after a look ahead at what was not.
            if (md.fields.size() < whole.fields.size()) {
                const FieldReport &next = whole.fields[md.fields.size()];
                ASSERT_TRUE(next.ranges.empty() || endBit(next) + mostBitsAhead > captured * 8) << next.name;
            }
            const Report to = runCut(Pass::to, packet, captured);
            for (std::size_t i = 0; i < to.displays.size(); ++i) {
                if (to.displays[i].displayId != 0) {
                    ASSERT_EQ(to.displays[i].text, texts.displays[i].text);
                }
            }
            ASSERT_EQ(to.displays.size(), md.fields.size());
            for (const KeyValue &key : runCut(Pass::xtr, packet, captured).keys) {
                const bool isThere = std::ranges::any_of(whole.fields, [&](const FieldReport &field) {
                    return field.name.ends_with(key.name) && endBit(field) <= captured * 8 &&
                           (field.value == key.number || key.type == KeyType::ipv6Address);
                });
                ASSERT_TRUE(isThere) << key.name;
                ++shown;
            }
        }
        ASSERT_EQ(runCut(Pass::xtr, packet, packet.size()).keys.size(), keys.keys.size());
    }
    EXPECT_GT(shown, 1000U);
}

TEST(CutPacket, namesTheFirstFieldThatIsMissing) {
    struct Row {
        std::size_t captured;
        const char *missing;
        std::uint16_t sourcePort;
    };
    const Octets packet = ipv4({.protocol = 17, .payload = udp(5353, 4789, hex("61*40"))});
    for (const auto &[captured, missing, sourcePort] :
         {Row{3, "Total Length", 0}, Row{21, "UDP Source Port", 0}, Row{22, "UDP Destination Port", 5353},
          Row{30, "data", 5353}, Row{packet.size(), nullptr, 5353}}) {
        SCOPED_TRACE(captured);
        RunOptions options;
        options.wireOctets = packet.size();
        for (const Pass pass : {Pass::md, Pass::to}) {
            Missing sink;
            sharedHost().run(pass, std::span(packet).first(captured), sink, options);
            EXPECT_EQ(sink.names, missing == nullptr ? std::vector<std::string>() : std::vector<std::string>{missing});
        }
        const Report keys = runCut(Pass::xtr, packet, captured);
        const KeyValue *const port = keys.key("UDP Source Port");
        EXPECT_EQ(port == nullptr ? 0 : port->number, sourcePort);
        EXPECT_FALSE(runCut(Pass::mv, packet, captured).verdict.fault()); // zeros in place of a checksum are no fault
    }
}

} // namespace
} // namespace netfloor::test
