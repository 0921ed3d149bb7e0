// SPDX-License-Identifier: MIT
// A condition on the layers of a packet: "sctp.chunk_type == 6 and ip.ttl < 5".
//
//     const netfloor::Condition condition("tcp.syn and ip.source in 10.0.0.0/8");
//     view.read(packet);
//     if (condition.holdsFor(view)) { ... }
//
//     condition:  condition or condition | condition and condition | not condition | ( condition ) | term
//     term:       FIELD                     the field is there, and is not 0 if it is a number
//                 LAYER                     ip gre icmp icmpv6 quoted tcp udp sctp chunk security payload
//                 FIELD == VALUE            also !=, and < <= > >= of numbers
//                 FIELD in VALUE            also of several: in {80, 443, 8000-8080}
//
// A field has a name of layer_fields.h, also one that stands for several: "ip.address" and "tcp.port" are the source or
// the destination, "source_port" is that of any transport. A value is a decimal number, a hexadecimal one (0x1f), an
// IPv4 or IPv6 address, or a prefix (2001:db8::/32). A term of a field that is not there does not hold.
//
// All terms are asked of one IP layer with what it carries and one of its SCTP chunks. `&&`, `||` and `!` are taken for
// the words.
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <stdexcept>
#include <string>
#include <string_view>
#include <vector>

#include "netfloor-host/layers.h"

namespace netfloor {

// What is wrong with a condition, and where.
class ConditionError : public std::runtime_error {
public:
    ConditionError(const std::string &sentence, std::size_t place, std::size_t length)
        : std::runtime_error(sentence), place_(place), length_(length) {}

    [[nodiscard]] std::size_t place() const { return place_; } // characters of the text in front of the mistake
    [[nodiscard]] std::size_t length() const { return length_; }

private:
    std::size_t place_;
    std::size_t length_;
};

class Condition {
public:
    // Throws ConditionError.
    explicit Condition(std::string_view text);

    // Whether the condition holds for an IP layer, numbered from 1, with a chunk that it carries, or with none.
    [[nodiscard]] bool holdsFor(const LayerView &view, std::uint16_t ipLayer, const Layer *chunk) const;

    // The same with any of its chunks.
    [[nodiscard]] bool holdsFor(const LayerView &view, std::uint16_t ipLayer) const;

    // The same for any IP layer of the packet.
    [[nodiscard]] bool holdsFor(const LayerView &view) const;

private:
    friend class ConditionParser;

    // The first octets of an address: 4 or 16 octets, of which so many bits count.
    struct Prefix {
        std::array<std::uint8_t, 16> octets = {};
        std::uint8_t octetCount = 0;
        std::uint8_t bits = 0;
    };
    struct Range {
        std::uint32_t first;
        std::uint32_t last;
    };
    struct Term {
        LayerKind kind = LayerKind::ip;
        std::vector<LayerField> fields; // any of them; none asks for the layer
        bool asksForValue = false;
        bool isNot = false; // the value is there and is none of these
        std::vector<Range> ranges;
        std::vector<Prefix> prefixes;
    };
    enum class Operation : std::uint8_t { any, all, none, term };
    struct Node {
        Operation operation = Operation::term;
        std::vector<std::size_t> parts; // places of nodes; of a term, its place
    };

    [[nodiscard]] bool holds(std::size_t node, const LayerView &view, std::uint16_t ipLayer, const Layer *chunk) const;
    [[nodiscard]] static bool holds(const Term &term, const LayerView &view, const Layer &layer);
    [[nodiscard]] static bool isOneOf(const Term &term, const LayerView &view, const Layer &layer, LayerField field);

    std::vector<Term> terms_;
    std::vector<Node> nodes_;
    std::size_t root_ = 0;
};

} // namespace netfloor
