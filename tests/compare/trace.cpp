// SPDX-License-Identifier: MIT
#include "trace.h"

#include <algorithm>
#include <map>

namespace netfloor::compare {
namespace {

// Events in front of the difference that are shown, and octets of each row of a long value.
constexpr std::size_t shownEvents = 6;
constexpr std::size_t rowOctets = 32;

// Events are told by what was read: other labels of an event that is no different say nothing.
bool tells(const std::string &label) {
    return label == "event" || label == "display" || label == "fieldId" || label == "cursor" || label == "bitsLeft";
}

std::string eventTold(const std::vector<TraceLine> &lines, std::size_t event) {
    std::string told = "  " + std::to_string(event) + ':';
    for (const TraceLine &line : lines) {
        if (line.event == event && tells(line.label)) {
            told += ' ' + (line.label == "event" ? line.value : line.label + '=' + line.value);
        }
    }
    return told + '\n';
}

using Values = std::map<std::string, std::string>;

Values valuesOf(const std::vector<TraceLine> &lines, std::size_t event) {
    Values values;
    for (const TraceLine &line : lines) {
        if (line.event == event) {
            values[line.label] = line.value;
        }
    }
    return values;
}

std::string valueIn(const Values &values, const std::string &label) {
    const auto found = values.find(label);
    return found == values.end() ? "nothing" : found->second;
}

} // namespace

void Trace::octets(const char *label, const void *from, std::size_t count) {
    append(&count, sizeof count);
    append(from, count);
    if (!keepsTexts_) {
        return;
    }
    const auto *const octets = static_cast<const std::uint8_t *>(from);
    for (std::size_t row = 0; row < count; row += rowOctets) {
        std::string text;
        for (std::size_t i = row; i < std::min(count, row + rowOctets); ++i) {
            char digits[4];
            std::snprintf(digits, sizeof digits, "%02x ", octets[i]);
            text += digits;
        }
        line(std::string(label) + "+" + std::to_string(row), text);
    }
}

std::string firstDifference(const Trace &before, const Trace &after) {
    const auto &olds = before.lines();
    const auto &news = after.lines();
    const auto [inOld, inNew] = std::mismatch(olds.begin(), olds.end(), news.begin(), news.end());
    if (inOld == olds.end() && inNew == news.end()) {
        std::string told = "none; the last events of both are:\n";
        for (std::size_t i = before.events() - std::min(before.events(), shownEvents); i < before.events(); ++i) {
            told += eventTold(olds, i);
        }
        return told;
    }
    const std::size_t event = std::min(inOld == olds.end() ? before.events() : inOld->event,
                                       inNew == news.end() ? after.events() : inNew->event);
    std::string told = "events before, which are the same:\n";
    for (std::size_t i = event < shownEvents ? 0 : event - shownEvents; i < event; ++i) {
        told += eventTold(olds, i);
    }
    told += "old:\n" + eventTold(olds, event) + "new:\n" + eventTold(news, event) + "what differs in it:\n";
    const Values oldValues = valuesOf(olds, event);
    const Values newValues = valuesOf(news, event);
    Values all = oldValues;
    all.insert(newValues.begin(), newValues.end());
    for (const auto &[label, value] : all) {
        const std::string was = valueIn(oldValues, label);
        const std::string is = valueIn(newValues, label);
        if (was != is) {
            told += "  " + label + ": old " + was + ", new " + is + '\n';
        }
    }
    return told;
}

} // namespace netfloor::compare
