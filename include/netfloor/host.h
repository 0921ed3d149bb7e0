/* SPDX-License-Identifier: MIT */
/*
 * What the plug-in imports from its host: seven operations in three libraries, libhs_HostServices,
 * libhd_HostDispatch and libhx_KeyOptions. A host provides these libraries under these names.
 */
#ifndef NETFLOOR_HOST_H
#define NETFLOOR_HOST_H

#include <stddef.h>

#include "plugin.h"

#ifdef __cplusplus
extern "C" {
#endif

/* The mode that hd_PreDecode gets: the pass in which the next layer is to be decoded. */
enum { NETFLOOR_MODE_TO = 0, NETFLOOR_MODE_MD = 1, NETFLOOR_MODE_MV = 2 };

/* ---- libhs_HostServices ---- */

/* Storage of `size` octets in the host's heap, or null. */
void *NETFLOOR_CDECL hs_Malloc(size_t size);

/*
 * The block at `old`, which came from this heap, with `size` octets: contents are kept up to the
 * smaller size, and the block may move. Null when there is no storage; `old` is then still valid.
 */
void *NETFLOOR_CDECL hs_Realloc(void *old, size_t size);

/*
 * Called when `layerInfoCount` is greater than `layerInfoCapacity`. On return `layerInfo` has room
 * at index `layerInfoCount`, and `layerInfo` and `layerInfoCapacity` are up to date. The result is
 * not used.
 */
int32_t NETFLOOR_CDECL hs_CreateNewLayerInfo(PreDecodeContext *context);

/*
 * MD: one decoded field. `display` and `fieldName` are valid during the call only; `ranges` points
 * into the field record. `bitOrder` is 8 where the bits of each octet were read reversed, else 0.
 * The host advances `fieldRecordCount`. The result is not used.
 */
int32_t NETFLOOR_CDECL hs_AddDecodedFieldsData(PreDecodeContext *context, uint32_t outputRangeCount,
                                               const BitRange *ranges, const char *display, uint32_t zero1,
                                               const char *fieldName, uint32_t fieldId, uint32_t zero2,
                                               uint32_t bitOrder);

/*
 * TO: the short text of one field. `displayId` is the id of the first field in the field table
 * that has the field's name. `display` is valid during the call only. The result is not used.
 */
int32_t NETFLOOR_CDECL hs_AddFieldsToDisplayData(PreDecodeContext *context, const char *display, uint32_t displayId);

/* ---- libhd_HostDispatch ---- */

/*
 * Decodes the next layer, at `cursor` of the DecodeState, in the pass that `mode` names, with the
 * plug-in that owns `nextLayerKey` and `nextLayerProtocol` of the current LayerFrame. On
 * return, `cursor` and `bitsLeft` are as that plug-in left them. A negative result refuses, and
 * cuts the pass off.
 */
int32_t NETFLOOR_CDECL hd_PreDecode(PreDecodeContext *context, uint32_t mode);

/* ---- libhx_KeyOptions ---- */

/*
 * Sets up the key-field table for the XTR pass: fills presenceOffset, valueOffset and presenceMask
 * of all `rowCount` rows (113). Every row must point to room that may be written. Negative: key
 * fields are refused for good. 0: not ready, the plug-in asks again at the next entry. 1: ready.
 * Above 1: ready, and the plug-in sets the presence bit of the row whose number is stored at
 * `presenceRow` in every record.
 */
int32_t NETFLOOR_CDECL hx_InitialiseOptXTR(KeyFieldRow *table, uint32_t rowCount, uint16_t *presenceRow);

#ifdef __cplusplus
}
#endif

#endif
