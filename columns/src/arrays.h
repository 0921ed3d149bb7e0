// SPDX-License-Identifier: MIT
// Arrow records that own what they point to.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "netfloor-columns/arrow_abi.h"

namespace netfloor {

// Releases a record when it is dropped, unless it was taken.
template <typename Record>
class Owned {
public:
    Owned() = default;
    explicit Owned(const Record &record) : record_(record) {}
    Owned(Owned &&other) noexcept : record_(other.take()) {}
    Owned &operator=(Owned &&other) noexcept {
        if (this != &other) {
            drop();
            record_ = other.take();
        }
        return *this;
    }
    Owned(const Owned &) = delete;
    Owned &operator=(const Owned &) = delete;
    ~Owned() { drop(); }

    [[nodiscard]] Record &get() { return record_; }
    [[nodiscard]] Record take() {
        const Record taken = record_;
        record_ = {};
        return taken;
    }

private:
    void drop() {
        if (record_.release != nullptr) {
            record_.release(&record_);
        }
    }

    Record record_ = {};
};

using OwnedSchema = Owned<ArrowSchema>;
using OwnedArray = Owned<ArrowArray>;

using Buffer = std::vector<std::uint8_t>;

struct SchemaParts {
    std::string format;
    std::string name = {};
    bool isNullable = false;
    std::vector<OwnedSchema> children = {};
    std::optional<OwnedSchema> dictionary = {};
};
[[nodiscard]] OwnedSchema makeSchema(SchemaParts parts);

struct ArrayParts {
    std::int64_t length = 0;
    std::int64_t nulls = 0;
    Buffer validity = {};             // empty: all values are there
    std::vector<Buffer> buffers = {}; // after the validity
    std::vector<OwnedArray> children = {};
    std::optional<OwnedArray> dictionary = {};
};
[[nodiscard]] OwnedArray makeArray(ArrayParts parts);

} // namespace netfloor
