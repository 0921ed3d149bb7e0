// SPDX-License-Identifier: MIT
// What a host saw during a run, as octets: two runs are the same if their traces are. A trace that keeps
// texts says in addition which octets are what.
#pragma once

#include <cstdint>
#include <cstring>
#include <string>
#include <type_traits>
#include <vector>

namespace netfloor::compare {

struct TraceLine {
    std::size_t event; // number of the event, from 0
    std::string label;
    std::string value;

    bool operator==(const TraceLine &) const = default;
};

class Trace {
public:
    void start(bool keepsTexts) {
        octets_.clear();
        lines_.clear();
        events_ = 0;
        keepsTexts_ = keepsTexts;
    }

    // A call of the host, or a result.
    void event(const char *name) {
        ++events_;
        append(name, std::strlen(name) + 1);
        if (keepsTexts_) {
            line("event", name);
        }
    }

    template <class Number>
    void number(const char *label, Number value) {
        static_assert(std::is_integral_v<Number>);
        append(&value, sizeof value);
        if (keepsTexts_) {
            const auto word = static_cast<std::int64_t>(value);
            char hexadecimal[24];
            std::snprintf(hexadecimal, sizeof hexadecimal, " (0x%llx)", static_cast<unsigned long long>(word));
            line(label, std::to_string(word) + hexadecimal);
        }
    }

    // `count` words, of which each has a line of its own.
    void words(const char *label, const void *from, std::size_t count) {
        append(from, count * sizeof(std::uint32_t));
        for (std::size_t i = 0; keepsTexts_ && i < count; ++i) {
            std::uint32_t word = 0;
            std::memcpy(&word, static_cast<const char *>(from) + i * sizeof word, sizeof word);
            line(std::string(label) + "[" + std::to_string(i) + "]", std::to_string(word));
        }
    }

    void octets(const char *label, const void *from, std::size_t count);

    // A zero-terminated text in a buffer of `size` octets.
    void text(const char *label, const char *from, std::size_t size) {
        const std::size_t length = strnlen(from, size);
        append(&length, sizeof length);
        append(from, length);
        if (keepsTexts_) {
            line(label, '"' + std::string(from, length) + '"' + (length == size ? " without an end" : ""));
        }
    }

    [[nodiscard]] std::size_t events() const { return events_; }
    [[nodiscard]] const std::vector<TraceLine> &lines() const { return lines_; }
    [[nodiscard]] bool operator==(const Trace &other) const { return octets_ == other.octets_; }

private:
    void append(const void *from, std::size_t count) {
        const auto *const octets = static_cast<const std::uint8_t *>(from);
        octets_.insert(octets_.end(), octets, octets + count);
    }

    void line(std::string label, std::string value) {
        lines_.push_back({events_ == 0 ? 0 : events_ - 1, std::move(label), std::move(value)});
    }

    std::vector<std::uint8_t> octets_;
    std::vector<TraceLine> lines_;
    std::size_t events_ = 0;
    bool keepsTexts_ = false;
};

// What parts two traces that keep texts: the first event that differs, its lines that do, and the events before.
[[nodiscard]] std::string firstDifference(const Trace &before, const Trace &after);

} // namespace netfloor::compare
