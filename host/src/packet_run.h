// SPDX-License-Identifier: MIT
// One pass over one packet: what stands behind the plug-in's calls while it runs.
#pragma once

#include <array>
#include <cstdint>
#include <exception>
#include <optional>
#include <span>
#include <string_view>
#include <vector>

#include "block_tracker.h"
#include "key_record.h"
#include "links.h"
#include "loaded_plugin.h"
#include "netfloor-host/host.h"

namespace netfloor {

class PacketRun final : public standin::RunOperations {
public:
    PacketRun(LoadedPlugin &plugin, const OwnerRegistry &owners, Pass pass, std::span<const std::uint8_t> packet,
              const RunOptions &options);

    [[nodiscard]] Report run();

    // What the plug-in calls, by way of the stand-ins. No exception may pass the plug-in, so each is kept until
    // it has returned.
    void addField(std::uint32_t outputRangeCount, const BitRange *ranges, const char *display, const char *fieldName,
                  std::uint32_t fieldId, std::uint32_t bitOrder) noexcept override;
    void addDisplay(const char *display, std::uint32_t displayId) noexcept override;
    void growLayerInfo() noexcept override;
    std::int32_t preDecode(std::uint32_t mode) noexcept override;

private:
    friend class NextLayer;

    // The plug-in gets records of this size and marks the one that is current; the host reads the head at
    // once, so that two in turn are enough for a packet of any length.
    static constexpr std::size_t fieldRecordOctets = 1000;
    static constexpr std::uint32_t fieldRecordCount = 2;

    [[nodiscard]] std::int32_t enter();
    [[nodiscard]] std::int32_t enterExtract();
    [[nodiscard]] bool enterFromOwner();
    [[nodiscard]] Handled handOff();
    [[nodiscard]] HandOff describeHandOff() const;
    [[nodiscard]] const LayerFrame &frame() const;
    void openLayer(std::uint32_t decoderId);
    void closeLayer();
    void addOwnEntry(std::uint32_t bits, std::string_view name, std::string_view longText, std::string_view shortText);
    void markFieldRecord();
    void keepException() noexcept;
    void finish();

    LoadedPlugin &plugin_;
    const OwnerRegistry &owners_;
    Pass pass_;
    RunOptions options_;
    PacketState packet_;
    standin::PreDecodeRun preDecode_ = {};
    XtrContext xtr_ = {};
    std::optional<KeyRecord> keyRecord_; // XTR
    std::array<std::uint8_t, fieldRecordCount *fieldRecordOctets> fieldRecords_ = {};
    std::vector<LayerInfoRecord> layerInfo_;
    BlockTracker blocks_;
    std::uint32_t handOffDepth_ = 0;
    std::uint32_t reentries_ = 0;
    std::exception_ptr exception_;
    Report report_;
};

} // namespace netfloor
