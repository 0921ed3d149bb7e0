// SPDX-License-Identifier: MIT
// The records of the Arrow C data interface and C stream interface, by which programs hand over columns without a
// common library (arrow.apache.org/docs/format/CDataInterface.html and CStreamInterface.html). The guards are those
// that every copy of these records has, so that several may be included.
#pragma once

#include <stdint.h> // NOLINT(modernize-deprecated-headers): the records are C

#ifdef __cplusplus
extern "C" {
#endif

#ifndef ARROW_C_DATA_INTERFACE
#define ARROW_C_DATA_INTERFACE

#define ARROW_FLAG_DICTIONARY_ORDERED 1
#define ARROW_FLAG_NULLABLE 2
#define ARROW_FLAG_MAP_KEYS_SORTED 4

// A type with a name. Whoever holds the record calls `release` once, which sets it to null.
struct ArrowSchema {
    const char *format; // "I": 32 bits without a sign, "u": UTF-8, "+s": a record of the children
    const char *name;
    const char *metadata;
    int64_t flags;
    int64_t n_children;
    struct ArrowSchema **children;
    struct ArrowSchema *dictionary; // the type of the values where the array has their numbers
    void (*release)(struct ArrowSchema *);
    void *private_data;
};

// The values of such a type.
struct ArrowArray {
    int64_t length;
    int64_t null_count;
    int64_t offset;
    int64_t n_buffers;
    int64_t n_children;
    const void **buffers; // the first has a bit for each value that is present, or is null if all are
    struct ArrowArray **children;
    struct ArrowArray *dictionary;
    void (*release)(struct ArrowArray *);
    void *private_data;
};

#endif

#ifndef ARROW_C_STREAM_INTERFACE
#define ARROW_C_STREAM_INTERFACE

// Arrays of one type, one after the other. The functions give 0 or a number of errno.
struct ArrowArrayStream {
    int (*get_schema)(struct ArrowArrayStream *, struct ArrowSchema *out);
    int (*get_next)(struct ArrowArrayStream *, struct ArrowArray *out); // at the end, an array without `release`
    const char *(*get_last_error)(struct ArrowArrayStream *);           // valid until the next call
    void (*release)(struct ArrowArrayStream *);
    void *private_data;
};

#endif

#ifdef __cplusplus
}
#endif
