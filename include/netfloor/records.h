/* SPDX-License-Identifier: MIT */
/*
 * The records that a host and the plug-in share.
 *
 * Every record belongs to the host: the host allocates it, sets it up and frees it. The plug-in
 * reads and writes the fields named here, and lets four arrays grow through hs_Realloc (see
 * host.h): both stacks, the layer frames and the bit ranges. It frees nothing.
 *
 * Bits are numbered from 1 at the first octet of the packet and, within an octet, from the least
 * significant bit up: bit n lies in octet (n - 1) / 8 and has there the value 1 << ((n - 1) % 8).
 * So the most significant four bits of the first octet are the bits 5 to 8. Lengths are in bits
 * where a name says "bits" and in octets where it says "octets".
 *
 * The header compiles alone as C11 and as C++20. With 32-bit pointers each record has the size
 * and each field the offset asserted at the end of this page; with 64-bit pointers it widens with its pointers.
 */
#ifndef NETFLOOR_RECORDS_H
#define NETFLOOR_RECORDS_H

#include <stddef.h>
#include <stdint.h>

#ifdef __cplusplus
extern "C" {
#endif

/* One piece of a field: what was read and from where. */
typedef struct BitRange {
    uint32_t value;        /* the number read; a later octet is the more significant */
    uint32_t firstBit;     /* number of the first bit read */
    uint32_t lastBit;      /* number of the last bit read */
    uint32_t flagWord;     /* 0; rows of octets and addresses in groups leave what was there */
    uint32_t untouched[2]; /* the host's own */
} BitRange;

/*
 * The field read last, complete whenever the plug-in calls the host, and on return.
 *
 * Of `ranges` a host may read the first `rangeCount` elements. They are the same in all passes, word for word, also
 * where a field does not write a word itself and an earlier one of the entry has: flag words, bit numbers of the later
 * groups of an address. Elements past `rangeCount` are left over from earlier fields: in the MD and TO passes from the
 * last one that reached so far, in the MV and XTR passes from any.
 */
typedef struct FieldRecord {
    uint32_t fieldId;          /* id of the field, as in the field table */
    char *fieldName;           /* buffer of at least 255 octets: name of the field, zero-terminated */
    uint32_t value;            /* value of the field, scaled where the field's text says so */
    char *valueText;           /* buffer of at least 255 octets: emptied at each field */
    uint32_t rangeCount;       /* elements of `ranges` that were filled */
    uint32_t outputRangeCount; /* elements of `ranges` that count for the output */
    BitRange *ranges;          /* the pieces of the field, in the order in which they were read */
    uint32_t rangeCapacity;    /* elements that `ranges` has room for; 200 at set-up */
    uint32_t wideStart;        /* address read as groups: 0 */
    uint32_t wideBits;         /* address read as groups: bits read */
    uint32_t untouched1[2];    /* the host's own */
    uint32_t rawFlag;          /* 0 after every field */
    uint32_t untouched2[2];    /* the host's own */
} FieldRecord;

/* A stack of bit numbers. The host gives it with one element, at `base`. */
typedef struct BitStack {
    uint32_t *base;    /* the bottom element */
    uint32_t *top;     /* the current element */
    uint32_t count;    /* elements above the bottom one at the last push */
    uint32_t capacity; /* elements that there is room for, at least 1 */
} BitStack;

/* One layer of the packet. The plug-in of a layer fills it for the plug-in of the next. */
typedef struct LayerFrame {
    uint32_t firstBit;          /* bit number at which the layer starts */
    uint32_t cleared1[10];      /* 0 when the layer is opened; the host's own afterwards */
    uint32_t nextLayerKey;      /* key under which the owner of the next layer is looked up */
    uint32_t nextLayerProtocol; /* IP protocol number that goes with the key, or 0 */
    uint32_t cleared2;          /* 0 when the layer is opened; the host's own afterwards */
} LayerFrame;

/* One layer in the host's list of decoded layers (MD and TO passes). */
typedef struct LayerInfoRecord {
    uint32_t firstBit;    /* number of the layer's first bit */
    uint32_t lastBit;     /* number of its last bit; firstBit - 1 for a layer without bits */
    uint32_t decoderId;   /* the host's word for the plug-in that decoded it */
    uint32_t layerNumber; /* number of the layer */
} LayerInfoRecord;

/* The flags, bits of `flags` in DecodeState. Any of them makes the MV pass set its verdict. */
enum {
    NETFLOOR_FLAG_EXPECTATION = 0x2,            /* a fixed value, a bound or a count was not met */
    NETFLOOR_FLAG_LIMIT_TOO_LONG = 0x8,         /* a length reaches past the bits left (MV) */
    NETFLOOR_FLAG_BITS_LEFT_OVER = 0x10,        /* bits that no field covers inside a length (MV) */
    NETFLOOR_FLAG_NO_LAYER_FRAMES = 0x10000000, /* `layerFrames` could not grow */
    NETFLOOR_FLAG_NO_STACK = 0x20000000,        /* `blockStarts` or `limits` could not grow */
    NETFLOOR_FLAG_NO_RANGES = 0x40000000        /* `ranges` could not grow */
};

/* Named indices of `scratch` in DecodeState. */
enum {
    NETFLOOR_NEXT_LAYER_OCTETS = 1, /* octets of payload after the transport header */
    NETFLOOR_PRECEDING_OCTETS = 3,  /* octets of the IPv4 datagram before that payload */
    NETFLOOR_NEXT_LAYER_PORT = 4    /* port by which the next layer was chosen */
};

/*
 * The working record of one packet. It lives as long as the packet's decoding and is passed
 * from layer to layer and from plug-in to plug-in.
 *
 * Before the first entry of a packet the host gives: `data` with a copy of the packet,
 * `sourceData`, `totalBits`; `bitsLeft` = `totalBits`, `cursor` = 1; `flags`, `condition`,
 * `advance` and `scratch` 0; `blockName` empty; both stacks with their bottom element (1 in
 * `blockStarts`, `totalBits` in `limits`), `top` = `base`; the field record with both text buffers
 * and 200 ranges; `layerHandedOff` = 1, `layerIndex` = 0, room for one frame or more.
 */
typedef struct DecodeState {
    uint8_t *data;             /* working copy of the packet: (totalBits + 7) / 8 octets that the
                                  plug-in may change and restores from `sourceData`; while an entry
                                  runs, the host changes it in hd_PreDecode only */
    const uint8_t *sourceData; /* the packet as the host holds it; only read */
    uint32_t totalBits;        /* length of the packet in bits */
    uint32_t cursor;           /* number of the next bit to be read */
    uint32_t reserved1;        /* never touched */
    uint32_t bitsLeft;         /* bits that the current limit allows from `cursor` on */
    uint32_t flags;            /* NETFLOOR_FLAG_... */
    BitStack blockStarts;      /* for each open block the bit number at which it began */
    BitStack limits;           /* for each open limit its last bit */
    uint8_t condition;         /* the last condition of the grammar, 0 or 1; a word of its own */
    int32_t advance;           /* bits of the current step */
    uint32_t reserved2;        /* never used */
    char *blockName;           /* buffer of at least 64 octets: name of the current block */
    uint32_t scratch[32];      /* NETFLOOR_NEXT_LAYER_OCTETS and its like; the rest is the host's */
    FieldRecord fieldRecord;   /* the field read last */
    LayerFrame *layerFrames;   /* the layers of the packet */
    uint32_t layerHandedOff;   /* 0 while a layer decodes, 1 after its hand-off */
    uint32_t layerIndex;       /* index of the current element of `layerFrames` */
    uint32_t layerCapacity;    /* elements that `layerFrames` has room for, at least 1 */
} DecodeState;

/* One run of the MD, TO or MV pass. */
typedef struct PreDecodeContext {
    uint32_t bitsLeft;          /* out: bits that were not decoded, at the end or at a hand-off */
    uint8_t layerNumber;        /* in, out: number of the layer; each hand-off adds 1 */
    uint32_t decoderId;         /* in, out: the host's word for the decoding plug-in */
    int32_t verdict;            /* out: -52 from the MV pass when a flag is set; else untouched */
    uint8_t *fieldRecords;      /* in: records of 1000 octets each, written by the MD pass */
    uint32_t fieldRecordCount;  /* in: index of the record now being written; the host's to move */
    LayerInfoRecord *layerInfo; /* in: the list of layers (MD, TO) */
    uint32_t layerInfoCount;    /* in, out: index of the open record of `layerInfo` */
    uint32_t layerInfoCapacity; /* in: highest index for which `layerInfo` has room */
    DecodeState *decodeState;   /* in: the packet */
} PreDecodeContext;

/* One run of the XTR pass. */
typedef struct XtrContext {
    uint32_t bitsLeft;        /* out: bits that were not decoded, at the end or at a hand-off */
    uint8_t *keyRecord;       /* in: this packet's record, filled by the offsets of the key table */
    uint16_t byteAreaOffset;  /* in, out: octets from `keyRecord` to the next free place for a value
                                 stored as octets */
    uint16_t byteAreaSize;    /* in: the most octets that one such value may need; an address needs
                                 17. It does not limit all values together, see XTR_netfloor */
    DecodeState *decodeState; /* in: the packet */
} XtrContext;

/*
 * One row of the key-field table. The first three words are the host's to fill in
 * hx_InitialiseOptXTR; the plug-in stores a field's value without asking whether it is wanted.
 */
typedef struct KeyFieldRow {
    uint32_t presenceOffset;  /* octets from the key record to the octet with the row's presence bit */
    uint32_t valueOffset;     /* octets from the key record to the row's value */
    uint32_t presenceMask;    /* the row's presence bit; its low octet is or-ed into that octet */
    const char *protocolName; /* "netfloor" */
    const char *fieldName;    /* name of the field; of several rows of one name the last is filled */
    uint32_t zero[3];         /* 0, not used */
} KeyFieldRow;

#ifdef __cplusplus
#define NETFLOOR_ASSERT(condition, text) static_assert(condition, text)
#else
#define NETFLOOR_ASSERT(condition, text) _Static_assert(condition, text)
#endif
#define NETFLOOR_RECORD_SIZE(record, octets)                                                                           \
    NETFLOOR_ASSERT(sizeof(record) == (octets), "a 32-bit host expects that " #record " has " #octets " octets")
#define NETFLOOR_FIELD_OFFSET(record, field, octets)                                                                   \
    NETFLOOR_ASSERT(offsetof(record, field) == (octets), "a 32-bit host expects " #record "." #field " at " #octets)

#if UINTPTR_MAX == 0xffffffffu
NETFLOOR_RECORD_SIZE(BitRange, 24);
NETFLOOR_FIELD_OFFSET(BitRange, value, 0);
NETFLOOR_FIELD_OFFSET(BitRange, firstBit, 4);
NETFLOOR_FIELD_OFFSET(BitRange, lastBit, 8);
NETFLOOR_FIELD_OFFSET(BitRange, flagWord, 12);
NETFLOOR_FIELD_OFFSET(BitRange, untouched, 16);

NETFLOOR_RECORD_SIZE(FieldRecord, 60);
NETFLOOR_FIELD_OFFSET(FieldRecord, fieldId, 0);
NETFLOOR_FIELD_OFFSET(FieldRecord, fieldName, 4);
NETFLOOR_FIELD_OFFSET(FieldRecord, value, 8);
NETFLOOR_FIELD_OFFSET(FieldRecord, valueText, 12);
NETFLOOR_FIELD_OFFSET(FieldRecord, rangeCount, 16);
NETFLOOR_FIELD_OFFSET(FieldRecord, outputRangeCount, 20);
NETFLOOR_FIELD_OFFSET(FieldRecord, ranges, 24);
NETFLOOR_FIELD_OFFSET(FieldRecord, rangeCapacity, 28);
NETFLOOR_FIELD_OFFSET(FieldRecord, wideStart, 32);
NETFLOOR_FIELD_OFFSET(FieldRecord, wideBits, 36);
NETFLOOR_FIELD_OFFSET(FieldRecord, untouched1, 40);
NETFLOOR_FIELD_OFFSET(FieldRecord, rawFlag, 48);
NETFLOOR_FIELD_OFFSET(FieldRecord, untouched2, 52);

NETFLOOR_RECORD_SIZE(BitStack, 16);
NETFLOOR_FIELD_OFFSET(BitStack, base, 0);
NETFLOOR_FIELD_OFFSET(BitStack, top, 4);
NETFLOOR_FIELD_OFFSET(BitStack, count, 8);
NETFLOOR_FIELD_OFFSET(BitStack, capacity, 12);

NETFLOOR_RECORD_SIZE(LayerFrame, 56);
NETFLOOR_FIELD_OFFSET(LayerFrame, firstBit, 0);
NETFLOOR_FIELD_OFFSET(LayerFrame, cleared1, 4);
NETFLOOR_FIELD_OFFSET(LayerFrame, nextLayerKey, 44);
NETFLOOR_FIELD_OFFSET(LayerFrame, nextLayerProtocol, 48);
NETFLOOR_FIELD_OFFSET(LayerFrame, cleared2, 52);

NETFLOOR_RECORD_SIZE(LayerInfoRecord, 16);
NETFLOOR_FIELD_OFFSET(LayerInfoRecord, firstBit, 0);
NETFLOOR_FIELD_OFFSET(LayerInfoRecord, lastBit, 4);
NETFLOOR_FIELD_OFFSET(LayerInfoRecord, decoderId, 8);
NETFLOOR_FIELD_OFFSET(LayerInfoRecord, layerNumber, 12);

NETFLOOR_RECORD_SIZE(DecodeState, 280);
NETFLOOR_FIELD_OFFSET(DecodeState, data, 0);
NETFLOOR_FIELD_OFFSET(DecodeState, sourceData, 4);
NETFLOOR_FIELD_OFFSET(DecodeState, totalBits, 8);
NETFLOOR_FIELD_OFFSET(DecodeState, cursor, 12);
NETFLOOR_FIELD_OFFSET(DecodeState, reserved1, 16);
NETFLOOR_FIELD_OFFSET(DecodeState, bitsLeft, 20);
NETFLOOR_FIELD_OFFSET(DecodeState, flags, 24);
NETFLOOR_FIELD_OFFSET(DecodeState, blockStarts, 28);
NETFLOOR_FIELD_OFFSET(DecodeState, limits, 44);
NETFLOOR_FIELD_OFFSET(DecodeState, condition, 60);
NETFLOOR_FIELD_OFFSET(DecodeState, advance, 64);
NETFLOOR_FIELD_OFFSET(DecodeState, reserved2, 68);
NETFLOOR_FIELD_OFFSET(DecodeState, blockName, 72);
NETFLOOR_FIELD_OFFSET(DecodeState, scratch, 76);
NETFLOOR_FIELD_OFFSET(DecodeState, fieldRecord, 204);
NETFLOOR_FIELD_OFFSET(DecodeState, layerFrames, 264);
NETFLOOR_FIELD_OFFSET(DecodeState, layerHandedOff, 268);
NETFLOOR_FIELD_OFFSET(DecodeState, layerIndex, 272);
NETFLOOR_FIELD_OFFSET(DecodeState, layerCapacity, 276);

NETFLOOR_RECORD_SIZE(PreDecodeContext, 40);
NETFLOOR_FIELD_OFFSET(PreDecodeContext, bitsLeft, 0);
NETFLOOR_FIELD_OFFSET(PreDecodeContext, layerNumber, 4);
NETFLOOR_FIELD_OFFSET(PreDecodeContext, decoderId, 8);
NETFLOOR_FIELD_OFFSET(PreDecodeContext, verdict, 12);
NETFLOOR_FIELD_OFFSET(PreDecodeContext, fieldRecords, 16);
NETFLOOR_FIELD_OFFSET(PreDecodeContext, fieldRecordCount, 20);
NETFLOOR_FIELD_OFFSET(PreDecodeContext, layerInfo, 24);
NETFLOOR_FIELD_OFFSET(PreDecodeContext, layerInfoCount, 28);
NETFLOOR_FIELD_OFFSET(PreDecodeContext, layerInfoCapacity, 32);
NETFLOOR_FIELD_OFFSET(PreDecodeContext, decodeState, 36);

NETFLOOR_RECORD_SIZE(XtrContext, 16);
NETFLOOR_FIELD_OFFSET(XtrContext, bitsLeft, 0);
NETFLOOR_FIELD_OFFSET(XtrContext, keyRecord, 4);
NETFLOOR_FIELD_OFFSET(XtrContext, byteAreaOffset, 8);
NETFLOOR_FIELD_OFFSET(XtrContext, byteAreaSize, 10);
NETFLOOR_FIELD_OFFSET(XtrContext, decodeState, 12);

NETFLOOR_RECORD_SIZE(KeyFieldRow, 32);
NETFLOOR_FIELD_OFFSET(KeyFieldRow, presenceOffset, 0);
NETFLOOR_FIELD_OFFSET(KeyFieldRow, valueOffset, 4);
NETFLOOR_FIELD_OFFSET(KeyFieldRow, presenceMask, 8);
NETFLOOR_FIELD_OFFSET(KeyFieldRow, protocolName, 12);
NETFLOOR_FIELD_OFFSET(KeyFieldRow, fieldName, 16);
NETFLOOR_FIELD_OFFSET(KeyFieldRow, zero, 20);
#endif

#ifdef __cplusplus
}
#endif

#endif
