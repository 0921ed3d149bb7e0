// SPDX-License-Identifier: MIT
#include "trace.h"

#include <algorithm>
#include <cstring>
#include <sstream>

#include "support/packets.h"

namespace netfloor::compare {
namespace {

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
    text_.clear();
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
        text_ += name + index + ": " + valueText(first + at, std::min(wordOctets, octets - at)) + '\n';
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
        text_.append(label).append(": ").append(from, length).append("\n");
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

} // namespace netfloor::compare
