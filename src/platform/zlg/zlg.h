#pragma once

/* Stand-in for the closed trace library. Module and label handles are small integers handed out
 * by name (the same name always gives the same handle, from 1). Each trace is one line appended
 * to the trace file: $VX7_TRACE_FILE if set and not empty, else "lineprobe_trace.log" in the
 * working directory. A line reads
 *     2024-05-01 12:00:00.123 Ocelot/Error: the text
 * or, for a message of no module,
 *     2024-05-01 12:00:00.123 -: the text
 * Line breaks inside the text become blanks, so one trace is always one line. */

#include <stdint.h>

#ifdef __cplusplus
extern "C" {
#endif

typedef uint32_t ZLG_HANDLE;

#define ZLG_SUCCESS 0
#define ZLG_ERR_INVALID_ARGUMENT 1 /* null or empty name, null out-pointer or text */
#define ZLG_ERR_TABLE_FULL 2       /* more than ZLG_MAX_NAMES modules or labels */
#define ZLG_ERR_INVALID_HANDLE 3   /* a handle that was never handed out */
#define ZLG_ERR_WRITE_FAILED 4     /* the trace file could not be opened or written */

#define ZLG_MAX_NAMES 256
#define ZLG_TRACE_FILE_ENV "VX7_TRACE_FILE"
#define ZLG_DEFAULT_TRACE_FILE "lineprobe_trace.log"

int ZlgGetModuleHandle(const char* moduleName, ZLG_HANDLE* handle);
int ZlgGetLabelHandle(const char* labelName, ZLG_HANDLE* handle);
int ZlgTraceMessageVarg(const char* format, ...) __attribute__((format(printf, 1, 2)));
int ZlgTraceNoClient(ZLG_HANDLE module, ZLG_HANDLE label, const char* text);

#ifdef __cplusplus
}
#endif
