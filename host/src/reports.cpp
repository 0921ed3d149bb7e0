// SPDX-License-Identifier: MIT
#include "netfloor-host/reports.h"

#include <algorithm>

namespace netfloor {
namespace {

template <typename Element>
const Element *firstOfName(const std::vector<Element> &elements, std::string_view name) {
    const auto found = std::ranges::find(elements, name, &Element::name);
    return found == elements.end() ? nullptr : &*found;
}

} // namespace

std::string Report::path(const FieldReport &field, std::string_view separator) const {
    std::vector<std::string_view> names;
    for (std::size_t block = field.block; block != Block::none; block = blocks[block].parent) {
        if (!blocks[block].name.empty()) {
            names.push_back(blocks[block].name);
        }
    }
    std::string path;
    for (std::size_t i = names.size(); i-- > 0;) {
        path.append(names[i]).append(i == 0 ? std::string_view() : separator);
    }
    return path;
}

const FieldReport *Report::field(std::string_view name) const {
    return firstOfName(fields, name);
}

const KeyValue *Report::key(std::string_view name) const {
    return firstOfName(keys, name);
}

} // namespace netfloor
