// SPDX-License-Identifier: MIT
#include "netfloor-host/layer_fields.h"

#include <algorithm>
#include <map>

namespace netfloor {

LayerFieldMap::LayerFieldMap(std::span<const FieldDescription> fields) : entries_(1) {
    std::multimap<std::string_view, const FieldDescription *> byName;
    for (const FieldDescription &field : fields) {
        byName.emplace(field.name, &field);
    }
    for (const LayerFieldSource &row : layerFieldSources()) {
        const auto fits = [&row](const auto &named) { return row.field.fits(*named.second); };
        const auto [first, last] = byName.equal_range(row.field.name);
        const auto fitting = std::find_if(first, last, fits);
        if (std::count_if(first, last, fits) != 1) {
            mismatches_.push_back(std::string(row.name) + ": '" + std::string(row.field.name) + "' is " +
                                  (fitting == last ? "no field" : "the name of several fields") + " of the plug-in");
            continue;
        }
        const FieldDescription *const found = fitting->second;
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
