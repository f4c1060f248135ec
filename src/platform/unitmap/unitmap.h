#pragma once

/* Stand-in for the closed device map library: a tree of AUs (addressable units) built from the
 * farm (platform/farm/ActiveFarm.h), each with named attributes.
 *
 *   host AU           NAME (the farm's system_name)
 *     board AU        CTPLATFORM "VX7", LOGICAL ID, NAME, SERIAL_NUMBER, NUM_TRUNKS
 *       line AU       TYPE 503, ChannelCount, LINEADMINADDR (the line's LCON)     one per trunk
 *       voice group   TYPE 501                      flexible routing only, one per 4 channels
 *         voice AU    TYPE 502, CLUSTERADDR and one address attribute per media resource of
 *                     the board (SIGDETADDR, SIGBUFADDR_DTMF, SIGBUFADDR_MF, TONEGENADDR,
 *                     CALLANALYSISADDR, R2MFPADDR, CALLERIDADDR)                one per channel
 *
 * Texts are NUL-terminated; numbers are 32-bit in host order; addresses are 8-byte TKCompDesc
 * records (platform/farm/Addresses.h). Handles are numbered from 1 in tree order. When the farm
 * cannot be read, the board service is down: every call fails with UM_ERR_SERVICE_DOWN. */

#include <stdint.h>

#ifdef __cplusplus
extern "C" {
#endif

typedef uint32_t UM_AUID;

/* One attribute: five words. `reserved` is neither set nor read by callers nor by this library. */
typedef struct um_attribute {
    const char* name;
    void* value;
    uint32_t status; /* per attribute, set by um_getAttributes: 0 or one of the errors below */
    uint32_t reserved;
    uint32_t size; /* bytes of `value` */
} um_attribute;

#define UM_SUCCESS 0
#define UM_ERR_SERVICE_DOWN 200      /* no farm: the board service is not running */
#define UM_ERR_INVALID_AU 201        /* a handle that names no AU */
#define UM_PARTIAL 202               /* some attributes failed; each record's status tells which */
#define UM_ERR_NO_SUCH_ATTRIBUTE 203 /* the AU has no attribute of that name */
#define UM_ERR_BUFFER_TOO_SMALL 204  /* text with its NUL, number 4, address 8 bytes */
#define UM_ERR_INVALID_ARGUMENT 205  /* null pointer where a record, name or value is needed */

#define UM_TYPE_VOICE_GROUP 501
#define UM_TYPE_VOICE 502
#define UM_TYPE_LINE 503

int um_getHostAU(UM_AUID* hostAU);

/* Finds the AUs below `parent` (at any depth, in tree order) that have every given attribute
 * with the given value. A text matches up to its NUL or `size` bytes; a number compares its
 * first 4 bytes (a larger `size` is allowed); an address its 8 bytes. `*count` comes in as the
 * room in `result` and goes out as the number of handles written: matches beyond the room are
 * left out. No match is success with `*count` 0. */
int um_findAUs(UM_AUID parent, uint32_t numAttributes, um_attribute* attributes, uint32_t* count,
               UM_AUID* result);

/* Fills each record's value and status. UM_SUCCESS when all succeed; UM_PARTIAL when some
 * succeed and some fail; when all fail, the status of the first record. A failed record's
 * value buffer is left untouched. */
int um_getAttributes(UM_AUID au, uint32_t numAttributes, um_attribute* attributes);

int um_initAttributeStruct(um_attribute* attribute, const char* name, void* value, uint32_t size,
                           uint32_t status, uint32_t reserved);

#ifdef __cplusplus
}
#endif
