// SPDX-License-Identifier: MIT
// The columns of `keys`: which there are, and what a row has in them.
#pragma once

#include <optional>
#include <span>
#include <string>
#include <string_view>
#include <vector>

#include "netfloor-host/layers.h"
#include "output.h"

namespace netfloor::cli {

// Text as CSV has it (RFC 4180).
void writeCsv(Output &out, std::string_view text);

struct KeyColumn {
    std::string name;
    // Of one layer, the first that is there: the ports have one column for all transports.
    std::vector<LayerField> fields;
};

// The columns of these names; without names the usual ones. Throws UsageError for a name that is none.
[[nodiscard]] std::vector<KeyColumn> keyColumns(const std::vector<std::string> &names, bool perChunk);

class KeyRows {
public:
    KeyRows(Output &out, std::span<const KeyColumn> columns, bool raw) : out_(out), columns_(columns), raw_(raw) {}

    // Values of an IP layer, a comma in front of each. Of several chunks all values, with ';' between them; with
    // `chunk`, those of this one.
    void write(const LayerView &view, std::uint16_t ipLayer, const Layer *chunk) const;
    void writeNone() const { out_.repeated(',', columns_.size()); }

private:
    void writeValue(const LayerView &view, const Layer &layer, LayerField field) const;

    Output &out_;
    std::span<const KeyColumn> columns_;
    bool raw_;
};

} // namespace netfloor::cli
