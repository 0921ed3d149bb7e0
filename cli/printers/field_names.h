// SPDX-License-Identifier: MIT
// What is behind the display ids of the TO pass.
#pragma once

#include <cstdint>
#include <set>
#include <span>
#include <string>
#include <unordered_map>

#include "netfloor-host/host.h"

namespace netfloor::cli {

struct DisplayName {
    std::string name;  // of the field, without the blanks around it
    bool isKey = true; // one of the key fields, by which the plug-in itself says what matters of a packet
};

// A short text bears no name, so the name behind an id is learned from the MD pass over the same packet, which
// reports the same fields in the same order.
class FieldNames {
public:
    explicit FieldNames(Host &host) : host_(host) {}

    // Makes find() good for all that the TO report `report` of `packet` shows.
    void learn(const Report &report, std::span<const std::uint8_t> packet);

    [[nodiscard]] const DisplayName &find(std::uint32_t displayId) const;

private:
    Host &host_;
    std::set<std::string, std::less<>> keyNames_;
    std::unordered_map<std::uint32_t, DisplayName> names_;
};

} // namespace netfloor::cli
