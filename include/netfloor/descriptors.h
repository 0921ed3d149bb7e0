/* SPDX-License-Identifier: MIT */
/*
 * The tables with which the plug-in describes itself: who it is, which fields it reports, how wide each is and where
 * its bits lie, what its values are called and how it is shown.
 *
 * A host asks for each table by its number; no packet and no set-up is needed:
 *
 *     const void *table;
 *     if (vx_DLLGetTable(NETFLOOR_TABLE_FIELDS, &table) == NETFLOOR_TABLE_FOUND) {
 *         for (const FieldDescriptor *row = table; row->flags != NETFLOOR_NO_FIELD; ++row) { ... }
 *     }
 *
 * The tables are constant and belong to the plug-in: they stay where they are until it is unloaded, may be read from
 * any thread, and are neither changed nor freed by a host. Texts are ASCII and zero-terminated. Words are in the byte
 * order of the machine, numbers in the layouts and probes in little-endian order. Indices count from 0, bits from 1.
 *
 * Three things are not in the tables. A host that needs them takes them from the reports of the MD pass:
 *
 *   - which field follows which, and under what condition;
 *   - the order of octets in a value, see "Layouts" below;
 *   - that the values of the ids 294 and 619 (Fragment Offset) are those of their bits times 8.
 */
#ifndef NETFLOOR_DESCRIPTORS_H
#define NETFLOOR_DESCRIPTORS_H

#include "plugin.h"

