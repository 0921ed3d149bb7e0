// SPDX-License-Identifier: MIT
// Numbers that follow from a seed on every machine, and cost next to nothing to start (SplitMix64).
#pragma once

#include <cstdint>
#include <initializer_list>

namespace netfloor::compare {

class Random {
public:
    explicit Random(std::uint64_t seed) : state_(seed) {}

    std::uint64_t next() {
        std::uint64_t mixed = state_ += 0x9e3779b97f4a7c15;
        mixed = (mixed ^ mixed >> 30) * 0xbf58476d1ce4e5b9;
        mixed = (mixed ^ mixed >> 27) * 0x94d049bb133111eb;
        return mixed ^ mixed >> 31;
    }

    // From 0 to `limit` - 1; `limit` is not 0.
    std::uint32_t below(std::uint64_t limit) { return static_cast<std::uint32_t>(next() % limit); }
    std::uint32_t from(std::uint32_t least, std::uint32_t most) { return least + below(most - least + 1); }
    bool oneIn(std::uint32_t count) { return below(count) == 0; }
    std::uint8_t octet() { return static_cast<std::uint8_t>(next()); }

    template <class Value>
    Value pick(std::initializer_list<Value> values) {
        return values.begin()[below(values.size())];
    }

private:
    std::uint64_t state_;
};

} // namespace netfloor::compare
