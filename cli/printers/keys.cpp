// SPDX-License-Identifier: MIT
// The key fields as CSV (RFC 4180), out of the XTR pass: a line a packet, a column a key field.
#include <algorithm>
#include <array>
#include <string>
#include <string_view>
#include <vector>

#include "printers/printer.h"

namespace netfloor::cli {

namespace {

bool needsQuotes(std::string_view text) {
    return text.find_first_of(",\"\r\n") != std::string_view::npos || text.starts_with(' ') || text.ends_with(' ');
}

void writeCsv(Output &out, std::string_view text) {
    if (!needsQuotes(text)) {
        out << text;
        return;
    }
    out << '"';
    for (const char character : text) {
        out << character;
        if (character == '"') {
            out << '"';
        }
    }
    out << '"';
}

// The names in the plug-in's key-field table, row by row.
std::vector<std::string> keyFieldNames(Host &host) {
    // The plug-in hands its table over in its first XTR pass, whatever the packet.
    constexpr std::array<std::uint8_t, 1> noPacket = {0};
    Sink nothing;
    host.run(Pass::xtr, noPacket, nothing);
    return host.library().keyFieldNames();
}

// The values of some rows of the key-field table, of one packet.
class KeyValues final : public Sink {
public:
    // A row may stand in several columns.
    KeyValues(std::span<const std::size_t> rows, std::size_t rowCount, bool raw)
        : columnCount_(rows.size()), raw_(raw), columns_(rowCount) {
        for (std::size_t column = 0; column < rows.size(); ++column) {
            columns_[rows[column]].push_back(column);
        }
    }

    void clear() { values_.clear(); }

    void key(const KeyView &key) override {
        if (key.row >= columns_.size()) {
            return;
        }
        for (const std::size_t column : columns_[key.row]) {
            Value &value = values_.emplace_back();
            value.column = column;
            value.type = key.type;
            value.number = key.number;
            value.octetCount = std::min(key.octets.size(), value.octets.size());
            std::copy_n(key.octets.begin(), value.octetCount, value.octets.begin());
        }
    }

    // A comma in front of each column.
    void write(Output &out) {
        const auto byColumn = [](const Value &left, const Value &right) { return left.column < right.column; };
        if (!std::is_sorted(values_.begin(), values_.end(), byColumn)) {
            std::sort(values_.begin(), values_.end(), byColumn);
        }
        std::size_t commas = 0;
        for (const Value &value : values_) {
            out.repeated(',', value.column + 1 - commas);
            commas = value.column + 1;
            writeValue(out, value);
        }
        out.repeated(',', columnCount_ - commas);
    }

private:
    struct Value {
        std::size_t column;
        KeyType type;
        std::uint32_t number;
        std::size_t octetCount;
        Ipv6Octets octets;
    };

    void writeValue(Output &out, const Value &value) const {
        const std::span<const std::uint8_t> octets(value.octets.data(), value.octetCount);
        if (value.type < KeyType::ipv4Address) {
            out << value.number;
        } else if (!raw_) {
            TextRoom room;
            out << keyText({{}, {}, value.type, value.number, octets}, room);
        } else if (value.type == KeyType::ipv6Address) {
            writeHexadecimal(out, octets);
        } else {
            writeHexadecimal(out, octetsOf(value.number));
        }
    }

    static std::array<std::uint8_t, 4> octetsOf(std::uint32_t number) {
        return {static_cast<std::uint8_t>(number >> 24U), static_cast<std::uint8_t>(number >> 16U),
                static_cast<std::uint8_t>(number >> 8U), static_cast<std::uint8_t>(number)};
    }

    static void writeHexadecimal(Output &out, std::span<const std::uint8_t> octets) {
        for (const std::uint8_t octet : octets) {
            out.octet(octet);
        }
    }

    std::size_t columnCount_;
    bool raw_;
    std::vector<std::vector<std::size_t>> columns_; // by row
    std::vector<Value> values_;                     // that the packet has
};

class KeysPrinter final : public Printer {
public:
    KeysPrinter(const Options &options, Output &out, Host &host)
        : KeysPrinter(options, out, host, keyFieldNames(host)) {}

    void print(const PacketToPrint &packet) override {
        const CapturedPacket &captured = packet.captured;
        out() << captured.number << ',' << packet.time << ',' << captured.wireOctets << ',';
        values_.clear();
        Ending ending = Ending::complete;
        if (packet.network.isIp()) {
            ending = run(Pass::xtr, packet, values_);
        }
        writeNote(packet, ending);
        values_.write(out());
        out() << '\n';
    }

    void finish(const Tally & /*tally*/) override {}

private:
    KeysPrinter(const Options &options, Output &out, Host &host, const std::vector<std::string> &names)
        : Printer(options, out, host), rows_(chooseRows(names)), values_(rows_, names.size(), options.raw) {
        out << "packet,time,octets,note";
        for (const std::size_t row : rows_) {
            out << ',';
            writeCsv(out, names[row]);
        }
        out << '\n';
    }

    void writeNote(const PacketToPrint &packet, Ending ending) {
        const Output::Mark start = out().mark();
        if (!packet.network.isIp()) {
            out() << "no IP: " << packet.other;
        } else if (ending != Ending::complete) {
            out() << "the pass was cut off";
        }
        if (packet.captured.isCut()) {
            out() << (out().mark() == start ? "" : "; ");
            printCut(packet.captured);
        }
        if (needsQuotes(out().since(start))) {
            const std::string note(out().since(start));
            out().takeBack(start);
            writeCsv(out(), note);
        }
    }

    [[nodiscard]] std::vector<std::size_t> chooseRows(const std::vector<std::string> &names) const {
        // Of several rows of one name the last is the one that is filled.
        std::vector<std::size_t> filled;
        for (std::size_t row = 0; row < names.size(); ++row) {
            const auto later = names.begin() + static_cast<std::ptrdiff_t>(row) + 1;
            if (!names[row].empty() && std::find(later, names.end(), names[row]) == names.end()) {
                filled.push_back(row);
            }
        }
        if (options().columns.empty()) {
            return filled;
        }
        std::vector<std::size_t> rows;
        for (const std::string &wanted : options().columns) {
            const auto row =
                std::find_if(filled.begin(), filled.end(), [&](std::size_t at) { return names[at] == wanted; });
            if (row == filled.end()) {
                throw UsageError("--column '" + wanted + "': the plug-in has no key field of that name. It has: " +
                                 joined(filled, names) + ".");
            }
            rows.push_back(*row);
        }
        return rows;
    }

    [[nodiscard]] static std::string joined(const std::vector<std::size_t> &rows,
                                            const std::vector<std::string> &names) {
        std::string text;
        for (const std::size_t row : rows) {
            text += (text.empty() ? "'" : ", '") + names[row] + "'";
        }
        return text;
    }

    std::vector<std::size_t> rows_; // of the key-field table, one a column
    KeyValues values_;
};

} // namespace

std::unique_ptr<Printer> makeKeysPrinter(const Options &options, Output &out, Host &host) {
    return std::make_unique<KeysPrinter>(options, out, host);
}

} // namespace netfloor::cli
