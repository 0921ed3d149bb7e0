// SPDX-License-Identifier: MIT
// Runs one pass over one packet at a time, and answers the plug-in's calls. The storage is kept from packet to packet.
#pragma once

#include <algorithm>
#include <array>
#include <cstdint>
#include <cstring>
#include <exception>
#include <memory>
#include <optional>
#include <span>
#include <string_view>
#include <tuple>
#include <vector>

#include "block_tracker.h"
#include "cut_packet.h"
#include "field_names.h"
#include "key_record.h"
#include "links.h"
#include "loaded_plugin.h"
#include "netfloor-host/plugin_host.h"
#include "netfloor-host/testing.h"

namespace netfloor {

class PacketRun final : public standin::RunOperations {
public:
    PacketRun(LoadedPlugin &plugin, FieldNames &names);

    // `test` is null, or the same object as `options`.
    Ending run(Pass pass, std::span<const std::uint8_t> packet, const OwnerRegistry &owners, Sink &sink,
               const RunOptions &options, const TestRunOptions *test);

    // The calls of the plug-in, which come through the stand-ins. No exception may pass through the plug-in, so the
    // first one is kept until the plug-in has returned. Nothing is reported after it.
    std::int32_t addField(std::uint32_t outputRangeCount, const BitRange *ranges, const char *display,
                          std::uint32_t zero, const char *fieldName, std::uint32_t fieldId, std::uint32_t otherZero,
                          std::uint32_t bitOrder) noexcept override;
    void addDisplay(const char *display, std::uint32_t displayId) noexcept override;
    void growLayerInfo() noexcept override;
    std::int32_t preDecode(std::uint32_t mode) noexcept override;

private:
    friend class NextLayer;

    // The plug-in writes the head of the current record of this size. The host reads it at once, so that two records
    // in turn are enough for a packet of any length.
    static constexpr std::size_t fieldRecordOctets = 1000;
    static constexpr std::uint32_t fieldRecordCount = 2;
    static constexpr std::size_t headOctets = std::tuple_size_v<decltype(FieldView::recordHead)>;
    static constexpr std::uint8_t untouchedOctet = 0xff;

    // One pass over the packet in `cut_`.
    std::int32_t runPass(Pass pass, Sink &sink, const TestRunOptions *test);
    Ending runCut(Pass pass, Sink &sink, const TestRunOptions *test);
    void prepare(const TestRunOptions *test);
    void prepareContext(const TestRunOptions *test);
    void prepareKeyContext(const TestRunOptions *test);
    [[nodiscard]] std::int32_t enter();
    [[nodiscard]] std::int32_t enterExtract();
    [[nodiscard]] bool enterFromOwner();
    [[nodiscard]] Handled handOff();
    [[nodiscard]] HandOff describeHandOff() const;
    [[nodiscard]] DecodeState &state() { return *state_; }
    [[nodiscard]] const DecodeState &state() const { return *state_; }
    [[nodiscard]] const LayerFrame &frame() const { return state_->layerFrames[state_->layerIndex]; }
    void openLayer(std::uint32_t decoderId);
    void closeLayer();
    void addOwnEntry(std::uint32_t bits, std::string_view name, std::string_view longText, std::string_view shortText);
    [[nodiscard]] std::uint8_t *fieldRecordHead() {
        return fieldRecords_.data() + preDecode_.context.fieldRecordCount * fieldRecordOctets;
    }
    // Fills the head of the current field record, so that the host sees what the plug-in did not write.
    void fillFieldRecordHead() { std::memset(fieldRecordHead(), untouchedOctet, headOctets); }
    void nextFieldRecord() {
        preDecode_.context.fieldRecordCount = (preDecode_.context.fieldRecordCount + 1) % fieldRecordCount;
        fillFieldRecordHead();
    }
    NamedField &takeField(std::uint32_t outputRangeCount, const BitRange *ranges, const char *display,
                          const char *fieldName, std::uint32_t fieldId, std::uint32_t bitOrder);
    std::int32_t addChosenField(std::uint32_t outputRangeCount, const BitRange *ranges, const char *display,
                                std::uint32_t zero, const char *fieldName, std::uint32_t fieldId,
                                std::uint32_t otherZero, std::uint32_t bitOrder) noexcept;
    void moveToBlock(NamedField &field);
    void reportField(NamedField &field);
    [[nodiscard]] bool isWanted(std::uint32_t fieldId) const {
        return wantedFields_.empty() || (fieldId < wantedFields_.size() && wantedFields_[fieldId] != 0);
    }
    // Whether a field is there to be reported; the first that is not is told to the sink.
    [[nodiscard]] bool isCaptured(std::string_view name, std::span<const BitRange> ranges);
    [[nodiscard]] std::uint32_t capturedBitsLeft() const {
        return cut_.isCut() ? std::min(state().bitsLeft, cut_.bitsFrom(state().cursor)) : state().bitsLeft;
    }
    void keepException() noexcept;
    Ending finish(std::int32_t result, const KeyRecord *otherKeys = nullptr);

    LoadedPlugin &plugin_;
    FieldNames &names_;
    PacketState reused_;
    std::optional<PacketState> exact_; // of a test
    KeyRecord keyRecord_;
    std::optional<KeyRecord> otherKeys_; // of a packet that is cut, whose other octets had another value
    CutPacket cut_;
    struct FieldRead {
        std::string_view name;
        std::uint32_t cursor;
        friend bool operator==(const FieldRead &, const FieldRead &) = default;
    };
    std::vector<FieldRead> reading_; // of a packet that is cut, up to the first field that was not captured
    std::size_t fieldsRead_ = 0;
    bool isFirstReading_ = false;
    std::array<std::uint8_t, fieldRecordCount *fieldRecordOctets> fieldRecords_ = {};
    std::vector<LayerInfoRecord> layerInfo_;
    BlockTracker blocks_;

    // The current pass.
    Pass pass_ = Pass::md;
    const OwnerRegistry *owners_ = nullptr;
    Sink *sink_ = nullptr;
    bool withBlocks_ = true; // the sink wants them
    bool withBlockNames_ = true;
    std::span<const std::uint8_t> wantedFields_; // empty: all
    bool reportsAll_ = true; // all fields are wanted, none is compared, and nothing was thrown: one test for each field
    FieldView view_;         // of the field at hand; to clear a new one takes as long as all else that is done for it
    RunOptions options_;
    bool followStop_ = true;
    bool isReadToCut_ = false;             // a field was not captured
    std::uint32_t soundFlags_ = 0;         // MV: those that were raised before
    std::span<const std::uint8_t> packet_; // as far as an IP header can reach
    std::uint32_t bitsBeyond_ = 0;         // what the packet holds after that
    DecodeState *state_ = nullptr;
    standin::PreDecodeRun preDecode_ = {};
    XtrContext xtr_ = {};
    std::uint32_t handOffDepth_ = 0;
    std::uint32_t reentries_ = 0;
    std::exception_ptr exception_;
};

} // namespace netfloor
