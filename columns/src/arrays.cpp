// SPDX-License-Identifier: MIT
#include "arrays.h"

#include <array>
#include <cstddef>
#include <memory>
#include <utility>

namespace netfloor {
namespace {

// Those who take a record may take a child or the dictionary out of it and release it by themselves: it then has no
// `release` left, which Owned looks at.
template <typename Record>
std::vector<Record *> pointersTo(std::vector<Owned<Record>> &children) {
    std::vector<Record *> pointers;
    pointers.reserve(children.size());
    for (Owned<Record> &child : children) {
        pointers.push_back(&child.get());
    }
    return pointers;
}

struct SchemaStorage {
    SchemaParts parts;
    std::vector<ArrowSchema *> children;
};

struct ArrayStorage {
    ArrayParts parts;
    std::vector<const void *> buffers;
    std::vector<ArrowArray *> children;
};

template <typename Storage, typename Record>
void release(Record *record) {
    const std::unique_ptr<Storage> storage(static_cast<Storage *>(record->private_data));
    record->release = nullptr;
}

// A buffer may be null only if it holds nothing, and not every reader expects that.
const void *startOf(const Buffer &buffer) {
    alignas(std::max_align_t) static constexpr std::array<std::uint8_t, 8> nothing = {};
    return buffer.empty() ? nothing.data() : buffer.data();
}

} // namespace

OwnedSchema makeSchema(SchemaParts parts) {
    auto storage = std::make_unique<SchemaStorage>();
    storage->parts = std::move(parts);
    storage->children = pointersTo(storage->parts.children);
    ArrowSchema schema = {};
    schema.format = storage->parts.format.c_str();
    schema.name = storage->parts.name.c_str();
    schema.flags = storage->parts.isNullable ? ARROW_FLAG_NULLABLE : 0;
    schema.n_children = static_cast<std::int64_t>(storage->children.size());
    schema.children = storage->children.data();
    schema.dictionary = storage->parts.dictionary ? &storage->parts.dictionary->get() : nullptr;
    schema.release = &release<SchemaStorage, ArrowSchema>;
    schema.private_data = storage.release();
    return OwnedSchema(schema);
}

OwnedArray makeArray(ArrayParts parts) {
    auto storage = std::make_unique<ArrayStorage>();
    storage->parts = std::move(parts);
    storage->children = pointersTo(storage->parts.children);
    const Buffer &validity = storage->parts.validity;
    storage->buffers.push_back(validity.empty() ? nullptr : validity.data());
    for (const Buffer &buffer : storage->parts.buffers) {
        storage->buffers.push_back(startOf(buffer));
    }
    ArrowArray array = {};
    array.length = storage->parts.length;
    array.null_count = storage->parts.nulls;
    array.n_buffers = static_cast<std::int64_t>(storage->buffers.size());
    array.buffers = storage->buffers.data();
    array.n_children = static_cast<std::int64_t>(storage->children.size());
    array.children = storage->children.data();
    array.dictionary = storage->parts.dictionary ? &storage->parts.dictionary->get() : nullptr;
    array.release = &release<ArrayStorage, ArrowArray>;
    array.private_data = storage.release();
    return OwnedArray(array);
}

} // namespace netfloor
