// Host message library: message blocks, their header and body fields, and local queues.
// C-callable, so that the code above calls it exactly as it would call the vendor's library.
#pragma once

#include <stdint.h>

#ifdef __cplusplus
extern "C" {
#endif

// Address of a component instance; passed by value as two 32-bit words.
typedef struct TKCompDesc {
    uint16_t instance;
    uint8_t board;
    uint8_t reserved0;
    uint8_t processor;
    uint8_t component;
    uint8_t node;
    uint8_t reserved1;
} TKCompDesc;

// The 24-byte header of a message block; the body bytes follow it directly in the same
// allocation. Multi-byte header fields are in host order. transTag holds the tag byte in its low
// 8 bits and the 24-bit transaction id above it.
typedef struct TKMsg32Bit {
    uint32_t transTag;
    uint32_t type;
    uint16_t srcInstance;
    uint8_t srcBoard;
    uint8_t srcProcessor;
    uint16_t tgtInstance;
    uint8_t tgtBoard;
    uint8_t tgtProcessor;
    uint8_t srcNode;
    uint8_t srcComponent;
    uint8_t tgtNode;
    uint8_t tgtComponent;
    uint32_t size;
} TKMsg32Bit;

#define TK_MSG_HEADER_SIZE 24u
// A whole copy of a block moves size + TK_MSG_COPY_EXTRA bytes; every block is allocated with
// that much room.
#define TK_MSG_COPY_EXTRA 48u
// Bodies larger than this are refused by tkMsgAllocate/tkMsgReallocate as "no memory".
#define TK_MSG_MAX_BODY (16u * 1024u * 1024u)

typedef int TKStatus;
enum {
    TK_OK = 0,
    TK_ERR_PARAM = 1,
    TK_ERR_NO_DESCRIPTORS = 2,  // tkQueueOpen returns it as a handle, tkQueueBind as a status
    TK_ERR_NO_MEMORY = 3,
    TK_ERR_RANGE = 4,   // a body field would end behind the body: nothing was written
    TK_ERR_CLOSED = 5,  // the queue is closed or unbound (also wakes a blocked tkMsgRead)
    TK_ERR_BAD_QUEUE = 6,
    TK_ERR_ALREADY_BOUND = 7
};

// Queue handles are never 2 (TK_ERR_NO_DESCRIPTORS) nor negative.
typedef int TKQueueHandle;

// Header fields for tkMsgFieldGet/Put and the type of the value the void* points at.
typedef enum TKMsgField {
    TK_FIELD_TRANS = 0,  // unsigned int, 24 bits used
    TK_FIELD_TAG = 1,    // unsigned char
    TK_FIELD_TYPE = 2,   // unsigned int
    TK_FIELD_SRC = 3,    // TKCompDesc
    TK_FIELD_TGT = 4,    // TKCompDesc
    TK_FIELD_SIZE = 5    // unsigned int, read only
} TKMsgField;

static inline unsigned char* tkMsgBody(TKMsg32Bit* msg) {
    return (unsigned char*)msg + TK_MSG_HEADER_SIZE;
}

TKStatus tkDrvSetInterface(int iface, int flags);

TKQueueHandle tkQueueOpen(void);
// Assigns the queue a unique host address and fills *desc with it (the value passed in is not
// used). Host addresses are board 0xFF, processor 0, component 0, node 0, instance 1..65535:
// boards are numbered 0..32, so a host address never names a board's component.
TKStatus tkQueueBind(TKQueueHandle queue, TKCompDesc* desc);
TKStatus tkQueueUnbind(TKQueueHandle queue, TKCompDesc desc);
TKStatus tkQueueClose(TKQueueHandle queue);

// Stores a new zeroed block of `size` body bytes in *msg, or null when there is no memory.
TKStatus tkMsgAllocate(unsigned int size, TKMsg32Bit** msg);
// Resizes *msg keeping header and the common body prefix; new bytes are zero. On failure the
// old block stays valid and untouched.
TKStatus tkMsgReallocate(unsigned int size, TKMsg32Bit** msg);
TKStatus tkMsgFree(TKMsg32Bit* msg);

// Blocks until a block arrives for the queue (no polling). Returns TK_ERR_CLOSED at once, or as
// soon as it happens, when the queue is closed or unbound.
TKStatus tkMsgRead(TKQueueHandle queue, int flags, TKMsg32Bit** msg);
// Delivers to the queue bound at the target address (all five fields), else to the attached
// board endpoint, else frees the block and counts it undeliverable. Status 0: the block was
// taken over. Any other status: the block stays with the caller.
TKStatus tkMsgWrite(TKQueueHandle queue, TKMsg32Bit* msg, int flags);

TKStatus tkMsgFieldGet(TKMsg32Bit* msg, TKMsgField field, void* value);
TKStatus tkMsgFieldPut(TKMsg32Bit* msg, TKMsgField field, void* value);

// Body fields: tkMsgVarFieldPut(msg, fieldCount, &offset, desc1, ptr1, desc2, ptr2, ...), each
// desc an unsigned int field descriptor (type code in bits 19-23, count - 1 in bits 11-18) and
// each ptr the address of `count` host values of that type. Fields are packed, multi-byte
// numbers big-endian; codes 0, 4, 10 are 1 byte wide, 1 and 5 are 2 bytes, all others 4.
// A non-zero *offset comes back advanced by the bytes handled; one that goes in as 0 comes back
// as 0. Reading behind the body's end yields zeros; a write that would pass the end is refused
// as a whole (TK_ERR_RANGE, nothing written, offset unchanged).
TKStatus tkMsgVarFieldPut(TKMsg32Bit* msg, int fieldCount, unsigned int* offset, ...);
TKStatus tkMsgVarFieldGet(TKMsg32Bit* msg, int fieldCount, unsigned int* offset, ...);

#ifdef __cplusplus
}
#endif
