#include "FieldCallLog.h"

#include <cstdarg>
#include <mutex>

#include "platform/tkhost/tkhost.h"

namespace {
std::mutex logLock;
}

std::vector<FieldCall>& fieldCalls() {
    static std::vector<FieldCall> calls;
    return calls;
}

extern "C" {
TKStatus __real_tkMsgVarFieldPut(TKMsg32Bit* msg, int fieldCount, unsigned int* offset, ...);
TKStatus __real_tkMsgVarFieldGet(TKMsg32Bit* msg, int fieldCount, unsigned int* offset, ...);

#define LOG_AND_FORWARD(isPut, real)                                                     \
    va_list ap;                                                                          \
    va_start(ap, offset);                                                                \
    unsigned int d[4] = {};                                                              \
    void* p[4] = {};                                                                     \
    FieldCall c{isPut, *offset, {}};                                                     \
    for (int i = 0; i < fieldCount && i < 4; ++i) {                                      \
        d[i] = va_arg(ap, unsigned int);                                                 \
        p[i] = va_arg(ap, void*);                                                        \
        c.descs.push_back(d[i]);                                                         \
    }                                                                                    \
    va_end(ap);                                                                          \
    {                                                                                    \
        std::lock_guard<std::mutex> g(logLock);                                          \
        fieldCalls().push_back(c);                                                       \
    }                                                                                    \
    switch (fieldCount) {                                                                \
        case 1:                                                                          \
            return real(msg, 1, offset, d[0], p[0]);                                     \
        case 2:                                                                          \
            return real(msg, 2, offset, d[0], p[0], d[1], p[1]);                         \
        case 3:                                                                          \
            return real(msg, 3, offset, d[0], p[0], d[1], p[1], d[2], p[2]);             \
        case 4:                                                                          \
            return real(msg, 4, offset, d[0], p[0], d[1], p[1], d[2], p[2], d[3], p[3]); \
        default:                                                                         \
            return TK_ERR_PARAM;                                                         \
    }

TKStatus __wrap_tkMsgVarFieldPut(TKMsg32Bit* msg, int fieldCount, unsigned int* offset,
                                 ...){LOG_AND_FORWARD(true, __real_tkMsgVarFieldPut)} TKStatus
    __wrap_tkMsgVarFieldGet(TKMsg32Bit* msg, int fieldCount, unsigned int* offset, ...) {
    LOG_AND_FORWARD(false, __real_tkMsgVarFieldGet)
}
}
