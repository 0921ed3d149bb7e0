// SPDX-License-Identifier: MIT
// A host that hides nothing: the records as the plug-in left them, what the host could see at each call, and a
// key record of a form in which every stray store shows.
#pragma once

#include <array>
#include <cstdint>
#include <functional>
#include <string>
#include <vector>

#include "../host/standins/links.h"
#include "netfloor-host/testing.h"
#include "support/memory.h"
#include "support/packets.h"

namespace netfloor::test {

// A plug-in with statics of its own, whose questions for the key-field set-up the test answers: with the results
// in turn, the last of them for good. A presence row past the table stands for its last row.
class BarePlugin final : public standin::KeyOptions {
public:
    explicit BarePlugin(std::vector<std::int32_t> results = {1}, std::uint16_t presenceRow = 0);

    std::int32_t initialise(KeyFieldRow *table, std::uint32_t rowCount, std::uint16_t *presenceRow) noexcept override;

    PluginLibrary library;
    std::uint32_t calls = 0;
    std::uint32_t rowCount = 0;
    std::vector<KeyFieldRow> tableAtLoad; // as the plug-in handed it over

private:
    std::vector<std::int32_t> results_;
    std::uint16_t presenceRow_;
};

// One for all tests in which the key-field set-up succeeds.
[[nodiscard]] BarePlugin &sharedBarePlugin();

// Row r of the key record: a presence octet, which has a bit of another's in it, and eight octets for the value.
struct KeyRoom {
    static constexpr std::size_t rows = 160; // or fewer
    static constexpr std::uint8_t othersPresence = 0x41;
    static constexpr std::uint8_t ownPresence = 0x04;
    static constexpr std::uint8_t poison = 0xee;

    KeyRoom() {
        presence.fill(othersPresence);
        values.fill({poison, poison, poison, poison, poison, poison, poison, poison});
    }

    std::array<std::uint8_t, rows> presence;
    std::array<std::array<std::uint8_t, 8>, rows> values;
    std::array<std::uint8_t, 4096> addresses = {}; // of IPv6, for whom the context says so
};

// What the host could see during one call of the MD or TO output.
struct Seen {
    std::uint32_t id = 0; // field id or TO id
    std::string text;
    std::string state; // describe()
    std::uint32_t bitOrder = 0;
};

// cursor 9 left 232 advance 8 condition 1 block "IPv4 Header" field 152 "Internet Header Length" value 5 ranges 1/1
[[nodiscard]] std::string describe(const DecodeState &state);

// The same without the elements.
[[nodiscard]] std::string describeField(const DecodeState &state);

// The elements from the bottom to the top: "1 1 1 33".
[[nodiscard]] std::string stackText(const BitStack &stack);

// A packet and the records for one run of a pass.
class BareRun final : public standin::RunOperations {
public:
    explicit BareRun(const Octets &packet, const StateOptions &options = {}, BarePlugin &plugin = sharedBarePlugin());

    std::int32_t enter(Pass pass); // what the entry returned

    DecodeState &state() { return packet_.state(); }
    PreDecodeContext &context() { return record_.context; }
    [[nodiscard]] std::uint32_t contextBitsLeft(Pass pass) const;

    // The rows that are present and the octets stored, "7=01", and what was stored where it must not be.
    [[nodiscard]] std::string keyText() const;

    XtrContext xtr = {};
    KeyRoom keys;
    std::vector<Seen> seen;
    std::vector<LayerInfoRecord> layerInfo;
    std::vector<std::uint8_t> fieldRecords; // 0xee where nothing was written
    std::uint32_t layerInfoGrowths = 0;
    std::vector<std::uint32_t> modes; // of the calls of hd_PreDecode
    std::function<std::int32_t()> nextLayer = [this] { return take(state().bitsLeft); };

    std::function<void()> afterCall = [] {}; // of MD or TO output

    std::int32_t take(std::uint32_t bits); // as an owner does; returns 0

    std::int32_t addField(std::uint32_t outputRangeCount, const BitRange *ranges, const char *display,
                          std::uint32_t zero, const char *fieldName, std::uint32_t fieldId, std::uint32_t otherZero,
                          std::uint32_t bitOrder) noexcept override;
    void addDisplay(const char *display, std::uint32_t displayId) noexcept override;
    void growLayerInfo() noexcept override;
    std::int32_t preDecode(std::uint32_t mode) noexcept override;

private:
    BarePlugin &plugin_;
    GuardedOctets source_;
    GuardedOctets working_;
    PacketState packet_;
    standin::PreDecodeRun record_ = {};
};

} // namespace netfloor::test
