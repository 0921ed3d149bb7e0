// SPDX-License-Identifier: MIT
// What is few enough to be gone through as a whole: each growth of storage refused, each place at which a packet can be
// cut, each number of the fields that choose how a packet is read on.
//
//     sweep PLUGIN          a sample, in seconds
//     sweep PLUGIN --all    all of it, in minutes
//
// Ends with a message, by a signal, where one of the checks does not hold.
#include <algorithm>
#include <cstdio>
#include <exception>
#include <stdexcept>
#include <string_view>

#include "checks.h"
#include "inputs.h"
#include "support/packets.h"

namespace netfloor::compare {
namespace {

using test::hex;
using test::ipv4;
using test::ipv6;
using test::Octets;
using test::operator+;

// Two octets of a packet, all values of which are tried.
struct Space {
    const char *name;
    std::size_t at;
    Octets packet;
};

Octets sctp(std::string_view chunk) {
    return ipv4({.protocol = 132, .payload = hex("0b59 0b5a 00*8") + hex(chunk)});
}

std::vector<Space> spaces() {
    const Octets twenty = hex("0102030405060708090a0b0c0d0e0f1011121314");
    const Octets datagram = test::udp(9000, 9000, twenty);
    const Octets segment = hex("2328 2328 00*8 a0 12 00*6 01 04 0000 0000 05 0a 00*8 00 00") + twenty;
    return {
        {"IPv4 version, header length, service", 0, ipv4({.protocol = 17, .payload = datagram})},
        {"IPv4 total length", 2, ipv4({.protocol = 17, .payload = datagram})},
        {"IPv4 fragment", 6, ipv4({.protocol = 17, .payload = datagram})},
        {"IPv4 time to live, protocol", 8, ipv4({.protocol = 0, .payload = twenty})},
        {"IPv4 option", 20, ipv4({.protocol = 17, .payload = datagram, .options = hex("07 08 04 00*5")})},
        {"second IPv4 option", 23,
         ipv4({.protocol = 17, .payload = datagram, .options = hex("83 03 04 44 05 05 00*6")})},
        {"ICMP type, code", 20, ipv4({.protocol = 1, .payload = hex("00*8") + ipv4({.payload = twenty})})},
        {"ICMPv6 type, code", 40, ipv6({.nextHeader = 58, .payload = hex("00*8") + ipv6({.payload = twenty})})},
        {"UDP source port", 20, ipv4({.protocol = 17, .payload = datagram})},
        {"UDP destination port", 22, ipv4({.protocol = 17, .payload = datagram})},
        {"UDP length", 24, ipv4({.protocol = 17, .payload = datagram})},
        {"TCP data offset, flags", 32, ipv4({.protocol = 6, .payload = segment})},
        {"TCP option", 41, ipv4({.protocol = 6, .payload = segment})},
        {"GRE flags", 20, ipv4({.protocol = 47, .payload = hex("0000 0800") + twenty + twenty})},
        {"GRE protocol", 22, ipv4({.protocol = 47, .payload = hex("0000 0000") + ipv4({.payload = twenty})})},
        {"minimal encapsulation", 20, ipv4({.protocol = 55, .payload = hex("1180 00*10") + datagram})},
        {"SCTP chunk type, flags", 32, sctp("0000 0018 00*8 00*12 0e00 0004")},
        {"SCTP chunk length", 34, sctp("0003 0018 00*8 00*12 0e00 0004")},
        {"parameter of INIT", 52, sctp("0100 0024 00*16 0000 0008 00*4 0006 0008 00*4")},
        {"parameter length", 54, sctp("0100 0024 00*16 0005 0008 00*4 000b 0008 00*4")},
        {"length of supported address types", 54, sctp("0100 0024 00*16 000c 0008 00*4 000b 0008 00*4")},
        {"parameter of INIT ACK", 52, sctp("0200 0024 00*16 0000 0008 00*4 0008 0008 00*4")},
        {"cause of ABORT", 36, sctp("0600 0014 0000 0008 00*4 0003 0008 00*4")},
        {"cause of ERROR", 36, sctp("0900 0014 0000 0008 00*4 0001 0008 00*4")},
        {"gap blocks of SACK", 44, sctp("0300 0018 00*8 0001 0001 0001 0002 00*4")},
        {"IPv6 payload length", 4, ipv6({.nextHeader = 17, .payload = datagram})},
        {"IPv6 next header, hop limit", 6, ipv6({.nextHeader = 0, .payload = hex("3b 00") + twenty})},
        {"hop-by-hop option", 42, ipv6({.nextHeader = 0, .payload = hex("11 01 00 00 00*12") + datagram})},
        {"destination option", 42, ipv6({.nextHeader = 60, .payload = hex("11 01 00 00 00*12") + datagram})},
        {"routing header", 42, ipv6({.nextHeader = 43, .payload = hex("11 02 00 00 00*20") + datagram})},
        {"header length of routing", 41, ipv6({.nextHeader = 43, .payload = hex("11 02 00 00 00*20") + datagram})},
        {"fragment header", 42, ipv6({.nextHeader = 44, .payload = hex("11 00 0000 00*4") + datagram})},
        {"authentication", 40, ipv6({.nextHeader = 51, .payload = hex("11 04 00*22") + datagram})},
    };
}

class Sweep {
public:
    Sweep(const char *path, bool all) : plugin_(path), all_(all), inputs_({NETFLOOR_CAPTURES}, 1) {
        setKeyFieldsUp(plugin_);
    }

