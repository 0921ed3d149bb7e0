// SPDX-License-Identifier: MIT
// Reports as they come: what a sink gets, in which order, and how chains of blocks are shown.
#include <algorithm>
#include <sstream>
#include <stdexcept>
#include <string>
#include <thread>
#include <vector>

#include <gtest/gtest.h>

#include "support/corpus.h"
#include "support/runs.h"

namespace netfloor::test {
namespace {

constexpr Pass allPasses[] = {Pass::md, Pass::to, Pass::mv, Pass::xtr};

// Blocks as braces and fields as dots: "Protocol{.}". Fails where a depth is not that of the braces, or one stays open.
class Braces final : public Sink {
public:
    void blockOpened(const BlockView &block) override {
        EXPECT_EQ(block.depth, open_.size());
        text.append(block.continued ? "+" : "").append(block.name).append("{");
        open_.push_back(block.number);
        deepest = std::max(deepest, open_.size());
    }
    void blockClosed(const BlockView &block) override {
        ASSERT_FALSE(open_.empty());
        EXPECT_EQ(block.number, open_.back());
        open_.pop_back();
        text += '}';
    }
    void field(const FieldView &field) override {
        EXPECT_EQ(field.depth, open_.size());
        text += '.';
    }
    void end(const PassEnd & /*end*/) override { EXPECT_TRUE(open_.empty()); }

