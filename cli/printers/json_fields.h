// SPDX-License-Identifier: MIT
// The fields of a packet as JSON, written while the MD pass goes.
#pragma once

#include <cstdint>
#include <span>
#include <string_view>

#include "gaps.h"
#include "netfloor-analysis/rows.h"
#include "netfloor-host/field_tables.h"
#include "netfloor-host/plugin_host.h"
#include "output.h"

namespace netfloor::cli {

class JsonFields final : private Sink {
public:
    JsonFields(Host &host, Output &out) : host_(host), tables_(host.fieldTables()), out_(out) {}

    // Objects with commas between them, also of the packets inside the packet; nothing without IP.
    void write(const PacketInput &packet);

private:
    // Octets of data come as a field each. A few stay so; of more, all are taken back and become one.
    struct Run {
        std::uint32_t id = 0;
        std::string_view name;
        std::uint32_t first = 0; // octet
        std::uint32_t octets = 0;
        Output::Mark value = 0; // where the first one has its value
    };

    [[nodiscard]] bool wantsBlocks() const override { return false; }
    void field(const FieldView &field) override;
    void end(const PassEnd &end) override;

    [[nodiscard]] bool continuesRun(const FieldView &field) const;
    void endRun();
    void writeValue(const FieldView &field, const FieldDescription *description);
    void writeBits(OctetSpan octets);
    void writeBits(std::span<const BitRange> ranges);

    Host &host_;
    const FieldTables &tables_;
    Output &out_;
    std::span<const std::uint8_t> packet_; // of the current pass
    std::uint32_t offset_ = 0;             // of it in the outermost packet
    bool isFirst_ = true;
    Run run_;
};

} // namespace netfloor::cli
