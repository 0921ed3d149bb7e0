// SPDX-License-Identifier: MIT
#include "netfloor-host/layer_fields.h"

#include <algorithm>

namespace netfloor {

LayerFieldMap::LayerFieldMap(std::span<const FieldDescription> fields) : entries_(1) {
    for (const LayerFieldSource &row : layerFieldSources()) {
        const auto fits = [&row](const FieldDescription &field) { return row.field.fits(field); };
        const auto found = std::ranges::find_if(fields, fits);
        if (found == fields.end() || std::any_of(found + 1, fields.end(), fits)) {
            mismatches_.push_back(std::string(row.name) + ": '" + std::string(row.field.name) + "' is " +
                                  (found == fields.end() ? "no field" : "the name of several fields") +
                                  " of the plug-in");
            continue;
        }
        if (found->id >= entries_.size()) {
            entries_.resize(found->id + 1);
        }
        Entry &entry = entries_[found->id];
        if (entry.isKnown) {
            mismatches_.push_back(std::string(row.name) + ": '" + std::string(row.field.name) + "' has another name");
        }
        entry = {findLayerField(row.name).value(), row.value, true, row.opensLayer};
    }
    for (const Entry &entry : entries_) {
        known_.push_back(entry.isKnown ? 1 : 0);
    }
}

} // namespace netfloor
