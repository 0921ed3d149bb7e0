// SPDX-License-Identifier: MIT
#include "printers/page_data.h"

#include <algorithm>
#include <array>

#include "netfloor-analysis/utf8.h"

namespace netfloor::cli {

namespace {

// All fields and blocks of the plug-in have fewer labels; what owners report may have any number.
constexpr std::size_t mostLabels = 4096;
constexpr std::uint32_t kinds = 4;

} // namespace

void writePageText(Output &out, std::string_view text) {
    out << '"';
    while (!text.empty()) {
        const std::size_t octets = utf8Octets(text);
        const char first = text.front();
        if (octets > 1) {
            out << text.substr(0, octets);
        } else if (octets == 0 || first < 0x20 || first == 0x7f) {
            out << R"(\\x)";
            out.octet(static_cast<std::uint8_t>(first));
        } else if (first == '<') {
            out << R"(\u003c)";
        } else if (first == '"' || first == '\\') {
            out << '\\' << first;
        } else {
            out << first;
        }
        text.remove_prefix(std::max<std::size_t>(octets, 1));
    }
    out << '"';
}

void writeBase64(Output &out, std::span<const std::uint8_t> octets) {
    constexpr std::string_view digits = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";
    constexpr std::size_t group = 3;
    for (std::size_t at = 0; at < octets.size(); at += group) {
        const std::size_t left = octets.size() - at;
        const std::uint32_t bits = std::uint32_t{octets[at]} << 16U |
                                   (left > 1 ? std::uint32_t{octets[at + 1]} << 8U : 0U) |
                                   (left > 2 ? std::uint32_t{octets[at + 2]} : 0U);
        const std::array<char, 4> text = {digits[bits >> 18U], digits[bits >> 12U & 63U],
                                          left > 1 ? digits[bits >> 6U & 63U] : '=',
                                          left > 2 ? digits[bits & 63U] : '='};
        out << std::string_view(text.data(), text.size());
    }
}

void PageItems::begin() {
    out_ << "t[";
    isFirst_ = true;
}

void PageItems::end() {
    out_ << "]\n";
}

void PageItems::start(Kind kind, std::uint32_t depth, std::string_view label) {
    out_ << (isFirst_ ? "[" : ",[") << kinds * depth + static_cast<std::uint32_t>(kind) << ',';
    isFirst_ = false;
    writeLabel(label);
}

void PageItems::value(std::string_view text) {
    out_ << ',';
    writePageText(out_, text);
}

void PageItems::bits(std::uint32_t first, std::uint32_t count) {
    out_ << ',' << first << ',' << count;
}

void PageItems::writeLabel(std::string_view label) {
    auto found = labels_.find(label);
    if (found == labels_.end()) {
        if (labels_.size() == mostLabels) {
            return writePageText(out_, label);
        }
        found = labels_.emplace(label, static_cast<std::uint32_t>(labels_.size())).first;
        newLabels_.push_back(found->first);
    }
    out_ << found->second;
}

void PageItems::writeNewLabels() {
    for (const std::string_view label : newLabels_) {
        out_ << 'n';
        writePageText(out_, label);
        out_ << '\n';
    }
    newLabels_.clear();
}

} // namespace netfloor::cli
