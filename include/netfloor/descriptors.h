/* SPDX-License-Identifier: MIT */
/*
 * The tables with which the plug-in describes itself: who it is, which fields it reports, how wide
 * each is and where its bits lie, what its values are called and how it is shown.
 *
 * A host gets them by number from vx_DLLGetPtr and vx_DLLGetTable, at any time and from any thread.
 * They are constant, belong to the plug-in and live as long as it is loaded.
 *
 * To find the name of a value in a field's list: take the `valueCount` rows from `valueStart` on; of
 * the rows of one value, the one whose number in the value pool is the value; else, of the ranges,
 * the one that holds it; else the default row, if there is one; else the name is empty. A name
 * such as "%u" is itself a format for the value.
 */
#ifndef NETFLOOR_DESCRIPTORS_H
#define NETFLOOR_DESCRIPTORS_H

#include "plugin.h"

#ifdef __cplusplus
extern "C" {
#endif

/* Numbers of the tables. */
enum {
    NETFLOOR_TABLE_VERSION = 1,  /* text: the version of this interface */
    NETFLOOR_TABLE_IDENTITY = 2, /* Ptr: ProtocolIdentity; Table: its slots */
    NETFLOOR_TABLE_FIELDS = 4,   /* Table: FieldDescriptor rows, and a row that ends them; Ptr: a probe */
    NETFLOOR_TABLE_SAMPLE = 5,   /* Ptr: a probe; Table: its body */
    NETFLOOR_TABLE_VALUES = 6,   /* Table: ValueMapRow rows, ended by a row of zeros */
    NETFLOOR_TABLE_POOL = 7,     /* Table: int32_t numbers, which the value rows refer to */
    NETFLOOR_TABLE_TEXTS = 8,    /* Table: const char* texts, ended by NETFLOOR_LAST_TEXT */
    NETFLOOR_TABLE_LAYOUTS = 9   /* Table: octets, records of bit places, ended by a zero length */
};

/* Results of the two exports. */
#define NETFLOOR_TABLE_FOUND 0u
#define NETFLOOR_TABLE_UNKNOWN 0xd0410001u

/* What ends the tables. */
#define NETFLOOR_LAST_FIELD "$_$LAST_FIELD_$_$"
#define NETFLOOR_LAST_TEXT "$$_FINAL_STRING_$$"
#define NETFLOOR_NO_FIELD 0xffffffffu

/* Width of a field whose length the packet tells. */
#define NETFLOOR_WIDTH_VARIABLE 0xffffffffu

/* Kinds of a value row. */
enum {
    NETFLOOR_VALUE_ONE = 1,      /* one value */
    NETFLOOR_VALUE_RANGE = 65536 /* two numbers of the pool: from, to; from above to: any other value */
};

/* Who the plug-in is: a head, then slots that hold a text or a number. */
typedef struct ProtocolIdentity {
    uint32_t head[4]; /* 7, 0, 0, 0 */
    union {
        const char *text;
        uintptr_t number;
    } slots[25]; /* texts, but for the numbers in 16 to 18 and 21 to 24 */
} ProtocolIdentity;

/* One field. */
typedef struct FieldDescriptor {
    uint32_t flags;          /* octet 0: size class 1 to 4 (up to 8, 16, 32 bits, more or variable); octet 1:
                                3 for an address of fixed width, shown as a list; octet 2: 1 for a key field */
    uint32_t fieldId;        /* the id under which the MD pass reports it */
    uintptr_t keyIndex;      /* number among the key fields, from 1; 0 for the others */
    const char *name;        /* name of the field, without the blanks in front */
    const char *shortName;   /* the same without the blanks behind, or a shorter one */
    int32_t valueCount;      /* rows of its list of value names; 0: none */
    int32_t valueStart;      /* index of the first of them; -1: none */
    uint32_t width;          /* 0xffff0000 plus the bits, or NETFLOOR_WIDTH_VARIABLE */
    uint32_t displayIndex;   /* index of its display line among the texts */
    int32_t unused1[6];      /* -1 */
    uint32_t templateOffset; /* octets from the start of the layouts to its record */
    int32_t unused2[3];      /* -1 */
} FieldDescriptor;

/* The row that ends the field table: laid out as a FieldDescriptor, with a text in the place of a number. */
typedef struct FieldTableEnd {
    uint32_t flags;     /* NETFLOOR_NO_FIELD */
    uint32_t fieldId;   /* 0xffff */
    const char *marker; /* NETFLOOR_LAST_FIELD */
    uintptr_t words[2]; /* 0, 0xffff */
    uint32_t counts[2]; /* 0xffff, 0xffff */
    uint32_t width;     /* 0xffffffff */
    uint32_t zero[11];  /* 0 */
} FieldTableEnd;

/* One name of one value, or of a range of values, of one field. */
typedef struct ValueMapRow {
    uint32_t kind;         /* NETFLOOR_VALUE_ONE, NETFLOOR_VALUE_RANGE; 0 ends the table */
    uint32_t poolIndex;    /* index of its number, or of the first of two, in the value pool */
    uint32_t displayIndex; /* index of the name among the texts */
} ValueMapRow;

#if UINTPTR_MAX == 0xffffffffu
NETFLOOR_RECORD_SIZE(FieldDescriptor, 76);
NETFLOOR_RECORD_SIZE(ProtocolIdentity, 116);
#endif
#ifdef __cplusplus
static_assert(sizeof(FieldTableEnd) == sizeof(FieldDescriptor), "the last row is as long as the others");
#else
_Static_assert(sizeof(FieldTableEnd) == sizeof(FieldDescriptor), "the last row is as long as the others");
#endif

/*
 * Stores the address of a table at `out`. Returns NETFLOOR_TABLE_FOUND, or NETFLOOR_TABLE_UNKNOWN with
 * null stored when there is no table of this number.
 */
uint32_t NETFLOOR_CDECL vx_DLLGetPtr(int32_t index, const void **out);
uint32_t NETFLOOR_CDECL vx_DLLGetTable(int32_t index, const void **out);

/* The same as a type, for what a host resolves by name. */
typedef uint32_t(NETFLOOR_CDECL *NetfloorGetTable)(int32_t index, const void **out);

#ifdef __cplusplus
}
#endif

#endif
