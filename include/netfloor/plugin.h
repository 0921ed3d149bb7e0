/* SPDX-License-Identifier: MIT */
/*
 * The exports of the plug-in: four passes over one packet, and a formatter.
 *
 * A host resolves them by name from the loaded library. Each pass decodes one layer of the packet:
 * it starts at `cursor` of the DecodeState and ends at the end of the layer or after a hand-off.
 * All four read the same bits in the same order; they differ in what they report and store.
 *
 * A pass keeps its variables in statics of its own and takes no lock, so it serves one packet at
 * a time; different passes may run side by side, each on its own records. A host may enter the
 * same pass again from inside hd_PreDecode.
 */
#ifndef NETFLOOR_PLUGIN_H
#define NETFLOOR_PLUGIN_H

#include "records.h"

/*
 * The number of this boundary: its records, exports and imports. It rises with each change after which a host and a
 * plug-in that were compiled against different headers no longer fit each other.
 */
#define NETFLOOR_BOUNDARY_ABI 1

/* The calling convention of the boundary: cdecl. Only Windows compilers need the keyword. */
#if defined(_WIN32) && !defined(_WIN64)
#define NETFLOOR_CDECL __cdecl
#else
#define NETFLOOR_CDECL
#endif

#ifdef __cplusplus
extern "C" {
#endif

/*
 * MD: reports each field with its long text, name, id and bit ranges (hs_AddDecodedFieldsData).
 * Returns 1 when the pass ran to its end, also when the packet ended early, and 0 when it was cut
 * off: storage ran out, or hd_PreDecode refused. A pass that is cut off does not close its blocks,
 * and `bitsLeft` of the context stays as it was, or as the last hand-off wrote it; `flags` says
 * which storage it was.
 */
uint8_t NETFLOOR_CDECL vex_PreDecodeMD(PreDecodeContext *context);

/* TO: reports each field's short text (hs_AddFieldsToDisplayData). Returns as vex_PreDecodeMD. */
uint8_t NETFLOOR_CDECL vex_PreDecodeTO(PreDecodeContext *context);

/*
 * MV: reports nothing; sets `verdict` to -52 when a flag is set, by this layer or before it. Only
 * this pass raises the flags 0x8 and 0x10. Returns as vex_PreDecodeMD.
 */
uint8_t NETFLOOR_CDECL vex_PreDecodeMV(PreDecodeContext *context);

/*
 * XTR: stores the values of the key fields into the key record, in the host's byte order. Numbers
 * take 1, 2 or 4 octets by the width of their field. An IPv6 address takes two 16-bit words at
 * the row's place (its length in bits, its place in octets from the record) and 16 octets in the
 * byte area, each with its two nibbles exchanged.
 *
 * The host must provide the room for addresses. `byteAreaSize` is compared with each address alone
 * and never counted down; `byteAreaOffset` grows by 16 with each address and wraps after 65535. One
 * IPv6 packet can take 65296 octets (4081 addresses, most of them in routing headers). A host is safe
 * when 65551 octets from `keyRecord` on may be written, and presence octets and values are after these.
 *
 * Returns 1 at the end of the packet or at a hand-off: then `layerHandedOff` is 1, the blocks are
 * still open, and the host goes on with the owner of the next layer by itself. Returns 0 when cut
 * off: storage ran out, or an address did not fit into `byteAreaSize` (the row's word has its top
 * bit set, and that many octets of the area hold a part of the address, of no use). Returns what hx_InitialiseOptXTR
 * returned when that was negative, at this and each later call.
 */
int32_t NETFLOOR_CDECL XTR_netfloor(XtrContext *context);

/*
 * Appends the time that `value` of the field record gives, in seconds since 1970-01-01 00:00:00
 * UTC, to the zero-terminated `text`, as "2026-01-31 23:59:59", and returns `text`. The buffer
 * needs room for 20 octets more. `ignored` is not read.
 */
char *NETFLOOR_CDECL date_conv(char *text, void *ignored, DecodeState *state);

/* The same as types, for what a host resolves by name. */
typedef uint8_t(NETFLOOR_CDECL *NetfloorPreDecode)(PreDecodeContext *context);
typedef int32_t(NETFLOOR_CDECL *NetfloorExtract)(XtrContext *context);
typedef char *(NETFLOOR_CDECL *NetfloorDateConv)(char *text, void *ignored, DecodeState *state);

#ifdef __cplusplus
}
#endif

#endif
