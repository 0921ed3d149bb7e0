// SPDX-License-Identifier: MIT
// From a packet to what is printed of it. All that one thread needs for that: packets may come from anywhere in a
// capture, and in any order.
#pragma once

#include <memory>
#include <optional>
#include <string>

#include "netfloor-capture/time_text.h"
#include "netfloor-host/condition.h"
#include "netfloor-host/layers.h"
#include "options.h"
#include "output.h"
#include "printers/printer.h"

namespace netfloor::cli {

class PacketDecoder {
public:
    // The library must not serve another thread.
    PacketDecoder(const Options &options, PluginLibrary library, Output &out);

    // Prints the packet if it meets the condition, and gives then what it is. `file` is told where there are several.
    std::optional<NotIp> decode(const CapturedPacket &packet, const TimeStart &start, std::string_view file);

    [[nodiscard]] Printer &printer() { return *printer_; }

private:
    [[nodiscard]] bool meetsCondition(const PacketToPrint &packet);

    Host host_;
    std::optional<Condition> condition_;
    std::optional<LayerView> layers_; // for the condition
    std::unique_ptr<Printer> printer_;
    TimeText times_;
    NotIp other_; // of the last packet without IP, and its text
    std::string otherText_;
};

} // namespace netfloor::cli
