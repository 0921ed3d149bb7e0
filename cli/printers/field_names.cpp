// SPDX-License-Identifier: MIT
#include "printers/field_names.h"

#include <algorithm>
#include <utility>

#include "printers/printer.h"

namespace netfloor::cli {

void FieldNames::learn(const Report &report, std::span<const std::uint8_t> packet) {
    const bool known = std::all_of(report.displays.begin(), report.displays.end(),
                                   [this](const DisplayReport &display) { return names_.contains(display.displayId); });
    if (known) {
        return;
    }
    if (names_.empty()) {
        const auto names = keyFieldNames(host_);
        keyNames_.insert(names.begin(), names.end());
        names_[0] = {}; // what an owner of a next layer says
    }
    const Report named = host_.run(Pass::md, packet);
    for (std::size_t i = 0; i < report.displays.size() && i < named.fields.size(); ++i) {
        std::string name(withoutLeadingBlanks(named.fields[i].name));
        const bool isKey = keyNames_.contains(name);
        name.resize(name.find_last_not_of(' ') + 1);
        names_.try_emplace(report.displays[i].displayId, DisplayName{std::move(name), isKey});
    }
}

const DisplayName &FieldNames::find(std::uint32_t displayId) const {
    static const DisplayName unknown;
    const auto found = names_.find(displayId);
    return found == names_.end() ? unknown : found->second;
}

} // namespace netfloor::cli
