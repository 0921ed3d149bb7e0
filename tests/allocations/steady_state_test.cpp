// SPDX-License-Identifier: MIT
// A host that has run a packet allocates nothing for another one like it. This is a program of its own, as it counts
// all calls of the C library's heap, including those of operator new and of the stand-ins.
#include <atomic>
#include <cstddef>

#include <gtest/gtest.h>

#include "netfloor-host/layers.h"
#include "support/corpus.h"
#include "support/runs.h"

#ifdef __has_feature // clang; g++ has a macro for it
#if __has_feature(address_sanitizer) || __has_feature(thread_sanitizer)
#define NETFLOOR_OTHER_HEAP
#endif
#elif defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
#define NETFLOOR_OTHER_HEAP
#endif

#ifndef NETFLOOR_OTHER_HEAP
namespace {

std::atomic<std::size_t> allocations = 0;

} // namespace

// The names by which the C library keeps its own heap reachable.
extern "C" {
void *__libc_malloc(std::size_t size);
void *__libc_calloc(std::size_t count, std::size_t size);
void *__libc_realloc(void *old, std::size_t size);

void *malloc(std::size_t size) {
    ++allocations;
    return __libc_malloc(size);
}
void *calloc(std::size_t count, std::size_t size) {
    ++allocations;
    return __libc_calloc(count, size);
}
void *realloc(void *old, std::size_t size) {
    ++allocations;
    return __libc_realloc(old, size);
}
}

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
    const std::vector<Octets> packets = packetsOfAllFields();
    Host host(PluginLibrary::open(pluginPath()));
    Counter sink;
    for (const Pass pass : {Pass::md, Pass::to, Pass::mv, Pass::xtr}) {
        const auto runPackets = [&] {
            const std::size_t before = allocations;
            for (const Octets &packet : packets) {
                host.run(pass, packet, sink);
                RunOptions cut; // as the snap length leaves it
                cut.wireOctets = packet.size();
                host.run(pass, std::span(packet).first(packet.size() - packet.size() / 4), sink, cut);
            }
            return allocations - before;
        };
        const std::size_t atFirst = runPackets();
        EXPECT_EQ(runPackets(), 0U) << passName(pass);
        // The counting works.
        EXPECT_TRUE(atFirst != 0 || pass != Pass::md);
    }
    EXPECT_GT(sink.seen, packets.size());
    EXPECT_GT(host.run(Pass::md, packets.front()).fields.size(), 0U);
}

TEST(SteadyState, ofLayersAllocatesNothing) {
    const std::vector<Octets> packets = packetsOfAllFields();
    Host host(PluginLibrary::open(pluginPath()));
    LayerView view(host);
    const auto readPackets = [&] {
        const std::size_t before = allocations;
        for (const Octets &packet : packets) {
            view.read(packet);
        }
        return allocations - before;
    };
    EXPECT_NE(readPackets(), 0U);
    EXPECT_EQ(readPackets(), 0U);
}

} // namespace
} // namespace netfloor::test
#endif
