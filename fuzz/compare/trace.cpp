// SPDX-License-Identifier: MIT
#include "trace.h"

#include <algorithm>
#include <cstring>
#include <iterator>
#include <sstream>

#include "support/packets.h"

namespace netfloor::compare {
namespace {

constexpr std::size_t shownEvents = 6; // before the difference
constexpr std::size_t shownLines = 16;

// Words as numbers, longer pieces as octets.
std::string valueText(const std::uint8_t *from, std::size_t octets) {
    if (octets > sizeof(std::uint64_t)) {
        return test::hexText({from, octets});
    }
    std::uint64_t value = 0;
    std::memcpy(&value, from, octets);
    char hexadecimal[32];
    std::snprintf(hexadecimal, sizeof hexadecimal, " (0x%llx)", static_cast<unsigned long long>(value));
    return std::to_string(value) + hexadecimal;
}

} // namespace

void Trace::clear() {
    octets_.clear();
    lines_.clear();
    events_ = 0;
}

void Trace::event(const char *name) {
    ++events_;
    text("event", name);
}

void Trace::words(const char *label, const void *from, std::size_t octets, std::size_t wordOctets) {
    if (!keepsAnything()) {
        return;
    }
    const auto *const first = static_cast<const std::uint8_t *>(from);
    octets_.insert(octets_.end(), first, first + octets);
    if (keeps_ != Keeps::texts) {
        return;
    }
    std::istringstream names(label);
    std::string name = label; // the last one stands for the words without a name
    for (std::size_t at = 0; at < octets; at += wordOctets) {
        const bool named = static_cast<bool>(names >> name);
        const std::string index = named ? "" : '[' + std::to_string(at / wordOctets) + ']';
        lines_.push_back({events_, name + index, valueText(first + at, std::min(wordOctets, octets - at))});
    }
}

void Trace::text(const char *label, const char *from, std::size_t most) {
    if (!keepsAnything()) {
        return;
    }
    const std::size_t length = strnlen(from, most);
    octets_.insert(octets_.end(), from, from + length);
    octets_.push_back(0);
    if (keeps_ == Keeps::texts) {
        lines_.push_back({events_, label, std::string(from, length)});
    }
}

// FNV-1a, a word of eight octets at a time.
std::uint64_t Trace::digest(std::uint64_t before) const {
    std::uint64_t digest = before ^ octets_.size();
    for (std::size_t at = 0; at < octets_.size(); at += sizeof digest) {
        std::uint64_t word = 0;
        std::memcpy(&word, octets_.data() + at, std::min(sizeof word, octets_.size() - at));
        digest = (digest ^ word) * 0x100000001b3;
        digest ^= digest >> 32;
    }
    return digest;
}

std::vector<Trace::Line> Trace::linesOf(std::size_t event) const {
    std::vector<Line> lines;
    std::ranges::copy_if(lines_, std::back_inserter(lines), [&](const Line &line) { return line.event == event; });
    return lines;
}

std::string Trace::eventText(std::size_t event) const {
    std::string text = "  " + std::to_string(event);
    for (const Line &line : linesOf(event)) {
        const bool tells = line.label == "event" || line.label == "cursor" || line.label == "fieldId" ||
                           line.label == "display" || line.label == "result";
        text += tells ? "  " + line.label + ' ' + line.value : "";
    }
    return text + '\n';
}

std::string Trace::firstDifference(const Trace &old, const Trace &now) {
    const auto [inOld, inNew] = std::ranges::mismatch(old.lines_, now.lines_);
    const std::size_t event = std::min(inOld == old.lines_.end() ? old.events_ : inOld->event,
                                       inNew == now.lines_.end() ? now.events_ : inNew->event);
    std::string text = "events before it, which are the same:\n";
    for (std::size_t i = event - std::min(event, shownEvents); i < event; ++i) {
        text += old.eventText(i);
    }
    text += "old:\n" + old.eventText(event) + "new:\n" + now.eventText(event) + "what differs in it first:\n";
    const auto olds = old.linesOf(event);
    const auto news = now.linesOf(event);
    std::size_t shown = 0;
    // Where one has other lines from here on, what follows is no longer side by side.
    for (std::size_t i = 0; i < std::min(olds.size(), news.size()) && olds[i].label == news[i].label; ++i) {
        if (olds[i] != news[i] && ++shown <= shownLines) {
            text += "  " + olds[i].label + ": old " + olds[i].value + ", new " + news[i].value + '\n';
        }
    }
    return text;
}

} // namespace netfloor::compare
