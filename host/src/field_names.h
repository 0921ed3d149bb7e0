// SPDX-License-Identifier: MIT
// Names, resolved once: those of fields from the plug-in's tables, and those of blocks, which come with each report,
// from what was seen before.
#pragma once

#include <cstdint>
#include <cstring>
#include <functional>
#include <set>
#include <string>
#include <string_view>
#include <vector>

#include <netfloor/descriptors.h>

namespace netfloor {

// What the field tables say of an id.
struct NamedField {
    std::string_view name;
    bool isKey = false;
    bool isKnown = false;
    const char *lastBlock = ""; // the name of the block in which the field stood last
};

class FieldNames {
public:
    // A plug-in without field tables has no known ids.
    explicit FieldNames(NetfloorGetTable getTable);

    // Ids that the tables do not know share one element.
    [[nodiscard]] NamedField &find(std::uint32_t id) { return fields_[id < fields_.size() ? id : 0]; }

    // The same text, at a place that all equal ones share. A field usually stands in the same block, so that one
    // comparison is enough.
    [[nodiscard]] const char *blockName(NamedField &field, const char *name) {
        return std::strcmp(field.lastBlock, name) == 0 ? field.lastBlock : findBlockName(field, name);
    }

private:
    [[nodiscard]] const char *findBlockName(NamedField &field, std::string_view name);

    std::vector<NamedField> fields_; // by id; the first stands for all unknown ones
    std::set<std::string, std::less<>> blockNames_;
};

} // namespace netfloor
