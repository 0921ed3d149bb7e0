// SPDX-License-Identifier: MIT
// A host that has run a packet allocates nothing for another one like it. This is a program of its own, as it counts
// all calls of the C library's heap, including those of operator new and of the stand-ins.
#include <cstddef>

#include <gtest/gtest.h>

#include "capture/allocations.h"
#include "netfloor-host/layers.h"
#include "support/corpus.h"
#include "support/runs.h"

namespace netfloor::test {
namespace {

// Reads all that it gets.
class Counter final : public Sink {
public:
    void field(const FieldView &field) override { seen += field.text.view().size() + field.name.size(); }
    void text(const ShortTextView &text) override { seen += text.text.view().size() + text.name.size(); }
    void key(const KeyView &key) override { seen += key.name.size() + key.octets.size(); }
    void end(const PassEnd &end) override { seen += end.state.cursor; }
    std::size_t seen = 0;
};

TEST(SteadyState, allocatesNothing) {
    if (!allocations()) {
        GTEST_SKIP() << "the sanitizer's heap does not count";
    }
    const std::vector<Octets> packets = packetsOfAllFields();
    Host host(PluginLibrary::open(pluginPath()));
    Counter sink;
    for (const Pass pass : {Pass::md, Pass::to, Pass::mv, Pass::xtr}) {
        const auto runPackets = [&] {
            const std::uint64_t before = *allocations();
            for (const Octets &packet : packets) {
                host.run(pass, packet, sink);
                RunOptions cut; // as the snap length leaves it
                cut.wireOctets = packet.size();
                host.run(pass, std::span(packet).first(packet.size() - packet.size() / 4), sink, cut);
            }
            return *allocations() - before;
        };
        const std::uint64_t atFirst = runPackets();
        EXPECT_EQ(runPackets(), 0U) << passName(pass);
        // The counting works.
        EXPECT_TRUE(atFirst != 0 || pass != Pass::md);
    }
    EXPECT_GT(sink.seen, packets.size());
    EXPECT_GT(host.run(Pass::md, packets.front()).fields.size(), 0U);
}

TEST(SteadyState, ofLayersAllocatesNothing) {
    if (!allocations()) {
        GTEST_SKIP() << "the sanitizer's heap does not count";
    }
    const std::vector<Octets> packets = packetsOfAllFields();
    Host host(PluginLibrary::open(pluginPath()));
    LayerView view(host);
    const auto readPackets = [&] {
        const std::uint64_t before = *allocations();
        for (const Octets &packet : packets) {
            view.read(packet);
        }
        return *allocations() - before;
    };
    EXPECT_NE(readPackets(), 0U);
    EXPECT_EQ(readPackets(), 0U);
}

} // namespace
} // namespace netfloor::test
