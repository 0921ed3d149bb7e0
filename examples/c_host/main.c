/* SPDX-License-Identifier: MIT */
/* A host in C11, without the C++ library: shows the fields of one packet. docs/hosts.md explains each step. */
#include <dlfcn.h>
#include <stdio.h>
#include <stdlib.h>
#include <string.h>

#include <netfloor/host.h>

/* IPv4 and UDP from 10.0.0.1 to 192.168.0.2, port 53, with 8 octets of payload. */
static uint8_t packet[] = {0x45, 0, 0,    36,   0, 1,  0, 0,  64, 17, 0,   0,   10,  0,   0,   1,   192, 168,
                           0,    2, 0x9c, 0x40, 0, 53, 0, 16, 0,  0,  'p', 'a', 'y', 'l', 'o', 'a', 'd', 's'};

/* The seven operations. The loader takes them from the program before it looks into the libraries. */
void *hs_Malloc(size_t size) {
    return malloc(size);
}

void *hs_Realloc(void *old, size_t size) {
    return realloc(old, size);
}

int32_t hs_CreateNewLayerInfo(PreDecodeContext *context) {
    void *larger = realloc(context->layerInfo, (context->layerInfoCount + 1) * sizeof(LayerInfoRecord));
    if (larger == NULL) {
        abort(); /* the result is not used, so there is no way to say it */
    }
    context->layerInfo = larger;
    context->layerInfoCapacity = context->layerInfoCount;
    return 0;
}

int32_t hs_AddDecodedFieldsData(PreDecodeContext *context, uint32_t rangeCount, const BitRange *ranges,
                                const char *display, uint32_t zero1, const char *name, uint32_t fieldId, uint32_t zero2,
                                uint32_t bitOrder) {
    (void)name, (void)zero1, (void)zero2, (void)bitOrder;
    printf("%s: %s, field %u", context->decodeState->blockName, display, (unsigned)fieldId);
    printf(rangeCount > 0 ? ", from bit %u on\n" : "\n", (unsigned)ranges[0].firstBit);
    return 0; /* fieldRecordCount stays 0: the one field record is used again */
}

int32_t hs_AddFieldsToDisplayData(PreDecodeContext *context, const char *display, uint32_t displayId) {
    (void)context;
    printf("%s, field %u\n", display, (unsigned)displayId);
    return 0;
}

int32_t hd_PreDecode(PreDecodeContext *context, uint32_t mode) {
    DecodeState *state = context->decodeState;
    const LayerFrame *frame = &state->layerFrames[state->layerIndex];
    printf("payload: %u bits under key %u of protocol %u, mode %u\n", (unsigned)state->bitsLeft,
           (unsigned)frame->nextLayerKey, (unsigned)frame->nextLayerProtocol, (unsigned)mode);
    state->cursor += state->bitsLeft; /* this owner takes everything */
    state->bitsLeft = 0;
    return 0;
}

int32_t hx_InitialiseOptXTR(KeyFieldRow *table, uint32_t rowCount, uint16_t *presenceRow) {
    (void)table, (void)rowCount, (void)presenceRow;
    return -1; /* no XTR pass here */
}

int main(void) {
    void *library = dlopen(PLUGIN_PATH, RTLD_NOW);
    const NetfloorPreDecode decode = library ? (NetfloorPreDecode)dlsym(library, "vex_PreDecodeMD") : NULL;
    if (decode == NULL) {
        fprintf(stderr, "%s\n", dlerror());
        return 1;
    }
    uint8_t copy[sizeof packet], fieldRecord[1000];
    char fieldName[255] = "", valueText[255] = "", blockName[64] = "";
    const uint32_t bits = 8 * sizeof packet;
    DecodeState state = {.data = memcpy(copy, packet, sizeof packet), .sourceData = packet, .totalBits = bits};
    state.cursor = state.layerHandedOff = state.layerCapacity = 1;
    state.bitsLeft = bits;
    state.blockName = blockName;
    state.blockStarts = (BitStack){.base = calloc(1, sizeof(uint32_t)), .capacity = 1};
    state.limits = (BitStack){.base = calloc(1, sizeof(uint32_t)), .capacity = 1};
    *(state.blockStarts.top = state.blockStarts.base) = 1;
    *(state.limits.top = state.limits.base) = bits;
    state.layerFrames = calloc(1, sizeof(LayerFrame));
    state.fieldRecord = (FieldRecord){.fieldName = fieldName, .valueText = valueText, .rangeCapacity = 200};
    state.fieldRecord.ranges = calloc(200, sizeof(BitRange));
    PreDecodeContext context = {.layerNumber = 1, .decoderId = 1, .fieldRecords = fieldRecord, .decodeState = &state};
    context.layerInfo = calloc(1, sizeof(LayerInfoRecord));
    return decode(&context) == 1 ? 0 : 1;
}
