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

// Whether the name of the innermost block, as the plug-in has just written it, is a stored one, which came from the
// same buffer. By words of 8 octets: the plug-in writes names in pieces, and to load more than one of these at once, as
// strcmp does, waits until they are in the cache.
[[nodiscard]] inline bool isBlockName(const char *written, std::string_view stored) {
    using Word = std::uint64_t;
    const std::size_t octets = stored.size() + 1; // with the zero
    if (octets < sizeof(Word)) {
        return std::memcmp(written, stored.data(), octets) == 0;
    }
    const auto differs = [&](std::size_t at) {
        Word left;
        Word right;
        std::memcpy(&left, written + at, sizeof left);
        std::memcpy(&right, stored.data() + at, sizeof right);
        return left != right;
    };
    const std::size_t last = octets - sizeof(Word); // overlaps the word before
    for (std::size_t at = 0; at < last; at += sizeof(Word)) {
        if (differs(at)) {
            return false;
        }
    }
    return !differs(last);
}

class FieldNames {
public:
    // A plug-in without field tables has no known ids.
    explicit FieldNames(NetfloorGetTable getTable);

    // Ids that the tables do not know share one element.
    [[nodiscard]] NamedField &find(std::uint32_t id) { return fields_[id < count_ ? id : 0]; }

    // The stored text that equals `name`. A field is usually read in the same block as before, so that one comparison
    // is enough.
    [[nodiscard]] std::string_view blockName(NamedField &field, const char *name) {
        const std::string_view last(field.lastBlock, field.lastBlockSize);
        return isBlockName(name, last) ? last : findBlockName(field, name);
    }

private:
    void readTable(NetfloorGetTable getTable);
    std::string_view findBlockName(NamedField &field, std::string_view name);

    std::vector<NamedField> fields_; // by id; all unknown ids share the first
    std::uint32_t count_ = 0;        // of them: a vector computes it from its pointers
    std::set<std::string, std::less<>> blockNames_;
};

} // namespace netfloor