    std::string text;
    std::size_t deepest = 0;

private:
    std::vector<std::uint32_t> open_;
};

Octets sctpPacket(const Octets &chunks) {
    return ipv4({.protocol = 132, .payload = hex("0b59 0b5a 0000002a 00000000") + chunks});
}

Octets tunnelled(Octets packet, std::size_t levels) {
    for (std::size_t level = 0; level < levels; ++level) {
        packet = ipv6({.nextHeader = 41, .payload = packet});
    }
    return packet;
}

TEST(Sink, showsLinksOfAChainSideBySide) {
    const Octets smallUdp = udp(40000, 40001, hex("01020304"));
    const struct {
        const char *name;
        Octets packet;
        std::string_view tree; // the end of the text
    } cases[] = {
        {"extension headers", ipv6({.nextHeader = 0, .payload = hex(R"(
             3c 00 01 04 00*4   # hop by hop
             2b 00 01 04 00*4   # destination options
             11 00 00 00 00*4   # routing
         )") + smallUdp}),
         "Ip Header{.IPv6 Header{...IPv6 Body{.Next Header{.}.IP Address{..}IP Address{..}"
         "Next Header{.}Header Extention Length{.}Options{.PadN Option{...}}"
         "Next Header{.}Header Extention Length{.}Options{.PadN Option{...}}"
         "Ipv6 Routing Header{.Next Header{.}Header Extention Length{.}Type 0 Routing Header{...}}"
         "User Datagram Protocol{....}}}}"},
        {"chunks, and parameters in one", sctpPacket(hex(R"(
             06 00 00 04
             0b 00 00 04
             01 00 00 24 01020304 00000000 00 01 00 01 00000001 0005 0008 0a000001 0005 0008 0a000002
         )")),
         "Common Header{....}Chunk{.Abort Association{...}}"
         "Chunk{.Cookie Acknowledge{.Length{.}}}"
         "Chunk{.INIT{.......Init Option{..IPv4 Address{.}}Init Option{..IPv4 Address{.}}}}}}}"},
        {"a header inside a header",
         ipv4({.protocol = 1, .payload = hex("03 01 00 00 00000000") + ipv4({.protocol = 17, .payload = smallUdp})}),
         "Destination Unreachable Message{...Internet Protocol Message in ICMP{..............Embedded IP Protocols{.}"
         "...}..}}}}}"},
    };
    for (const auto &[name, packet, tree] : cases) {
        Braces braces;
        sharedHost().run(Pass::md, packet, braces);
        EXPECT_TRUE(braces.text.ends_with(tree)) << name << ": " << braces.text;
    }
}

// The braces of all packets match, and no packet can nest them deep.
TEST(Sink, showsNoPacketDeeperThanItsNames) {
    constexpr std::size_t mostDepth = 16;
    const auto repeated = [](const char *octets, std::size_t count) {
        Octets all;
        for (const Octets unit = hex(octets); count > 0; --count) {
            all.insert(all.end(), unit.begin(), unit.end());
        }
        return all;
    };
    std::vector<Octets> packets = packetsOfAllFields();
    packets.push_back(sctpPacket(repeated("0b 00 00 04", 16000)));
    packets.push_back(ipv6({.nextHeader = 60, .payload = repeated("3c 00 01 04 00*4", 8000)}));
    packets.push_back(ipv6({.nextHeader = 60, .payload = repeated("2c 00 01 04 00*4 3c 00*7", 4000)}));
    packets.push_back(tunnelled({}, 1600));
    for (const Octets &packet : packets) {
        Braces braces;
        sharedHost().run(Pass::md, packet, braces);
        EXPECT_LE(braces.deepest, mostDepth)
            << hexText(std::span(packet).first(std::min<std::size_t>(64, packet.size())));
    }
}

// All that a report says, with the state at the end.
std::string everything(const Report &report) {
    std::ostringstream out;
    out << lines(report) << layerLines(report) << handOffLines(report) << verdictLine(report);
    for (const FieldReport &field : report.fields) {
        out << field.value << ' ' << field.flags << ' ' << int{field.recordHead[0]} << int{field.recordHead[1]} << '\n';
    }
    out << report.cursor << ' ' << report.bitsLeft << ' ' << report.stateBitsLeft << ' ' << report.blockDepth << ' '
        << report.limitDepth << ' ' << report.layerIndex << ' ' << report.layerHandedOff << ' ' << report.condition
        << ' ' << int{report.layerNumber} << ' ' << static_cast<int>(report.ending);
    for (const std::uint32_t word : report.scratch) {
        out << ' ' << word;
    }
    return out.str();
}

// No packet changes the report of the next one: used storage gives the same as new storage.
TEST(Sink, getsTheSameFromStorageThatIsKept) {
    const std::vector<Octets> packets = packetsOfAllFields();
    Host host(PluginLibrary::open(NETFLOOR_PLUGIN));
    for (const Pass pass : allPasses) {
        std::size_t different = 0;
        for (std::size_t i = 0; i < packets.size(); ++i) {
            // Long and short ones alternate.
            const Octets &packet = packets[i % 2 == 0 ? i : packets.size() - i];
            different += everything(host.run(pass, packet)) != everything(host.run(pass, packet, TestRunOptions()));
        }
        EXPECT_EQ(different, 0U) << passName(pass);
    }
}

// Throws at one of its calls.
class Thrower final : public Sink {
public:
    explicit Thrower(int atCall) : left_(atCall) {}
    void begin(Pass /*pass*/, std::span<const std::uint8_t> /*packet*/) override { count(); }
    void blockOpened(const BlockView & /*block*/) override { count(); }
    void blockClosed(const BlockView & /*block*/) override { count(); }
    void field(const FieldView & /*field*/) override { count(); }
    void text(const ShortTextView & /*text*/) override { count(); }
    void key(const KeyView & /*key*/) override { count(); }
    void layer(const LayerRecord & /*layer*/) override { count(); }
    void handOff(const HandOff & /*handOff*/) override { count(); }
    void end(const PassEnd & /*end*/) override {
        count();
        ended = true;
    }
    bool ended = false;

private:
    void count() {
        EXPECT_GE(left_, 0) << "a call after an exception";
        if (left_-- == 0) {
            throw std::runtime_error("full");
        }
    }
    int left_;
};

// The fields of one id, as they come.
class OneField final : public Sink {
public:
    OneField(std::uint32_t id, bool wantsNoOther) : id_(id), wanted_(wantsNoOther ? id + 1 : 0) {
        std::fill(wanted_.begin() + (wantsNoOther ? id : 0), wanted_.end(), std::uint8_t{1});
    }
    [[nodiscard]] bool wantsBlocks() const override { return false; }
    [[nodiscard]] std::span<const std::uint8_t> wantedFields() const override { return wanted_; }
    void field(const FieldView &field) override {
        if (field.id == id_) {
            text += std::string(field.text.view()) + std::to_string(field.recordHead[0]) +
                    std::to_string(field.recordHead[1]) + std::to_string(field.cursor) + "\n";
        } else if (field.id != 0) {
            EXPECT_TRUE(wanted_.empty()) << field.id << " is not wanted";
        }
    }
    std::string text;

private:
    std::uint32_t id_;
    std::vector<std::uint8_t> wanted_;
};

TEST(Sink, getsTheFieldsThatItWants) {
    Host host(PluginLibrary::open(NETFLOOR_PLUGIN));
    for (const std::uint32_t id : {150U, 159U, 489U}) {
        OneField all(id, false);
        OneField one(id, true);
        for (const Octets &packet : packetsOfAllFields()) {
            for (const std::size_t wireOctets : {std::size_t{0}, packet.size() + 100}) {
                host.run(Pass::md, packet, all, {.wireOctets = wireOctets});
                host.run(Pass::md, packet, one, {.wireOctets = wireOctets});
            }
        }
        EXPECT_EQ(one.text, all.text);
        EXPECT_NE(one.text, "");
    }
}

TEST(Sink, endsThePassByAnException) {
    Host host(PluginLibrary::open(NETFLOOR_PLUGIN));
    const Octets packet = ipv4({.protocol = 17, .payload = udp(40000, 40001, hex("00*12"))});
    const std::string before = everything(host.run(Pass::md, packet));
    for (const Pass pass : allPasses) {
        int call = 0;
        for (bool ended = false; !ended; ++call) {
            Thrower thrower(call);
            try {
                host.run(pass, packet, thrower);
            } catch (const std::runtime_error &) {
                EXPECT_FALSE(thrower.ended);
            }
            ended = thrower.ended;
        }
        EXPECT_GT(call, 3) << passName(pass);
    }
    EXPECT_EQ(everything(host.run(Pass::md, packet)), before);
}

class Reentering final : public Sink {
public:
    explicit Reentering(Host &host) : host_(host) {}
    void text(const ShortTextView & /*text*/) override { static_cast<void>(host_.run(Pass::mv, {})); }

private:
    Host &host_;
};

TEST(Busy, anOwnerMayRunAnotherPacketAndASinkMayNot) {
    Host host(PluginLibrary::open(NETFLOOR_PLUGIN));
    const Octets inner = ipv6({.nextHeader = 17, .payload = udp(53, 53, hex("00*8"))});
    const Octets outer = ipv4({.protocol = 17, .payload = udp(40000, 7000, hex("00*12"))});
    for (const Pass pass : allPasses) {
        const std::string alone = everything(host.run(pass, inner));
        std::string nested;
        host.owners().add(7000, [&](NextLayer &next) {
            nested = everything(host.run(pass, inner));
            return takeAsData(next);
        });
        const std::string around = everything(host.run(pass, outer));
        EXPECT_EQ(nested, alone);
        host.owners().add(7000, takeAsData);
        EXPECT_EQ(around, everything(host.run(pass, outer)));
    }
    Reentering sink(host);
    EXPECT_THROW(host.run(Pass::to, outer, sink), PluginBusy);
    EXPECT_EQ(host.run(Pass::to, outer).ending, Ending::complete);
}

TEST(Busy, saysWhatToDoForASecondThread) {
    const PluginLibrary library = PluginLibrary::open(NETFLOOR_PLUGIN);
    const Octets packet = ipv4({.protocol = 17, .payload = udp(40000, 7000, hex("00*12"))});
    Host first(library);
    Host second(library);
    first.owners().add(7000, [&](NextLayer &next) {
        std::thread([&] {
            try {
                static_cast<void>(second.run(Pass::mv, packet));
                ADD_FAILURE() << "two threads in one load";
            } catch (const PluginBusy &busy) {
                EXPECT_NE(std::string(busy.what()).find("PluginLibrary::openCopy"), std::string::npos) << busy.what();
            }
            EXPECT_EQ(freshHost().run(Pass::mv, packet).ending, Ending::complete) << "a copy is free";
        }).join();
        return takeAsData(next);
    });
    EXPECT_EQ(first.run(Pass::md, packet).ending, Ending::complete);
    EXPECT_EQ(second.run(Pass::mv, packet).ending, Ending::complete);
}

} // namespace
} // namespace netfloor::test
