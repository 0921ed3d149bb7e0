// SPDX-License-Identifier: MIT
// The key fields as CSV (RFC 4180), out of the XTR pass: a line a packet, a column a key field.
#include <algorithm>
#include <array>
#include <cstdio>
#include <string_view>
#include <vector>

#include "printers/printer.h"

namespace netfloor::cli {

namespace {

std::string csvText(std::string_view text) {
    if (text.find_first_of(",\"\r\n") == std::string_view::npos && !text.starts_with(' ') && !text.ends_with(' ')) {
        return std::string(text);
    }
    std::string result = "\"";
    for (const char character : text) {
        result += character;
        if (character == '"') {
            result += '"';
        }
    }
    return result + "\"";
}

std::string hexadecimal(std::span<const std::uint8_t> octets) {
    std::string result;
    for (const std::uint8_t octet : octets) {
        std::array<char, 3> text{};
        std::snprintf(text.data(), text.size(), "%02x", octet);
        result += text.data();
    }
    return result;
}

std::string rawText(const KeyValue &key) {
    if (key.type == KeyType::ipv6Address) {
        return hexadecimal(key.octets);
    }
    if (key.type == KeyType::ipv4Address) {
        std::array<char, 9> text{};
        std::snprintf(text.data(), text.size(), "%08x", key.number);
        return text.data();
    }
    return keyText(key);
}

// The names in the plug-in's key-field table, row by row.
std::vector<std::string> keyFieldNames(Host &host) {
    // The plug-in hands its table over in its first XTR pass, whatever the packet.
    constexpr std::array<std::uint8_t, 1> noPacket = {0};
    (void)host.run(Pass::xtr, noPacket);
    return host.library().keyFieldNames();
}

class KeysPrinter final : public Printer {
public:
    KeysPrinter(const Options &options, Output &out, Host &host) : Printer(options, out, host) {
        const auto names = keyFieldNames(host);
        chooseColumns(names);
        out << "packet,time,octets,note";
        for (const std::size_t row : rows_) {
            out << ',' << csvText(names[row]);
        }
        out << '\n';
    }

    void print(const CapturedPacket &packet, const NetworkPart &network, const std::string &time) override {
        Report report;
        std::string note = network.isIp() ? "" : "no IP: " + network.other.text();
        if (network.isIp()) {
            report = host().run(Pass::xtr, network.octets);
            note = report.ending == Ending::complete ? "" : "the pass was cut off";
        }
        if (packet.isCut()) {
            note += (note.empty() ? "" : "; ") + cutText(packet);
        }
        out() << packet.number << ',' << time << ',' << std::uint64_t{packet.wireOctets} << ',' << csvText(note);
        printValues(report.keys);
        out() << '\n';
    }

    void finish(const Tally & /*tally*/) override {}

private:
    void chooseColumns(const std::vector<std::string> &names) {
        // Of several rows of one name the last is the one that is filled.
        std::vector<std::size_t> filled;
        for (std::size_t row = 0; row < names.size(); ++row) {
            const auto later = names.begin() + static_cast<std::ptrdiff_t>(row) + 1;
            if (!names[row].empty() && std::find(later, names.end(), names[row]) == names.end()) {
                filled.push_back(row);
            }
        }
        rows_ = options().columns.empty() ? filled : std::vector<std::size_t>();
        for (const std::string &wanted : options().columns) {
            const auto row =
                std::find_if(filled.begin(), filled.end(), [&](std::size_t at) { return names[at] == wanted; });
            if (row == filled.end()) {
                throw UsageError("--column '" + wanted + "': the plug-in has no key field of that name. It has: " +
                                 joined(filled, names) + ".");
            }
            rows_.push_back(*row);
        }
    }

    [[nodiscard]] static std::string joined(const std::vector<std::size_t> &rows,
                                            const std::vector<std::string> &names) {
        std::string text;
        for (const std::size_t row : rows) {
            text += (text.empty() ? "'" : ", '") + names[row] + "'";
        }
        return text;
    }

    void printValues(const std::vector<KeyValue> &keys) {
        for (const std::size_t row : rows_) {
            out() << ',';
            const auto key = std::lower_bound(keys.begin(), keys.end(), row,
                                              [](const KeyValue &value, std::size_t at) { return value.row < at; });
            if (key != keys.end() && key->row == row) {
                out() << (options().raw ? rawText(*key) : keyText(*key));
            }
        }
    }

    std::vector<std::size_t> rows_; // of the key-field table, one a column
};

} // namespace

std::unique_ptr<Printer> makeKeysPrinter(const Options &options, Output &out, Host &host) {
    return std::make_unique<KeysPrinter>(options, out, host);
}

} // namespace netfloor::cli