    void run() {
        part("growths", [this] { refuseGrowths(); });
        part("hosts", [this] { changeHosts(); });
        part("cuts", [this] { cutEverywhere(); });
        part("spaces", [this] { enumerate(); });
    }

private:
    template <class Work>
    void part(const char *name, Work work) {
        runs_ = 0;
        work();
        std::printf("%s: %llu packets and hosts\n", name, static_cast<unsigned long long>(runs_));
    }

    bool check(const Octets &packet, const Plan &plan) {
        ++runs_;
        return checkPasses(plugin_, {packet, plan, "sweep"});
    }

    // Arrays have room for one element, and each growth in turn is refused, up to the one that is not asked for. Arrays
    // grow by doubling: so that each block is one for which there is no room, the stack of blocks starts at each depth.
    void refuseGrowths() {
        constexpr std::uint32_t mostGrowths = 2000;
        constexpr std::uint32_t mostBlocks = 24;
        const Plan tight{
            .blockCapacity = 1, .limitCapacity = 1, .layerCapacity = 1, .rangeCapacity = 1, .layerInfoCapacity = 0};
        for (const Octets &packet : inputs_.packets()) {
            Plan plan = tight;
            do {
                ++plan.refusedGrowth;
            } while (!check(packet, plan) && plan.refusedGrowth < mostGrowths);
            for (std::uint32_t blocks = 1; blocks <= mostBlocks; ++blocks) {
                check(packet, {.blockCapacity = blocks, .refusedGrowth = 1});
            }
        }
    }

    // Owners of all kinds, a byte area that is too small by one for an address and one that is not, starts at each bit.
    void changeHosts() {
        const std::uint64_t seeds = all_ ? 64 : 4;
        for (const Octets &packet : inputs_.packets()) {
            for (std::uint64_t seed = 0; seed < seeds; ++seed) {
                check(packet, {.seed = seed, .oddOwners = true});
            }
            check(packet, {.byteAreaSize = 16});
            check(packet, {.byteAreaSize = 17});
            for (unsigned shift = 1; shift < 8; ++shift) {
                check(test::shifted(packet, shift), {.cursor = shift + 1, .missingBits = 8 - shift});
            }
        }
    }

    void cutEverywhere() {
        const std::size_t count = all_ ? inputs_.packets().size() : inputs_.variedPackets();
        for (const Octets &packet : std::span(inputs_.packets()).first(count)) {
            const std::size_t most = std::min<std::size_t>(packet.size(), 200);
            for (std::size_t octets = 1; octets <= most; ++octets) {
                const Octets cut(packet.begin(), packet.begin() + static_cast<std::ptrdiff_t>(octets));
                for (std::uint32_t missing = 0; missing < 8; ++missing) {
                    check(cut, {.missingBits = missing});
                }
                check(test::shortened(packet, octets), {});
            }
        }
    }

    void enumerate() {
        const std::uint32_t step = all_ ? 1 : 61;
        for (Space &space : spaces()) {
            for (std::uint32_t value = 0; value < 0x10000; value += step) {
                space.packet.at(space.at) = static_cast<std::uint8_t>(value >> 8);
                space.packet.at(space.at + 1) = static_cast<std::uint8_t>(value);
                check(space.packet, {});
            }
        }
    }

    const Plugin plugin_;
    bool all_;
    const Inputs inputs_;
    std::uint64_t runs_ = 0;
};

} // namespace
} // namespace netfloor::compare

int main(int count, char **arguments) {
    try {
        if (count < 2) {
            throw std::runtime_error("usage: sweep PLUGIN [--all]");
        }
        netfloor::compare::Sweep(arguments[1], count > 2 && std::string_view(arguments[2]) == "--all").run();
        return 0;
    } catch (const std::exception &error) {
        std::fprintf(stderr, "sweep: %s\n", error.what());
        return 2;
    }
}