#ifdef __cplusplus
extern "C" {
#endif

/* Numbers of the tables, and what the two exports give for each. There is none for any other number. */
enum {
    NETFLOOR_TABLE_VERSION = 1,  /* both: a text, the version of this interface */
    NETFLOOR_TABLE_IDENTITY = 2, /* Ptr: the ProtocolIdentity; Table: its slots, 16 octets after */
    NETFLOOR_TABLE_FIELDS = 4,   /* Ptr: a probe; Table: FieldDescriptor rows, ended by a FieldTableEnd */
    NETFLOOR_TABLE_SAMPLE = 5,   /* Ptr: a probe; Table: its body, 16 octets after */
    NETFLOOR_TABLE_VALUES = 6,   /* Ptr: none; Table: ValueMapRow rows, ended by a row of zeros */
    NETFLOOR_TABLE_POOL = 7,     /* Ptr: none; Table: int32_t numbers of the value rows, without an end row */
    NETFLOOR_TABLE_TEXTS = 8,    /* Ptr: none; Table: const char * texts, ended by NETFLOOR_LAST_TEXT */
    NETFLOOR_TABLE_LAYOUTS = 9   /* Ptr: none; Table: octets, records of bit places, ended by a length of 0 */
};

/* Results of the two exports. */
#define NETFLOOR_TABLE_FOUND 0u
#define NETFLOOR_TABLE_UNKNOWN 0xd0410001u

/* The ends of the tables. */
#define NETFLOOR_LAST_FIELD "$_$LAST_FIELD$_$"
#define NETFLOOR_LAST_TEXT "$$_FINAL_STRING_$$"
#define NETFLOOR_NO_FIELD 0xffffffffu

/* Width of a field whose length the packet gives, and of an IPv6 address that is read in groups or nibbles. */
#define NETFLOOR_WIDTH_VARIABLE 0xffffffffu

/* Kinds of a value row. */
enum {
    NETFLOOR_VALUE_ONE = 1,      /* one value: pool[poolIndex] */
    NETFLOOR_VALUE_RANGE = 65536 /* pool[poolIndex] to pool[poolIndex + 1]; from above to: any other value */
};

/* Who the plug-in is: a head, then slots that hold a text or a number. */
typedef struct ProtocolIdentity {
    uint32_t head[4]; /* 7, 0, 0, 0 */
    union {
        const char *text;
        uintptr_t number;
    } slots[25]; /* 0 to 5: the standards' body, the protocol in short, in full, its standards, the network, what is
                    covered; 7, 20: the description of the grammar; 9, 10: release of its tools; 11 to 13: a value, the
                    name of the field that has it, a standards text; 19: the protocol's short name; 6, 8, 14, 15: empty
                    texts; 16 to 18 and 21 to 24: numbers, whose meaning is not published */
} ProtocolIdentity;

/*
 * One field. The rows are in the order of the grammar, and not in that of the ids.
 *
 * Flags, from the low octet up:
 *
 *   0   size class: 1 for up to 8 bits, 2 for up to 16, 3 for up to 32, 4 for more or NETFLOOR_WIDTH_VARIABLE
 *   1   3 for an address of fixed width, shown as a list of its elements, else 0
 *   2   1 for a key field, else 0
 *   3   5, but 6 for 396 and 398 to 408 (the TCP header from its 13th octet on), 489 and 490 (UDP length and checksum),
 *       848 and 852 (lengths of SCTP parameters); its meaning is not published, and no reader needs it
 */
typedef struct FieldDescriptor {
    uint32_t flags;          /* four octets, see "Flags" above; NETFLOOR_NO_FIELD in the row that ends the table */
    uint32_t fieldId;        /* the id under which the MD pass reports it, in one row only */
    uintptr_t keyIndex;      /* 1, 2, 3... for the key fields, 0 for the others; no index of a KeyFieldRow */
    const char *name;        /* as the MD pass reports it, without leading blanks; several fields may have one name,
                                and the TO pass reports all of them under the id of the first */
    const char *shortName;   /* the same without a trailing blank; for 243 a shorter one, which the passes report */
    int32_t valueCount;      /* rows of its list of value names; 0: none */
    int32_t valueStart;      /* index of the first of them; -1: none */
    uint32_t width;          /* 0xffff0000 plus the bits of its pieces times their count, or NETFLOOR_WIDTH_VARIABLE */
    uint32_t displayIndex;   /* index of its display line among the texts, see "Texts" below */
    int32_t unused1[6];      /* -1 */
    uint32_t templateOffset; /* octets from the start of the layouts to its record; fields of one layout share it */
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

/*
 * One name of one value, or of a range of values, of one field. Each field has a list of its own: its default row, if
 * it has one, and the others by ascending value. The name of a value, in the `valueCount` rows from `valueStart` on:
 *
 *   1. of the rows of kind NETFLOOR_VALUE_ONE the one whose number is the value;
 *   2. else the range that holds the value, ends included;
 *   3. else the default row, a range from above to (50 to 0);
 *   4. else the value has no name, and the name is empty.
 *
 * A name such as "%u", which some default rows have, is itself a format for the value.
 */
typedef struct ValueMapRow {
    uint32_t kind;         /* NETFLOOR_VALUE_ONE, NETFLOOR_VALUE_RANGE; 0 ends the table */
    uint32_t poolIndex;    /* index of its number, or of the first of two, in the value pool; not the value itself */
    uint32_t displayIndex; /* index of the name among the texts */
} ValueMapRow;

/*
 * Texts: each distinct display line and value name once. A display line is that of the MD pass, leading blanks
 * included. Its conversions, apart from which all is literal ("%u*4 octets" shows the value as it is):
 *
 *   %u %x %c        the value in decimal, in hexadecimal without leading zeros, as one character
 *   %-S             the name of the value
 *   %-["%x":"."]    a list: each element of the field in %u, %x or %c, with the text of the second quotes between them
 *   %-["%x"]        a list with nothing between its elements
 *
 * An element is a BitRange of the report. Where an address is shown in groups it is a group of 16 bits, its digits for
 * each octet the low nibble and then the high one.
 *
 * Layouts: where the bits of a field lie, a record each, one after the other without padding:
 *
 *   length      two octets: number of octets after them
 *   head        ff 02 55 01 04
 *   number      one octet: number of pieces, 1 to 4
 *   pieces      each a range, or for a single bit a constant: bits, of which 1 is the bit at the cursor
 *   count       how often the pieces repeat: a constant; a range, from least to most; a reference, as the packet says
 *   step        a constant: bits from one repeat to the next, and from the last one to where the cursor goes
 *   end         a reference: 1 where the count is a reference, else 0
 *
 *   constant    10 00 00 00 v: the number v
 *   range       05, and two constants: from, to; of a piece from above to: its bits are read in reverse order
 *   reference   08 n 00
 *
 * A record of length 3, ff 00 00, gives no place: its fields are shown ahead of their turn, or are addresses in groups.
 * The cursor moves on by the count times the step; but not for id 168, which is shown ahead: it stays, against its
 * record.
 *
 * Pieces and repeats are read in the order of the record, and the first read counts most in the value, with these
 * exceptions: of the pieces 9 to 16 and 1 to 8 the second is read first; the ids 201, 208, 209, 215, 216, 555, 895, 925
 * and 927 are read from the last octet to the first; in a piece of several octets (325, 472, 473) the last counts most.
 *
 * Probes: two records of known contents, by which a host with 32-bit pointers checks how the plug-in lays out records.
 * A head of four words (number of the table; size of the record in octets; offset of the pairs from its start; 60, the
 * octet that fills padding), a body with 0xa5a5a5a5 or 0x4b4b4b4b in each slot for a pointer, and to the end pairs of
 * words: offset of a slot, and of what it would point to.
 */

#if UINTPTR_MAX == 0xffffffffu
NETFLOOR_RECORD_SIZE(ProtocolIdentity, 116);
NETFLOOR_FIELD_OFFSET(ProtocolIdentity, head, 0);
NETFLOOR_FIELD_OFFSET(ProtocolIdentity, slots, 16);

NETFLOOR_RECORD_SIZE(FieldDescriptor, 76);
NETFLOOR_FIELD_OFFSET(FieldDescriptor, flags, 0);
NETFLOOR_FIELD_OFFSET(FieldDescriptor, fieldId, 4);
NETFLOOR_FIELD_OFFSET(FieldDescriptor, keyIndex, 8);
NETFLOOR_FIELD_OFFSET(FieldDescriptor, name, 12);
NETFLOOR_FIELD_OFFSET(FieldDescriptor, shortName, 16);
NETFLOOR_FIELD_OFFSET(FieldDescriptor, valueCount, 20);
NETFLOOR_FIELD_OFFSET(FieldDescriptor, valueStart, 24);
NETFLOOR_FIELD_OFFSET(FieldDescriptor, width, 28);
NETFLOOR_FIELD_OFFSET(FieldDescriptor, displayIndex, 32);
NETFLOOR_FIELD_OFFSET(FieldDescriptor, unused1, 36);
NETFLOOR_FIELD_OFFSET(FieldDescriptor, templateOffset, 60);
NETFLOOR_FIELD_OFFSET(FieldDescriptor, unused2, 64);

NETFLOOR_RECORD_SIZE(FieldTableEnd, 76);
NETFLOOR_FIELD_OFFSET(FieldTableEnd, flags, 0);
NETFLOOR_FIELD_OFFSET(FieldTableEnd, fieldId, 4);
NETFLOOR_FIELD_OFFSET(FieldTableEnd, marker, 8);
NETFLOOR_FIELD_OFFSET(FieldTableEnd, words, 12);
NETFLOOR_FIELD_OFFSET(FieldTableEnd, counts, 20);
NETFLOOR_FIELD_OFFSET(FieldTableEnd, width, 28);
NETFLOOR_FIELD_OFFSET(FieldTableEnd, zero, 32);

NETFLOOR_RECORD_SIZE(ValueMapRow, 12);
NETFLOOR_FIELD_OFFSET(ValueMapRow, kind, 0);
NETFLOOR_FIELD_OFFSET(ValueMapRow, poolIndex, 4);
NETFLOOR_FIELD_OFFSET(ValueMapRow, displayIndex, 8);
#endif
NETFLOOR_ASSERT(sizeof(FieldTableEnd) == sizeof(FieldDescriptor), "the last row is as long as the others");

/*
 * Store the address of a table at `out`, which must not be null, and return NETFLOOR_TABLE_FOUND; or store null and
 * return NETFLOOR_TABLE_UNKNOWN when there is no table of this number. They may be called at any time, in any order.
 */
uint32_t NETFLOOR_CDECL vx_DLLGetPtr(int32_t index, const void **out);
uint32_t NETFLOOR_CDECL vx_DLLGetTable(int32_t index, const void **out);

/* The same as a type, for what a host resolves by name. */
typedef uint32_t(NETFLOOR_CDECL *NetfloorGetTable)(int32_t index, const void **out);

#ifdef __cplusplus
}
#endif

#endif
