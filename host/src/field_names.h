// SPDX-License-Identifier: MIT
// Names of fields and of blocks. Those of fields are read once from the plug-in's tables. Those of blocks come with
// each report, and each is stored when it is first seen.
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

// What the field tables say of an id. Each is in one line of the cache, since one is read for each field.
struct alignas(32) NamedField {
    std::string_view name;
    const char *lastBlock = ""; // the name of the block in which the field was last read
    std::uint32_t lastBlockSize = 0;
    bool isKey = false;
    bool isKnown = false;
};

class FieldNames {
public:
    // A plug-in without field tables has no known ids.
    explicit FieldNames(NetfloorGetTable getTable);

    // Ids that the tables do not know share one element.
    [[nodiscard]] NamedField &find(std::uint32_t id) { return fields_[id < fields_.size() ? id : 0]; }

    // The stored text that equals `name`. A field is usually read in the same block as before, so that one comparison
    // is enough.
    [[nodiscard]] std::string_view blockName(NamedField &field, const char *name) {
        if (std::strcmp(field.lastBlock, name) != 0) {
            findBlockName(field, name);
        }
        return {field.lastBlock, field.lastBlockSize};
    }

private:
    void findBlockName(NamedField &field, std::string_view name);

    std::vector<NamedField> fields_; // by id; all unknown ids share the first
    std::set<std::string, std::less<>> blockNames_;
};

} // namespace netfloor
