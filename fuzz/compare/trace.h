// SPDX-License-Identifier: MIT
// What a host saw during a run, as octets: two runs are the same if their digests are. A trace that keeps texts says in
// addition what each of them is.
#pragma once

#include <concepts>
#include <cstdint>
#include <string>
#include <vector>

namespace netfloor::compare {

class Trace {
public:
    enum class Keeps : std::uint8_t { nothing, octets, texts };

    explicit Trace(Keeps keeps = Keeps::octets) : keeps_(keeps) {}

    [[nodiscard]] bool keepsAnything() const { return keeps_ != Keeps::nothing; }

    void clear();

    // A call of the host, or a result; what follows belongs to it.
    void event(const char *name);

    void number(const char *label, std::integral auto value) { words(label, &value, sizeof value, sizeof value); }

    // Words, of which each has a text of its own. `label` may name each of them, with blanks between the names.
    void words(const char *label, const void *from, std::size_t octets, std::size_t wordOctets = 4);
    void octets(const char *label, const void *from, std::size_t count) { words(label, from, count, 32); }

    // A zero-terminated text, which may be cut at `most` octets.
    void text(const char *label, const char *from, std::size_t most = SIZE_MAX);

    [[nodiscard]] std::size_t events() const { return events_; }

    // A number that follows from all octets, on top of the one of the traces before.
    [[nodiscard]] std::uint64_t digest(std::uint64_t before) const;

    // A line for each of them, where texts are kept.
    [[nodiscard]] const std::string &text() const { return text_; }

private:
    Keeps keeps_;
    std::vector<std::uint8_t> octets_;
    std::string text_;
    std::size_t events_ = 0;
};

} // namespace netfloor::compare
